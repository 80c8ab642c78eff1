// The radar simulations of a DEM of 3000 x 3000 pixels of 16 bits in a KORDSK file, 2 x 2
// sub-samples a cell, beside the plain loops that define them, on one thread. Items are sub-samples
// of pass one.
#include <benchmark/benchmark.h>
#include <unistd.h>

#include <cmath>
#include <filesystem>
#include <memory>
#include <string>
#include <vector>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/basicwriter.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/datasources/irasterdataset.h"
#include "processes/qrdfilters/sarsim1.h"
#include "processes/qrdfilters/sarsim2.h"
#include "tests/support/simulationreference.h"

namespace kor::filters
{
namespace
{

constexpr std::uint32_t kSide = 3000;
constexpr int kOversampling = 2;
constexpr std::int64_t kSubSamples =
    (std::int64_t{kSide - 1} * kOversampling + 1) * (std::int64_t{kSide - 1} * kOversampling + 1);

/// Mountains of some 800 m with slopes up to 30 degrees.
std::vector<std::int16_t> Mountains()
{
    std::vector<std::int16_t> vnSamples;
    vnSamples.reserve(std::size_t{kSide} * kSide);
    for (std::uint32_t y = 0; y < kSide; ++y)
    {
        for (std::uint32_t x = 0; x < kSide; ++x)
        {
            vnSamples.push_back(static_cast<std::int16_t>(
                400.0 + 250.0 * std::sin(0.05 * x + 0.01 * y) + 100.0 * std::sin(0.11 * y) +
                40.0 * std::sin(0.23 * x - 0.17 * y)));
        }
    }
    return vnSamples;
}

/// A file, gone at the end.
class BenchFile
{
public:
    BenchFile(const char* pszName, const tessel::DataType& oType)
        : moFile((std::filesystem::temp_directory_path() /
                  ("sarsim_bench_" + std::to_string(getpid()) + pszName))
                     .string()),
          mpoDataset(datasources::DatasetManager::GetInstance()->NewDataset(moFile, "KORDSK", ""))
    {
        mpoDataset->SetGeocodingInfo({480000.0, 30.0, 5000000.0, -30.0});
        Rasters().CreateChannels({kSide, kSide, 1, oType});
    }
    BenchFile(const BenchFile&) = delete;
    BenchFile& operator=(const BenchFile&) = delete;
    ~BenchFile()
    {
        mpoDataset.reset();
        std::filesystem::remove(moFile);
    }

    datasources::IRasterDataset& Rasters()
    {
        return dynamic_cast<datasources::IRasterDataset&>(*mpoDataset);
    }

private:
    std::string moFile;
    std::unique_ptr<datasources::IDataset> mpoDataset;
};

/// The DEM.
class DemFile : public BenchFile
{
public:
    DemFile() : BenchFile("dem", tessel::eDT_16S), mvnSamples(Mountains())
    {
        const tessel::Raster oRaster({kSide, kSide, 1, tessel::eDT_16S}, {0, 0, 0, 0},
                                     reinterpret_cast<unsigned char*>(mvnSamples.data()), false);
        datasources::BasicWriter oWriter(&Rasters(), {1});
        oWriter.WriteRaster(&oRaster);
    }

    const std::vector<std::int16_t>& GetSamples() const { return mvnSamples; }

private:
    std::vector<std::int16_t> mvnSamples;
};

test::SimulationInput InputFor(const benchmark::State& oState)
{
    test::SimulationInput oInput;
    oInput.Dbiw = {0, 0, kSide, kSide};
    oInput.Oversamp = {kOversampling};
    oInput.Head = {static_cast<double>(oState.range(0))};
    oInput.Minlook = {30.0};
    oInput.moMap = ogc::cs::GeocodingInfo(480000.0, 30.0, 5000000.0, -30.0);
    oInput.mnDemWidth = kSide;
    return oInput;
}

void BM_SarSim1(benchmark::State& oState)
{
    DemFile oDem;
    const test::SimulationInput oInput = InputFor(oState);
    for (auto _ : oState)
    {
        SarSim1 oSimulator({1}, oInput.Dbiw, oInput.Escale, oInput.Backelev, oInput.Outputxsz,
                           oInput.Alti, oInput.Head, oInput.Minlook, oInput.NRPoint,
                           oInput.Oversamp);
        datasources::BasicReader oReader(&oDem.Rasters(), {1});
        oSimulator.Process(oReader);
        benchmark::DoNotOptimize(oSimulator.GetSarpix());
    }
    oState.SetItemsProcessed(oState.iterations() * kSubSamples);
}

void BM_SarSim1Plain(benchmark::State& oState)
{
    const std::vector<std::int16_t> vnDem = Mountains();
    const test::SimulationInput oInput = InputFor(oState);
    for (auto _ : oState)
    {
        benchmark::DoNotOptimize(test::SimulateRadar(oInput, vnDem, false).mvnImage.data());
    }
    oState.SetItemsProcessed(oState.iterations() * kSubSamples);
}

void BM_Sarsim2(benchmark::State& oState)
{
    DemFile oDem;
    BenchFile oImage("image", tessel::eDT_32R);
    BenchFile oLayover("layover", tessel::eDT_8U);
    BenchFile oShadow("shadow", tessel::eDT_8U);
    const test::SimulationInput oInput = InputFor(oState);
    for (auto _ : oState)
    {
        Sarsim2 oSimulator({oInput.Dbiw.begin(), oInput.Dbiw.end()}, oInput.Escale, oInput.Alti,
                           oInput.Head, oInput.Minlook, oInput.NRPoint, oInput.Oversamp, nullptr);
        datasources::BasicReader oReader(&oDem.Rasters(), {1});
        datasources::BasicWriter oImageWriter(&oImage.Rasters(), {1});
        datasources::BasicWriter oLayoverWriter(&oLayover.Rasters(), {1});
        datasources::BasicWriter oShadowWriter(&oShadow.Rasters(), {1});
        oSimulator.Process(&oReader, &oImageWriter, &oLayoverWriter, &oShadowWriter);
    }
    oState.SetItemsProcessed(oState.iterations() * kSubSamples);
}

void BM_Sarsim2Plain(benchmark::State& oState)
{
    test::DemSamples oSamples;
    for (const std::int16_t nSample : Mountains())
    {
        oSamples.mvdfDouble.push_back(nSample);
        oSamples.mvfFloat.push_back(nSample);
    }
    oSamples.mpfnStored = [](double dfElevation) {
        return ConvertSample<std::int16_t, float>(ConvertSample<double, std::int16_t>(dfElevation));
    };
    oSamples.mbBytes = false;
    const test::SimulationInput oInput = InputFor(oState);
    for (auto _ : oState)
    {
        benchmark::DoNotOptimize(test::SimulateMap(oInput, oSamples).mvdfResults.data());
    }
    oState.SetItemsProcessed(oState.iterations() * kSubSamples);
}

// At a heading of 0 the distance across the track depends on the column alone.
void Headings(benchmark::internal::Benchmark* poBenchmark)
{
    poBenchmark->ArgName("heading")->Arg(0)->Arg(13)->Unit(benchmark::kMillisecond)->UseRealTime();
}
BENCHMARK(BM_SarSim1)->Apply(Headings);
BENCHMARK(BM_SarSim1Plain)->Apply(Headings);
BENCHMARK(BM_Sarsim2)->Apply(Headings);
BENCHMARK(BM_Sarsim2Plain)->Apply(Headings);

}  // namespace
}  // namespace kor::filters
