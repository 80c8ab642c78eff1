#pragma once

#include <cstdint>
#include <vector>

#include "platform/geocoding/geocodinginfo.h"
#include "processes/qrdfilters/sampleconversion.h"

/// The radar simulations written down plainly a second time: one loop in the other, every formula
/// where it is needed, nothing kept between sub-samples.
namespace kor::test
{

/// What both simulations are given. Lists as the simulators take them; those of one of them alone
/// are left out by the other.
struct SimulationInput
{
    std::vector<int> Dbiw;
    std::vector<double> Escale{1.0, 0.0};
    std::vector<double> Backelev{-9999.0};
    std::vector<double> Outputxsz{30.0, 30.0};
    std::vector<double> Alti{785000.0};
    std::vector<double> Head{13.0};
    std::vector<double> Minlook{20.0};
    std::vector<double> NRPoint;
    std::vector<int> Oversamp{2};
    bool Flip = false;
    ogc::cs::GeocodingInfo moMap;
    std::size_t mnDemWidth = 0;  ///< pixels of the dataset
};

struct RadarReference
{
    int mnSarlin = 0;
    int mnSarpix = 0;
    std::vector<std::uint16_t> mvnImage;    ///< as it is written
    std::vector<unsigned char> mvnLayover;  ///< 0 or 1
    std::vector<unsigned char> mvnShadow;
    std::vector<double> mvdfEscale;
    std::vector<double> mvdfNRPoint;
};

/// SarSim1 over samples that are 16-bit already; bBytes: the channel had 8 bits.
RadarReference SimulateRadar(SimulationInput oInput, const std::vector<std::int16_t>& vnDem,
                             bool bBytes);

/// The same point projection, for parameters as Process leaves them.
struct ReferenceView
{
    double mdfOrbitRadius = 0, mdfNearAngle = 0, mdfNearSlant = 0, mdfChordAngle = 0;
    double mdfPixelX = 0;
    int mnNearCol = 0;
    float mfSideSign = 0, mfWindowLeftX = 0;
};
void ReferenceRange(const ReferenceView& oView, bool bProducts, double dfAlti, double dfHead,
                    double z, double X, double Y, double& dfLook, double& dfRange);

struct MapReference
{
    std::vector<double> mvdfResults;  ///< before they are stored, row after row
    std::vector<unsigned char> mvnLayover;
    std::vector<unsigned char> mvnShadow;
};

/// Sarsim2. oLoad, oFloat and oStore are the conversions of the DEM's type: sample i as double and
/// as float, and an elevation stored and seen as float.
struct DemSamples
{
    std::vector<double> mvdfDouble;
    std::vector<float> mvfFloat;
    float (*mpfnStored)(double);
    bool mbBytes;
};
MapReference SimulateMap(SimulationInput oInput, const DemSamples& oDem);

}  // namespace kor::test
