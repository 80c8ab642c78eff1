#pragma once

#include "processes/qrdfilters/mosaic/clipdistance.h"
#include "processes/qrdfilters/mosaic/samplelist.h"

namespace kor::filters
{

/// What was gathered for the colour balance: samples of the overlap, as many of the input as of the
/// output, and the range of the input inside the valid area.
struct Gathered
{
    std::unique_ptr<ISampleList> mpoIn;
    std::unique_ptr<ISampleList> mpoOut;
    SampleRange moInside;
};

/// Which samples of the overlap are gathered.
struct GatherRules
{
    int mnSampleBand;  ///< greatest distance from the valid area, in pixels
    double mdfInputNoData;
    double mdfOutputNoData;
};

/// Adds what two blocks of one size have, of the types of the lists in oGathered, in the order of
/// the rows whatever the number of threads.
void GatherBlock(const tessel::Raster& oIn, const tessel::Raster& oOut,
                 const ClipDistance& oDistance, const GatherRules& oRules, Gathered& oGathered);

}  // namespace kor::filters
