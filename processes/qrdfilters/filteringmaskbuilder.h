#pragma once

#include <vector>

#include "basic/tessel/mask/imaskbuilder.h"
#include "platform/datasources/irasterreader.h"

namespace kor::filters
{

/// Masks pixels by place, by bitmap and by value. A pixel is masked when
///   it lies outside a processing window, or a separate bitmap is 0 there,
///   a sample of it lies in the background range, both ends included, or
///   a sample of it equals the fail value, to within 2^-23.
/// One channel is enough. Each test is off where its vector is empty or its reader null.
///
/// Input    a block of eDT_8U, eDT_16U, eDT_16S, eDT_32R or eDT_64R; samples are compared as float,
///          those of eDT_64R as double.
/// Output   a mask of the block's geometry, margins included; the caller deletes it.
/// Corners  not a number fires no test: see ValidMaskBuilder for data with missing samples.
/// Errors   kor::ParameterException for other sample types, also where all tests are off; what the
///          reader throws.
/// Threads  with a reader, one thread at a time; otherwise any number.
class FilteringMaskBuilder : public tessel::IMaskBuilder
{
public:
    /// oWindow: x, y, width and height in image pixels; without exactly four entries it is off.
    /// oBackground: low and high end; one entry alone is a range from it to itself. oFailValues:
    /// only the first entry counts.
    FilteringMaskBuilder(const std::vector<int>& oWindow, const std::vector<float>& oBackground,
                         const std::vector<float>& oFailValues);
    FilteringMaskBuilder(const std::vector<float>& oBackground,
                         const std::vector<float>& oFailValues);
    /// poMaskReader reads the bitmap, not 0 being valid, and is borrowed. Its margins and edge mode
    /// are set for each block: outside the image the bitmap's edge pixels count.
    FilteringMaskBuilder(datasources::IRasterReader* poMaskReader,
                         const std::vector<float>& oBackground,
                         const std::vector<float>& oFailValues);

    tessel::Mask* BuildMask(const tessel::Raster& oRaster) const override;

private:
    void ApplyWindowMask(tessel::Raster& oMask) const;
    void ApplyBackgroundAndFail(const tessel::Raster& oRaster, tessel::Raster& oMask) const;
    template <class TSample>
    void ApplyToSamples(const tessel::Raster& oRaster, tessel::Raster& oMask) const;

    std::vector<int> moWindow;
    std::vector<float> moBackground;
    std::vector<float> moFailValues;
    datasources::IRasterReader* mpoMaskReader = nullptr;
};

}  // namespace kor::filters
