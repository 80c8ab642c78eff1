#pragma once

#include <algorithm>
#include <memory>
#include <vector>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/bitmapreader.h"
#include "processes/qrdfilters/sarsim1.h"
#include "tests/support/memorydataset.h"
#include "tests/support/simulationreference.h"

/// Terrains and runs for tests of the radar simulators.
namespace kor::test
{

/// Pixels of 30 m near the central meridian.
inline const ogc::cs::GeocodingInfo kRadarMap(480000.0, 30.0, 5000000.0, -30.0);

/// A DEM of one channel; oElevation gives the sample at column x and row y.
template <class T, class Elevation>
MemoryDataset DemOf(std::uint32_t nWidth, std::uint32_t nHeight, const Elevation& oElevation)
{
    MemoryDataset oDem(nWidth, nHeight, {typedispatch::RealDataType<T>()});
    oDem.SetGeocodingInfo(kRadarMap);
    for (std::uint32_t y = 0; y < nHeight; ++y)
    {
        for (std::uint32_t x = 0; x < nWidth; ++x)
        {
            oDem.Sample<T>(1, x, y) = static_cast<T>(oElevation(x, y));
        }
    }
    return oDem;
}

inline SimulationInput InputFor(MemoryDataset& oDem)
{
    SimulationInput oInput;
    oInput.Dbiw = {0, 0, static_cast<int>(oDem.GetWidth()), static_cast<int>(oDem.GetHeight())};
    oInput.moMap = oDem.GetGeocodingInfo();
    oInput.mnDemWidth = oDem.GetWidth();
    return oInput;
}

inline filters::SarSim1 SimulatorOf(const SimulationInput& oInput)
{
    filters::SarSim1 oSimulator({1}, oInput.Dbiw, oInput.Escale, oInput.Backelev, oInput.Outputxsz,
                                oInput.Alti, oInput.Head, oInput.Minlook, oInput.NRPoint,
                                oInput.Oversamp);
    oSimulator.SetFlip(oInput.Flip);
    return oSimulator;
}

/// Channels and bitmaps in memory; a bitmap's bits are bytes.
class RadarDataset : public MemoryDataset, public datasources::IBitmapDataset
{
public:
    unsigned int GetBitmapWidth() const override { return GetWidth(); }
    unsigned int GetBitmapHeight() const override { return GetHeight(); }
    unsigned int GetBitmapCount() const override
    {
        return static_cast<unsigned int>(mvoBitmaps.size());
    }
    unsigned int CreateBitmap(unsigned int nWidth, unsigned int nHeight) override
    {
        mvoBitmaps.emplace_back(nWidth, nHeight, std::vector<tessel::DataType>{tessel::eDT_BIT});
        return GetBitmapCount();
    }
    datasources::AuxiliaryData GetBitmapAuxiliaryData(unsigned int nBitmap) const override
    {
        return mvoBitmaps.at(nBitmap - 1).GetAuxiliaryData();
    }
    void SetBitmapAuxiliaryData(const datasources::AuxiliaryData& oData,
                                unsigned int nBitmap) override
    {
        mvoBitmaps.at(nBitmap - 1).SetAuxiliaryData(oData);
    }
    std::unique_ptr<datasources::IChannelIO> OpenBitmap(unsigned int nBitmap, bool bWrite) override
    {
        return mvoBitmaps.at(nBitmap - 1).OpenChannels(bWrite);
    }

    std::vector<MemoryDataset> mvoBitmaps;
};

inline std::vector<unsigned char> ReadBitmap(datasources::IBitmapDataset& oDataset,
                                             unsigned int nBitmap)
{
    datasources::BitmapReader oReader(&oDataset, nBitmap);
    const auto poRaster = BlankRaster(oReader.GetWidth(), oReader.GetHeight(), 1, tessel::eDT_8U);
    oReader.ReadRaster(poRaster.get());
    return ImageOf<unsigned char>(*poRaster).Samples();
}

/// What a simulator writes into an empty dataset that holds channels and bitmaps.
template <class Dataset>
RadarReference OutputOf(const filters::SarSim1& oSimulator, Dataset& oDataset)
{
    oSimulator.Output(static_cast<datasources::IDataset*>(&oDataset));
    RadarReference oResult;
    oResult.mnSarlin = oSimulator.GetSarlin();
    oResult.mnSarpix = oSimulator.GetSarpix();
    datasources::BasicReader oReader(&oDataset, {1});
    const auto poImage =
        BlankRaster(oReader.GetWidth(), oReader.GetHeight(), 1, oReader.GetDataType());
    oReader.ReadRaster(poImage.get());
    oResult.mvnImage = ImageOf<std::uint16_t>(*poImage).Samples();
    oResult.mvnLayover = ReadBitmap(oDataset, 1);
    oResult.mvnShadow = ReadBitmap(oDataset, 2);
    oResult.mvdfEscale = oSimulator.GetEscale();
    oResult.mvdfNRPoint = oSimulator.GetNRPoint();
    return oResult;
}

inline RadarReference OutputOf(const filters::SarSim1& oSimulator)
{
    RadarDataset oDataset;
    return OutputOf(oSimulator, oDataset);
}

inline RadarReference Simulated(MemoryDataset& oDem, const SimulationInput& oInput)
{
    datasources::BasicReader oReader(&oDem, {1});
    filters::SarSim1 oSimulator = SimulatorOf(oInput);
    oSimulator.Process(oReader);
    return OutputOf(oSimulator);
}

/// The DEM as the 16-bit samples that SarSim1 sees.
template <class T>
std::vector<std::int16_t> ShortsOf(MemoryDataset& oDem)
{
    std::vector<std::int16_t> vnSamples;
    for (std::uint32_t y = 0; y < oDem.GetHeight(); ++y)
    {
        for (std::uint32_t x = 0; x < oDem.GetWidth(); ++x)
        {
            vnSamples.push_back(filters::ConvertSample<T, std::int16_t>(oDem.Sample<T>(1, x, y)));
        }
    }
    return vnSamples;
}

/// Compares a run of SarSim1 with the plain transcription, bit by bit.
template <class T>
::testing::AssertionResult SameAsReference(MemoryDataset& oDem, const SimulationInput& oInput)
{
    const RadarReference oActual = Simulated(oDem, oInput);
    const RadarReference oExpected = SimulateRadar(oInput, ShortsOf<T>(oDem), sizeof(T) == 1);
    if (oActual.mnSarlin != oExpected.mnSarlin || oActual.mnSarpix != oExpected.mnSarpix)
    {
        return ::testing::AssertionFailure()
               << "the image has " << oActual.mnSarpix << " x " << oActual.mnSarlin
               << " pixels and not " << oExpected.mnSarpix << " x " << oExpected.mnSarlin;
    }
    if (oActual.mvdfEscale != oExpected.mvdfEscale || oActual.mvdfNRPoint != oExpected.mvdfNRPoint)
    {
        return ::testing::AssertionFailure() << "Escale or NRPoint differ";
    }
    for (std::size_t i = 0; i < oExpected.mvnImage.size(); ++i)
    {
        if (oActual.mvnImage[i] != oExpected.mvnImage[i] ||
            oActual.mvnLayover[i] != oExpected.mvnLayover[i] ||
            oActual.mvnShadow[i] != oExpected.mvnShadow[i])
        {
            return ::testing::AssertionFailure()
                   << "pixel " << i << " is " << oActual.mvnImage[i] << ", layover "
                   << +oActual.mvnLayover[i] << ", shadow " << +oActual.mvnShadow[i] << " and not "
                   << oExpected.mvnImage[i] << ", " << +oExpected.mvnLayover[i] << ", "
                   << +oExpected.mvnShadow[i];
        }
    }
    return ::testing::AssertionSuccess();
}

}  // namespace kor::test
