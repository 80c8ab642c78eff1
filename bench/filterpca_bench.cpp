#include "processes/qrdfilters/filterpca.h"

#include <benchmark/benchmark.h>

#include <algorithm>
#include <memory>
#include <numeric>
#include <random>
#include <vector>

#include "bench/support.h"
#include "processes/qrdfilters/sampleconversion.h"
#include "processes/qrdfilters/statistics/eigensystem.h"

namespace kor::bench
{
namespace
{

/// Sums of samples and products of one block of speckle; items are pixels.
template <class T>
void BM_Covariance(benchmark::State& oState)
{
    const auto nChannels = static_cast<std::uint32_t>(oState.range(0));
    const auto poIn = SpeckleRaster<T>(kBlock, Margins{0, 0}, kSeed, nChannels);
    const std::unique_ptr<filters::PCAStatistics::IStatsProcessor> poProcessor(
        filters::PCAStatistics::MakeStatsProcessor(poIn->moDataType));
    std::vector<double> vdfSums(nChannels);
    std::vector<double> vdfProducts(std::size_t{nChannels} * (nChannels + 1) / 2);
    long nCount = 0;
    for (auto _ : oState)
    {
        poProcessor->Process(poIn.get(), nullptr, vdfSums, vdfProducts, nCount);
    }
    oState.SetItemsProcessed(oState.iterations() * kBlock.Pixels());
}

/// The definition pixel by pixel.
template <class T>
void BM_CovariancePlain(benchmark::State& oState)
{
    const auto nChannels = static_cast<std::size_t>(oState.range(0));
    const auto poIn =
        SpeckleRaster<T>(kBlock, Margins{0, 0}, kSeed, static_cast<std::uint32_t>(nChannels));
    std::vector<double> vdfSums(nChannels);
    std::vector<double> vdfProducts(nChannels * (nChannels + 1) / 2);
    std::vector<double> vdfPixel(nChannels);
    for (auto _ : oState)
    {
        const T* pSample = reinterpret_cast<const T*>(poIn->mpBuffer);
        for (std::int64_t i = 0; i < kBlock.Pixels(); ++i, pSample += nChannels)
        {
            for (std::size_t c = 0; c < nChannels; ++c)
            {
                vdfPixel[c] = static_cast<double>(pSample[c]);
                vdfSums[c] += vdfPixel[c];
            }
            double* pProduct = vdfProducts.data();
            for (std::size_t c = 0; c < nChannels; ++c)
            {
                for (std::size_t d = c; d < nChannels; ++d)
                {
                    *pProduct++ += vdfPixel[c] * vdfPixel[d];
                }
            }
        }
        benchmark::DoNotOptimize(vdfProducts.data());
        benchmark::ClobberMemory();
    }
    oState.SetItemsProcessed(oState.iterations() * kBlock.Pixels());
}

struct Parameters
{
    explicit Parameters(std::size_t nChannels, std::size_t nOutputs)
        : vfMatrix(nChannels * nChannels),
          vfMeans(nChannels, 40.0F),
          vfScale(nOutputs, 0.5F),
          vfMidPoint(nOutputs, 127.5F)
    {
        for (std::size_t i = 0; i < vfMatrix.size(); ++i)
        {
            vfMatrix[i] = static_cast<float>(i % 7) / 8 - 0.375F;
        }
        for (std::size_t k = 0; k < nOutputs; ++k)
        {
            vnEigen.push_back(static_cast<unsigned int>(k + 1));
        }
    }

    std::vector<float> vfMatrix, vfMeans, vfScale, vfMidPoint;
    std::vector<unsigned int> vnEigen;
};

/// One block of speckle, channels to outputs; items are pixels.
template <class TIn, class TOut>
void BM_FilterPCA(benchmark::State& oState)
{
    const auto nChannels = static_cast<std::uint32_t>(oState.range(0));
    const auto nOutputs = static_cast<std::uint32_t>(oState.range(1));
    const Parameters o(nChannels, nOutputs);
    filters::FilterPCA oFilter;
    oFilter.SetCovMat(o.vfMatrix);
    oFilter.SetMeans(o.vfMeans);
    oFilter.SetScale(o.vfScale);
    oFilter.SetMidPoint(o.vfMidPoint);
    oFilter.SetEigen(o.vnEigen);
    const auto poIn = SpeckleRaster<TIn>(kBlock, Margins{0, 0}, kSeed, nChannels);
    const auto poOut = MakeRaster<TOut>(kBlock, Margins{0, 0}, nOutputs);
    for (auto _ : oState)
    {
        oFilter.Process(poIn.get(), nullptr, poOut.get());
    }
    oState.SetItemsProcessed(oState.iterations() * kBlock.Pixels());
}

/// The definition pixel by pixel, with the extremes.
template <class TIn, class TOut>
void BM_FilterPCAPlain(benchmark::State& oState)
{
    const auto nChannels = static_cast<std::size_t>(oState.range(0));
    const auto nOutputs = static_cast<std::size_t>(oState.range(1));
    const Parameters o(nChannels, nOutputs);
    const auto poIn =
        SpeckleRaster<TIn>(kBlock, Margins{0, 0}, kSeed, static_cast<std::uint32_t>(nChannels));
    const auto poOut =
        MakeRaster<TOut>(kBlock, Margins{0, 0}, static_cast<std::uint32_t>(nOutputs));
    std::vector<float> vfMin(nOutputs);
    std::vector<float> vfMax(nOutputs);
    for (auto _ : oState)
    {
        const TIn* pIn = reinterpret_cast<const TIn*>(poIn->mpBuffer);
        TOut* pOut = reinterpret_cast<TOut*>(poOut->mpBuffer);
        for (std::int64_t i = 0; i < kBlock.Pixels(); ++i, pIn += nChannels)
        {
            for (std::size_t k = 0; k < nOutputs; ++k)
            {
                float v = 0.0F;
                const float* const pRow = &o.vfMatrix[(o.vnEigen[k] - 1) * nChannels];
                for (std::size_t c = 0; c < nChannels; ++c)
                {
                    v += (static_cast<float>(pIn[c]) - o.vfMeans[c]) * pRow[c];
                }
                vfMin[k] = vfMin[k] > v ? v : vfMin[k];
                vfMax[k] = v > vfMax[k] ? v : vfMax[k];
                *pOut++ = filters::ConvertSample<float, TOut>(v * o.vfScale[k] + o.vfMidPoint[k]);
            }
        }
        benchmark::ClobberMemory();
    }
    oState.SetItemsProcessed(oState.iterations() * kBlock.Pixels());
}

/// Values and vectors of the covariance of random channels; items are matrices.
void BM_Eigensystem(benchmark::State& oState)
{
    const auto nSize = static_cast<std::size_t>(oState.range(0));
    std::mt19937 oRandom(kSeed);
    std::normal_distribution<float> oNormal(0, 30);
    std::vector<float> vfRoot(nSize * nSize);
    std::generate(vfRoot.begin(), vfRoot.end(), [&] { return oNormal(oRandom); });
    std::vector<float> vfCovariance(nSize * nSize);
    for (std::size_t i = 0; i < nSize * nSize; ++i)
    {
        vfCovariance[i] =
            std::inner_product(&vfRoot[i / nSize * nSize], &vfRoot[i / nSize * nSize] + nSize,
                               &vfRoot[i % nSize * nSize], 0.0F);
    }
    std::vector<float> vfMatrix;
    std::vector<float> vfValues(nSize);
    for (auto _ : oState)
    {
        vfMatrix = vfCovariance;
        filters::SolveEigensystem(nSize, vfMatrix, vfValues);
        benchmark::DoNotOptimize(vfValues.data());
    }
    oState.SetItemsProcessed(oState.iterations());
}

BENCHMARK(BM_Eigensystem)->ArgName("channels")->Arg(6)->Arg(16)->Arg(64);
BENCHMARK_TEMPLATE(BM_Covariance, unsigned short)->ArgName("channels")->Arg(3)->Arg(6)->Arg(12);
BENCHMARK_TEMPLATE(BM_CovariancePlain, unsigned short)
    ->ArgName("channels")
    ->Arg(3)
    ->Arg(6)
    ->Arg(12);
BENCHMARK_TEMPLATE(BM_Covariance, float)->ArgName("channels")->Arg(6);
BENCHMARK_TEMPLATE(BM_CovariancePlain, float)->ArgName("channels")->Arg(6);
BENCHMARK_TEMPLATE(BM_Covariance, double)->ArgName("channels")->Arg(6);
BENCHMARK_TEMPLATE(BM_CovariancePlain, double)->ArgName("channels")->Arg(6);
BENCHMARK_TEMPLATE(BM_FilterPCA, unsigned short, unsigned char)
    ->ArgNames({"channels", "outputs"})
    ->Args({6, 3})
    ->Args({6, 6});
BENCHMARK_TEMPLATE(BM_FilterPCAPlain, unsigned short, unsigned char)
    ->ArgNames({"channels", "outputs"})
    ->Args({6, 3})
    ->Args({6, 6});
BENCHMARK_TEMPLATE(BM_FilterPCA, float, float)->ArgNames({"channels", "outputs"})->Args({6, 6});
BENCHMARK_TEMPLATE(BM_FilterPCAPlain, float, float)
    ->ArgNames({"channels", "outputs"})
    ->Args({6, 6});

}  // namespace
}  // namespace kor::bench
