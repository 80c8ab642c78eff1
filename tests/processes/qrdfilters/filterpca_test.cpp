#include "processes/qrdfilters/filterpca.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <limits>
#include <string>
#include <thread>
#include <vector>

#include "platform/exception/exception.h"
#include "processes/qrdfilters/hardened.h"
#include "processes/qrdfilters/sampleconversion.h"
#include "tests/support/blocks.h"
#include "tests/support/conversionreference.h"
#include "tests/support/exceptions.h"

namespace kor::filters
{
namespace
{

using namespace kor::test;
using Floats = std::vector<float>;
using Numbers = std::vector<unsigned int>;

struct Parameters
{
    Floats vfCovMat;
    Floats vfScale;
    Numbers vnEigen;
    Floats vfMidPoint;
    Floats vfMeans;
};

FilterPCA FilterOf(const Parameters& o)
{
    FilterPCA oFilter;
    oFilter.SetCovMat(o.vfCovMat);
    oFilter.SetScale(o.vfScale);
    oFilter.SetEigen(o.vnEigen);
    oFilter.SetMidPoint(o.vfMidPoint);
    oFilter.SetMeans(o.vfMeans);
    return oFilter;
}

template <class TOut, class TIn>
Image<TOut> Transformed(const FilterPCA& oFilter, const Image<TIn>& oImage, std::uint32_t nIn,
                        std::uint32_t nOut, Margins oMargins = {})
{
    const auto poIn = RasterOf(oImage, oMargins, nIn);
    const auto poOut = BlankRaster(poIn->mnWidth, poIn->mnHeight, nOut,
                                   typedispatch::RealDataType<TOut>(), Margins{1, 2});
    oFilter.Process(poIn.get(), nullptr, poOut.get());
    return ImageOf<TOut>(*poOut);
}

// Means 1 and 2; component 2 is (3, 4) and component 1 is (1, -1).
const Parameters kSimple = {{1, -1, 3, 4}, {0.5F, 2}, {2, 1}, {10, 0}, {1, 2}};

// (4, 6) - means = (3, 4): 25 * 0.5 + 10 and (3 - 4) * 2.
TEST(FilterPCA, ProjectsScalesAndShifts)
{
    EXPECT_EQ(Transformed<float>(FilterOf(kSimple), Image<short>{{4, 6, 1, 2}}, 2, 2),
              (Image<float>{{22.5F, -2, 10, 0}}));
}

TEST(FilterPCA, LeavesMarginsOutOnBothSides)
{
    const Image<short> oImage = {{9, 9, 9, 9, 9, 9}, {9, 9, 4, 6, 9, 9}, {9, 9, 9, 9, 9, 9}};
    EXPECT_EQ(Transformed<float>(FilterOf(kSimple), oImage, 2, 2, Margins{1, 1}),
              (Image<float>{{22.5F, -2}}));
    const auto poIn = RasterOf(Image<std::uint8_t>{{4, 6}}, {}, 2);
    const auto poOut = BlankRaster(1, 1, 1, tessel::eDT_8U, Margins{1, 1});
    FilterOf(kSimple).Process(poIn.get(), nullptr, poOut.get());
    for (std::size_t i = 0; i < 9; ++i)
    {
        EXPECT_EQ(poOut->mpBuffer[i], i == 4 ? 23 : 0xA5) << i;
    }
}

TEST(FilterPCA, GivesTheMidpointEverywhereWithScaleZero)
{
    Parameters o = kSimple;
    o.vfScale = {0, 0};
    EXPECT_EQ(Transformed<float>(FilterOf(o), Image<float>{{4, 6, -100, 1e6F}}, 2, 2),
              (Image<float>{{10, 0, 10, 0}}));
}

/// One channel x -> x * 1 + midpoint into samples of type TOut.
template <class TOut>
TOut Stored(float x, float fMidPoint = 0)
{
    return Transformed<TOut>(FilterOf({{1}, {1}, {1}, {fMidPoint}, {0}}), Image<float>{{x}}, 1, 1)
        .Samples()[0];
}

TEST(FilterPCA, RoundsAndClampsIntegers)
{
    EXPECT_EQ(Stored<unsigned char>(254.5F), 255);
    EXPECT_EQ(Stored<unsigned char>(254.49F), 254);
    EXPECT_EQ(Stored<unsigned char>(300, 128), 255);
    EXPECT_EQ(Stored<unsigned char>(-300, 128), 0);
    EXPECT_EQ(Stored<char>(-2.5F), -3);
    EXPECT_EQ(Stored<char>(-200), -128);
    EXPECT_EQ(Stored<char>(2.4F), 2);
    EXPECT_EQ(Stored<short>(40000), 32767);
    EXPECT_EQ(Stored<unsigned short>(70000), 65535);
    EXPECT_EQ(Stored<int>(3e9F), 2147483647);
    EXPECT_EQ(Stored<unsigned int>(5e9F), 4294967295U);
    EXPECT_EQ(Stored<int64>(3.9F), 3);
    EXPECT_EQ(Stored<int64>(-3.9F), 0);
    EXPECT_EQ(Stored<uint64>(-3.9F), 0U);
    EXPECT_EQ(Stored<double>(0.1F), double{0.1F});
}

// In double 2^24 + 1 - 2^24 would be 1.
TEST(FilterPCA, WorksInSinglePrecision)
{
    EXPECT_EQ(Transformed<double>(FilterOf({{1}, {1}, {1}, {0}, {16777216.0F}}),
                                  Image<int>{{16777217}}, 1, 1),
              (Image<double>{{0}}));
    // Added in the order of channels: (1e8 + 1) - 1e8 loses the 1.
    EXPECT_EQ(Transformed<double>(FilterOf({{1, 1, 1, 0, 0, 0, 0, 0, 0}, {1}, {1}, {0}, {0, 0, 0}}),
                                  Image<float>{{1e8F, 1, -1e8F}}, 3, 1),
              (Image<double>{{0}}));
}

TEST(FilterPCA, CountsWhatItsVectorsLackAsZero)
{
    // No scale: the midpoint. No means: nothing is taken off. No midpoint: 0.
    EXPECT_EQ(Transformed<float>(FilterOf({{1, -1, 3, 4}, {0.5F}, {2, 1}, {10}, {}}),
                                 Image<float>{{4, 6}}, 2, 2),
              (Image<float>{{28, 0}}));
    // Components outside the matrix, and numbers that are not there at all.
    EXPECT_EQ(Transformed<float>(FilterOf({{1, -1, 3}, {1, 1, 1, 1}, {2, 3, 0}, {5, 6, 7, 8}, {}}),
                                 Image<float>{{4, 6}}, 2, 4),
              (Image<float>{{17, 6, 7, 8}}));
    EXPECT_EQ(Transformed<float>(FilterPCA(), Image<float>{{4, 6}}, 2, 3),
              (Image<float>{{0, 0, 0}}));
}

TEST(FilterPCA, DoesNotLookAtTheMask)
{
    const auto poIn = RasterOf(Image<std::uint8_t>{{4, 6, 4, 6}}, {}, 2);
    const auto poOut = BlankRaster(2, 1, 1, tessel::eDT_32R);
    const auto poMask = MaskOf({{0, 1}});
    FilterOf(kSimple).Process(poIn.get(), poMask.get(), poOut.get());
    EXPECT_EQ(ImageOf<float>(*poOut), (Image<float>{{22.5F, 22.5F}}));
}

TEST(FilterPCA, KeepsTheParametersOfItsFirstBlock)
{
    FilterPCA oFilter = FilterOf({{1}, {1}, {1}, {0}, {0}});
    const Image<float> oImage = {{7}};
    EXPECT_EQ(Transformed<float>(oFilter, oImage, 1, 1), (Image<float>{{7}}));
    oFilter.SetMidPoint({100});
    EXPECT_EQ(Transformed<float>(oFilter, oImage, 1, 1), (Image<float>{{7}}));
    EXPECT_EQ(Transformed<short>(oFilter, oImage, 1, 1), (Image<short>{{107}}));
    EXPECT_EQ(Transformed<float>(oFilter, oImage, 1, 1), (Image<float>{{107}}));
}

TEST(FilterPCA, StartsWithoutAProcessorInCopies)
{
    FilterPCA oFilter = FilterOf({{1}, {1}, {1}, {0}, {0}});
    const Image<float> oImage = {{7}};
    Transformed<float>(oFilter, oImage, 1, 1);
    oFilter.SetMidPoint({100});
    const FilterPCA oCopy(oFilter);
    EXPECT_EQ(Transformed<float>(oCopy, oImage, 1, 1), (Image<float>{{107}}));
    FilterPCA oAssigned = FilterOf({{1}, {1}, {1}, {0}, {0}});
    Transformed<float>(oAssigned, oImage, 1, 1);
    oAssigned = oFilter;
    EXPECT_EQ(Transformed<float>(oAssigned, oImage, 1, 1), (Image<float>{{107}}));
    EXPECT_EQ(Transformed<float>(oFilter, oImage, 1, 1), (Image<float>{{7}}));
}

void ExpectRefused(tessel::Raster* poIn, tessel::Raster* poOut, const std::string& oMessage)
{
    try
    {
        FilterPCA().Process(poIn, nullptr, poOut);
        FAIL() << "threw nothing";
    }
    catch (const Exception& oException)
    {
        EXPECT_EQ(oException.GetMessage(), oMessage);
        EXPECT_EQ(oException.GetFile(), "processes/qrdfilters/filterpca");
        EXPECT_NE(oException.GetFunction().find("kor::filters::FilterPCA::Process("),
                  std::string::npos);
        EXPECT_GT(oException.GetLine(), 0U);
    }
}

TEST(FilterPCA, RefusesRastersThatAreNotThere)
{
    const auto poRaster = BlankRaster(1, 1, 1, tessel::eDT_8U);
    ExpectRefused(nullptr, nullptr, "poRasterIn is invalid pointer");
    ExpectRefused(nullptr, poRaster.get(), "poRasterIn is invalid pointer");
    ExpectRefused(poRaster.get(), nullptr, "poRasterOut is invalid pointer");
}

TEST(FilterPCA, RefusesComplexBlocksAndBits)
{
    const auto poReal = BlankRaster(1, 1, 1, tessel::eDT_8U);
    for (const tessel::DataType& oType : {tessel::eDT_C32R, tessel::eDT_BIT})
    {
        const auto poOther = BlankRaster(1, 1, 1, oType);
        for (const auto& [poIn, poOut] :
             {std::pair{poReal.get(), poOther.get()}, {poOther.get(), poReal.get()}})
        {
            EXPECT_EQ(MessageOf<Exception>([&, poIn = poIn, poOut = poOut]
                                           { FilterPCA().Process(poIn, nullptr, poOut); }),
                      "Invalid type requested.");
        }
    }
    EXPECT_EQ(poReal->mpBuffer[0], 0xA5);
}

TEST(FilterPCA, AcceptsBlocksWithoutPixels)
{
    const auto poNoRows = BlankRaster(4, 0, 1, tessel::eDT_32R, Margins{1, 1});
    const auto poNoColumns = BlankRaster(0, 4, 1, tessel::eDT_32R, Margins{1, 1});
    EXPECT_NO_THROW(FilterPCA().Process(poNoRows.get(), nullptr, poNoRows.get()));
    EXPECT_NO_THROW(FilterPCA().Process(poNoColumns.get(), nullptr, poNoColumns.get()));
}

TEST(FilterPCA, RefusesBlocksOfAnotherSizeInHardenedBuilds)
{
    if constexpr (kHardened)
    {
        const auto poIn = BlankRaster(2, 3, 1, tessel::eDT_8U);
        const auto poOut = BlankRaster(2, 2, 1, tessel::eDT_8U);
        EXPECT_EQ(
            MessageOf<Exception>([&] { FilterPCA().Process(poIn.get(), nullptr, poOut.get()); }),
            "poRasterOut has 2 x 2 pixels, poRasterIn 2 x 3 pixels");
    }
}

// ---- Minima and maxima, common to the process: whatever ran before, they only ever grow.

PCAAlgorithm Algorithm(const Parameters& o)
{
    PCAAlgorithm oAlgorithm;
    oAlgorithm.SetValues(o.vfCovMat, o.vfScale, o.vnEigen, o.vfMidPoint, o.vfMeans);
    return oAlgorithm;
}

TEST(PCAAlgorithm, AppendsExtremesWithEachProcessorAndCountsInThoseAtTheFront)
{
    const auto poIn = RasterOf(Image<float>{{4, 6}}, {}, 2);
    const auto poOut = BlankRaster(1, 1, 2, tessel::eDT_32R);
    const PCAAlgorithm oAlgorithm = Algorithm(kSimple);
    const Floats vfMinBefore = oAlgorithm.GetMinVal();
    const Floats vfMaxBefore = oAlgorithm.GetMaxVal();
    oAlgorithm.ProcessBlock(poIn.get(), poOut.get());
    Floats vfMin = vfMinBefore;
    Floats vfMax = vfMaxBefore;
    vfMin.resize(vfMinBefore.size() + 2, 0.0F);
    vfMax.resize(vfMaxBefore.size() + 2, 0.0F);
    // Unscaled 25 and -1.
    vfMax[0] = std::max(vfMax[0], 25.0F);
    vfMin[1] = std::min(vfMin[1], -1.0F);
    EXPECT_EQ(oAlgorithm.GetMinVal(), vfMin);
    EXPECT_EQ(oAlgorithm.GetMaxVal(), vfMax);
    // The same types again: nothing is appended.
    oAlgorithm.ProcessBlock(poIn.get(), poOut.get());
    EXPECT_EQ(oAlgorithm.GetMinVal(), vfMin);
    EXPECT_EQ(oAlgorithm.GetMaxVal(), vfMax);
}

/// One channel x, unscaled.
void Show(const PCAAlgorithm& oAlgorithm, float x)
{
    const auto poOut = BlankRaster(1, 1, 1, tessel::eDT_32R);
    oAlgorithm.ProcessBlock(RasterOf(Image<float>{{x}}).get(), poOut.get());
}

TEST(PCAAlgorithm, ExtremesStartAtZeroAndGrowOverAllCalls)
{
    const PCAAlgorithm oAlgorithm = Algorithm({{1}, {1}, {1}, {0}, {0}});
    Show(oAlgorithm, 0);
    // Those of a process in which no other test has run.
    const float fMin = oAlgorithm.GetMinVal()[0];
    const float fMax = oAlgorithm.GetMaxVal()[0];
    EXPECT_LE(fMin, 0.0F);
    EXPECT_GE(fMax, 0.0F);
    Show(oAlgorithm, 5e9F);
    EXPECT_EQ(oAlgorithm.GetMinVal()[0], fMin);
    EXPECT_EQ(oAlgorithm.GetMaxVal()[0], std::max(fMax, 5e9F));
    Show(oAlgorithm, -6e9F);
    Show(oAlgorithm, std::numeric_limits<float>::quiet_NaN());
    Show(oAlgorithm, 1);
    EXPECT_EQ(oAlgorithm.GetMinVal()[0], std::min(fMin, -6e9F));
    EXPECT_EQ(oAlgorithm.GetMaxVal()[0], std::max(fMax, 5e9F));
}

// Nothing but samples above 0, and the last entries, which no sample has met.
TEST(PCAAlgorithm, ExtremesOfWhatWasNeverMetAreZero)
{
    const PCAAlgorithm oAlgorithm = Algorithm({{1}, {1}, {1}, {0}, {0}});
    Show(oAlgorithm, 1);
    const auto poIn = RasterOf(Image<float>{{4}});
    const auto poOut = BlankRaster(1, 1, 300, tessel::eDT_8U);
    oAlgorithm.ProcessBlock(poIn.get(), poOut.get());
    EXPECT_GE(oAlgorithm.GetMinVal().size(), 301U);
    EXPECT_EQ(oAlgorithm.GetMinVal().size(), oAlgorithm.GetMaxVal().size());
    EXPECT_EQ(oAlgorithm.GetMinVal().back(), 0.0F);
    EXPECT_EQ(oAlgorithm.GetMaxVal().back(), 0.0F);
}

TEST(PCAAlgorithm, CountsBlocksOfSeveralThreadsExactly)
{
    const Floats vfBefore = PCAAlgorithm().GetMaxVal();
    std::vector<std::thread> voThreads;
    for (int i = 0; i < 4; ++i)
    {
        voThreads.emplace_back(
            [i]
            {
                const PCAAlgorithm oAlgorithm = Algorithm({{1}, {1}, {1}, {0}, {0}});
                for (int k = 0; k < 50; ++k)
                {
                    Show(oAlgorithm, static_cast<float>(1e10 * (1 + i + 4 * k)));
                }
            });
    }
    for (std::thread& oThread : voThreads)
    {
        oThread.join();
    }
    EXPECT_EQ(PCAAlgorithm().GetMaxVal()[0],
              std::max(vfBefore.empty() ? 0.0F : vfBefore[0], 2e12F));
}

TEST(PCAAlgorithm, RefusesBlocksBeforeItsValuesAreSet)
{
    const auto poRaster = BlankRaster(1, 1, 1, tessel::eDT_8U);
    try
    {
        PCAAlgorithm().ProcessBlock(poRaster.get(), poRaster.get());
        FAIL() << "threw nothing";
    }
    catch (const Exception& oException)
    {
        EXPECT_EQ(oException.GetMessage(), "You have to Set the values before calling Process.");
        EXPECT_EQ(oException.GetFile(), "processes/qrdfilters/filterpca");
        EXPECT_NE(oException.GetFunction().find("PCAAlgorithm::ProcessBlock("), std::string::npos);
    }
}

TEST(PCAAlgorithm, TakesNewValuesAndKeepsThoseOfCopies)
{
    PCAAlgorithm oAlgorithm = Algorithm({{1}, {1}, {1}, {0}, {0}});
    const PCAAlgorithm oCopy = oAlgorithm;
    oAlgorithm.SetValues({1}, {1}, {1}, {100}, {0});
    const auto poIn = RasterOf(Image<float>{{7}});
    const auto poOut = BlankRaster(1, 1, 1, tessel::eDT_32R);
    oAlgorithm.ProcessBlock(poIn.get(), poOut.get());
    EXPECT_EQ(ImageOf<float>(*poOut), (Image<float>{{107}}));
    oCopy.ProcessBlock(poIn.get(), poOut.get());
    EXPECT_EQ(ImageOf<float>(*poOut), (Image<float>{{7}}));
}

// ---- The definition beside all pairs of types.

template <class TIn, class TOut>
void TransformByDefinition(const Parameters& o, const tessel::Raster& oIn,
                           const tessel::Raster& oOut)
{
    const std::size_t nIn = oIn.mnChannels;
    for (std::int64_t y = 0; y < oIn.mnHeight; ++y)
    {
        for (std::int64_t x = 0; x < oIn.mnWidth; ++x)
        {
            for (std::size_t k = 0; k < oOut.mnChannels; ++k)
            {
                float v = 0;
                for (std::size_t c = 0; c < nIn; ++c)
                {
                    const auto fSample = ReferenceSample<TIn, float>(oIn.GetPixelAs<TIn>(x, y)[c]);
                    v = v + (fSample - o.vfMeans[c]) * o.vfCovMat[(o.vnEigen[k] - 1) * nIn + c];
                }
                v = v * o.vfScale[k] + o.vfMidPoint[k];
                oOut.GetPixelAs<TOut>(x, y)[k] = ReferenceSample<float, TOut>(v);
            }
        }
    }
}

Parameters RandomParameters(std::size_t nIn, std::size_t nOut, Random& oRandom)
{
    Parameters o;
    const auto oFill = [&](Floats& vf, std::size_t nCount)
    {
        for (std::size_t i = 0; i < nCount; ++i)
        {
            vf.push_back(RandomSample<float>(Samples::Ordinary, oRandom) / 100);
        }
    };
    oFill(o.vfCovMat, nIn * nIn);
    oFill(o.vfScale, nOut);
    oFill(o.vfMidPoint, nOut);
    oFill(o.vfMeans, nIn);
    for (std::size_t k = 0; k < nOut; ++k)
    {
        o.vnEigen.push_back(static_cast<unsigned int>(1 + oRandom() % nIn));
    }
    return o;
}

template <class TIn, class TOut>
void CompareWithDefinition(std::uint32_t nWidth, std::uint32_t nIn, std::uint32_t nOut,
                           Random& oRandom)
{
    const Parameters o = RandomParameters(nIn, nOut, oRandom);
    const auto poIn = RandomRaster(nWidth, 3, nIn, typedispatch::RealDataType<TIn>(), Margins{1, 2},
                                   Samples::Special, oRandom);
    const auto poActual =
        BlankRaster(nWidth, 3, nOut, typedispatch::RealDataType<TOut>(), Margins{2, 1});
    const auto poExpected =
        BlankRaster(nWidth, 3, nOut, typedispatch::RealDataType<TOut>(), Margins{2, 1});
    FilterOf(o).Process(poIn.get(), nullptr, poActual.get());
    TransformByDefinition<TIn, TOut>(o, *poIn, *poExpected);
    ASSERT_TRUE(SameBits(*poActual, *poExpected)) << nIn << " to " << nOut << " channels";
}

TEST(FilterPCA, FollowsTheDefinitionForAllPairsOfTypes)
{
    Random oRandom(21);
    ForEachElementType(
        [&]<class TIn>()
        {
            ForEachElementType(
                [&]<class TOut>()
                {
                    CompareWithDefinition<TIn, TOut>(13, 6, 4, oRandom);
                    CompareWithDefinition<TIn, TOut>(1, 3, 11, oRandom);
                });
        });
}

// Rows longer than the buffers, one channel, and more outputs than a vector has.
TEST(FilterPCA, FollowsTheDefinitionForAllShapes)
{
    Random oRandom(22);
    CompareWithDefinition<float, float>(5000, 1, 1, oRandom);
    CompareWithDefinition<unsigned short, unsigned char>(1500, 7, 5, oRandom);
    CompareWithDefinition<unsigned char, double>(301, 20, 17, oRandom);
    CompareWithDefinition<double, float>(9, 70, 70, oRandom);
}

}  // namespace
}  // namespace kor::filters
