#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <sys/mman.h>
#include <unistd.h>

#include <cstring>
#include <filesystem>
#include <memory>
#include <random>
#include <string>
#include <vector>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/basicwriter.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/datasources/kordsk/kordskdataset.h"

// Blocks of a KORDSK file of 8192 x 8192 samples of eDT_16U a channel, which stays in the page
// cache, beside plain pread and pwrite of the same bytes, and beside copies out of and into a
// mapping. Strips are 8192 x 64 samples, blocks 256 x 256 at random places, rows 8192 x 1 at random
// places. Bytes are those of the samples.
namespace kor::datasources
{
namespace
{

constexpr std::uint32_t kSide = 8192;
constexpr std::size_t kSampleBytes = 2;
constexpr std::size_t kRowBytes = kSide * kSampleBytes;
constexpr int kSeed = 1;

enum Shape : int
{
    eStrips,
    eBlocks,
    eRows
};

/// Places of a shape one after another.
class Places
{
public:
    explicit Places(std::int64_t nShape)
        : mnWidth(nShape == eBlocks ? 256 : kSide),
          mnHeight(nShape == eBlocks ? 256 : (nShape == eStrips ? 64 : 1)),
          mbRandom(nShape != eStrips)
    {
    }

    void Next()
    {
        mnX = static_cast<std::uint32_t>(moRandom() % (kSide - mnWidth + 1));
        mnY = mbRandom ? static_cast<std::uint32_t>(moRandom() % (kSide - mnHeight + 1))
                       : (mnY + mnHeight) % kSide;
    }
    std::size_t Samples() const { return std::size_t{mnWidth} * mnHeight; }

    std::uint32_t mnWidth;
    std::uint32_t mnHeight;
    std::uint32_t mnX = 0;
    std::uint32_t mnY = 0;

private:
    bool mbRandom;
    std::mt19937 moRandom{kSeed};
};

/// A file of kSide x kSide samples, written once and gone at the end.
class BenchFile
{
public:
    BenchFile(const char* pszLayout, unsigned int nChannels)
        : moFile((std::filesystem::temp_directory_path() /
                  ("kordsk_bench_" + std::to_string(getpid())))
                     .string()),
          mpoDataset(dynamic_cast<KordskDataset*>(
              DatasetManager::GetInstance()->NewDataset(moFile, "KORDSK", pszLayout)))
    {
        mpoDataset->CreateChannels({kSide, kSide, nChannels, tessel::eDT_16U});
        for (unsigned int c = 1; c <= nChannels; ++c)
        {
            mvnChannels.push_back(c);
        }
        BasicWriter oWriter(mpoDataset.get(), mvnChannels);
        tessel::Raster oRaster({kSide, 64, nChannels, tessel::eDT_16U}, {});
        std::memset(oRaster.mpBuffer, 0x5A, oRaster.mnBufferSize);
        for (; oRaster.mnOffsetY < kSide; oRaster.mnOffsetY += 64)
        {
            oWriter.WriteRaster(&oRaster);
        }
        oWriter.Flush();
    }
    BenchFile(const BenchFile&) = delete;
    BenchFile& operator=(const BenchFile&) = delete;
    ~BenchFile() { unlink(moFile.c_str()); }

    KordskDataset& Dataset() { return *mpoDataset; }
    const std::vector<unsigned int>& Channels() const { return mvnChannels; }
    const std::string& Name() const { return moFile; }
    std::uint64_t PlaneOffset() const
    {
        return mpoDataset->GetDirectory()->mvoChannels[0].mnOffset;
    }

private:
    std::string moFile;
    std::unique_ptr<KordskDataset> mpoDataset;
    std::vector<unsigned int> mvnChannels;
};

void Count(benchmark::State& oState, const Places& oPlaces, std::size_t nChannels)
{
    oState.SetBytesProcessed(static_cast<std::int64_t>(oState.iterations() * oPlaces.Samples() *
                                                       kSampleBytes * nChannels));
}

void Transfer(benchmark::State& oState, const char* pszLayout, unsigned int nChannels, bool bWrite)
{
    BenchFile oFile(pszLayout, nChannels);
    BasicWriter oWriter(&oFile.Dataset(), oFile.Channels());
    BasicReader oReader(&oFile.Dataset(), oFile.Channels());
    Places oPlaces(oState.range(0));
    tessel::Raster oRaster({oPlaces.mnWidth, oPlaces.mnHeight, nChannels, tessel::eDT_16U}, {});
    std::memset(oRaster.mpBuffer, 1, oRaster.mnBufferSize);
    for (auto _ : oState)
    {
        oPlaces.Next();
        oRaster.mnOffsetX = oPlaces.mnX;
        oRaster.mnOffsetY = oPlaces.mnY;
        if (bWrite)
        {
            oWriter.WriteRaster(&oRaster);
        }
        else
        {
            oReader.ReadRaster(&oRaster);
        }
    }
    Count(oState, oPlaces, nChannels);
}

void BM_KordskBandRead(benchmark::State& oState)
{
    Transfer(oState, "BAND", 1, false);
}
void BM_KordskTileRead(benchmark::State& oState)
{
    Transfer(oState, "TILE", 1, false);
}
void BM_KordskBandReadThreeChannels(benchmark::State& oState)
{
    Transfer(oState, "BAND", 3, false);
}
void BM_KordskBandWrite(benchmark::State& oState)
{
    Transfer(oState, "BAND", 1, true);
}
void BM_KordskTileWrite(benchmark::State& oState)
{
    Transfer(oState, "TILE", 1, true);
}
void BM_KordskBandWriteThreeChannels(benchmark::State& oState)
{
    Transfer(oState, "BAND", 3, true);
}

/// One call for a strip or row, one a row for a block.
template <class Call>
void CallForEachRun(const Places& oPlaces, std::uint64_t nPlane, unsigned char* pMemory,
                    const Call& oCall)
{
    const std::size_t nBytes = oPlaces.mnWidth * kSampleBytes;
    const std::uint64_t nFirst = nPlane + oPlaces.mnY * kRowBytes + oPlaces.mnX * kSampleBytes;
    if (oPlaces.mnWidth == kSide)
    {
        oCall(pMemory, nBytes * oPlaces.mnHeight, nFirst);
        return;
    }
    for (std::uint32_t y = 0; y < oPlaces.mnHeight; ++y)
    {
        oCall(pMemory + y * nBytes, nBytes, nFirst + y * kRowBytes);
    }
}

void BM_PlainPread(benchmark::State& oState)
{
    const BenchFile oFile("BAND", 1);
    const int nFile = open(oFile.Name().c_str(), O_RDONLY);
    Places oPlaces(oState.range(0));
    std::vector<unsigned char> vnMemory(oPlaces.Samples() * kSampleBytes);
    for (auto _ : oState)
    {
        oPlaces.Next();
        CallForEachRun(oPlaces, oFile.PlaneOffset(), vnMemory.data(),
                       [&](unsigned char* pMemory, std::size_t nBytes, std::uint64_t nOffset) {
                           benchmark::DoNotOptimize(
                               pread(nFile, pMemory, nBytes, static_cast<off_t>(nOffset)));
                       });
    }
    close(nFile);
    Count(oState, oPlaces, 1);
}

void BM_PlainPwrite(benchmark::State& oState)
{
    const BenchFile oFile("BAND", 1);
    const int nFile = open(oFile.Name().c_str(), O_RDWR);
    Places oPlaces(oState.range(0));
    std::vector<unsigned char> vnMemory(oPlaces.Samples() * kSampleBytes);
    for (auto _ : oState)
    {
        oPlaces.Next();
        CallForEachRun(oPlaces, oFile.PlaneOffset(), vnMemory.data(),
                       [&](unsigned char* pMemory, std::size_t nBytes, std::uint64_t nOffset) {
                           benchmark::DoNotOptimize(
                               pwrite(nFile, pMemory, nBytes, static_cast<off_t>(nOffset)));
                       });
    }
    close(nFile);
    Count(oState, oPlaces, 1);
}

/// Every page is touched before, which is the best case for a mapping.
void CopyMapped(benchmark::State& oState, bool bWrite)
{
    const BenchFile oFile("BAND", 1);
    const int nFile = open(oFile.Name().c_str(), O_RDWR);
    const std::size_t nFileBytes = std::filesystem::file_size(oFile.Name());
    auto* pMapped = static_cast<unsigned char*>(
        mmap(nullptr, nFileBytes, PROT_READ | PROT_WRITE, MAP_SHARED | MAP_POPULATE, nFile, 0));
    Places oPlaces(oState.range(0));
    std::vector<unsigned char> vnMemory(oPlaces.Samples() * kSampleBytes);
    for (auto _ : oState)
    {
        oPlaces.Next();
        CallForEachRun(oPlaces, oFile.PlaneOffset(), vnMemory.data(),
                       [&](unsigned char* pMemory, std::size_t nBytes, std::uint64_t nOffset)
                       {
                           unsigned char* pInFile = pMapped + nOffset;
                           std::memcpy(bWrite ? pInFile : pMemory, bWrite ? pMemory : pInFile,
                                       nBytes);
                       });
        benchmark::ClobberMemory();
    }
    munmap(pMapped, nFileBytes);
    close(nFile);
    Count(oState, oPlaces, 1);
}

void BM_MappedRead(benchmark::State& oState)
{
    CopyMapped(oState, false);
}
void BM_MappedWrite(benchmark::State& oState)
{
    CopyMapped(oState, true);
}

void Shapes(benchmark::internal::Benchmark* poBenchmark)
{
    poBenchmark->ArgName("shape")->Arg(eStrips)->Arg(eBlocks)->Arg(eRows)->UseRealTime();
}

BENCHMARK(BM_PlainPread)->Apply(Shapes);
BENCHMARK(BM_KordskBandRead)->Apply(Shapes);
BENCHMARK(BM_KordskTileRead)->Apply(Shapes);
BENCHMARK(BM_KordskBandReadThreeChannels)->Apply(Shapes);
BENCHMARK(BM_MappedRead)->Apply(Shapes);
BENCHMARK(BM_PlainPwrite)->Apply(Shapes);
BENCHMARK(BM_KordskBandWrite)->Apply(Shapes);
BENCHMARK(BM_KordskTileWrite)->Apply(Shapes);
BENCHMARK(BM_KordskBandWriteThreeChannels)->Apply(Shapes);
BENCHMARK(BM_MappedWrite)->Apply(Shapes);

}  // namespace
}  // namespace kor::datasources
