#include <gtest/gtest.h>

#include <limits>
#include <map>
#include <string>
#include <vector>

#include "platform/exception/exception.h"
#include "processes/qrdfilters/filterhom.h"
#include "tests/support/blocks.h"
#include "tests/support/exceptions.h"
#include "tests/support/kordskfiles.h"
#include "tests/support/memoryfiles.h"
#include "tests/support/temporarydirectory.h"

namespace kor::filters
{
namespace
{

using namespace kor::test;
using Numbers = std::vector<unsigned int>;

constexpr unsigned int kMean = 0;
constexpr unsigned int kMode = 1;

HOMStatistics Statistics(std::string oFile, unsigned int nMode, float fThreshold = 0,
                         int nDefault = 0)
{
    return HOMStatistics(oFile, {1}, {2}, {}, {nMode}, {fThreshold}, {nDefault});
}

class HomStatistics : public ::testing::Test
{
protected:
    /// A file with the values in channel 1 and the classes in channel 2.
    template <class TValue, class TClass>
    std::string Write(const Image<TValue>& oValues, const Image<TClass>& oClasses)
    {
        const std::string oFile = moFolder.File("scene" + std::to_string(mnFiles++));
        const Kordsk poKordsk = NewKordsk(oFile);
        Append(*poKordsk, *RasterOf(oValues));
        Append(*poKordsk, *RasterOf(oClasses));
        return oFile;
    }
    static void Append(datasources::IRasterDataset& oDataset, const tessel::Raster& oBlock)
    {
        const unsigned int nChannel = oDataset.CreateChannels(oBlock);
        datasources::BasicWriter(&oDataset, {nChannel}).WriteRaster(&oBlock);
    }

    template <class TValue, class TClass>
    std::vector<int> Table(const Image<TValue>& oValues, const Image<TClass>& oClasses,
                           unsigned int nMode, float fThreshold = 0, int nDefault = 0)
    {
        HOMStatistics oStatistics =
            Statistics(Write(oValues, oClasses), nMode, fThreshold, nDefault);
        oStatistics.GetRasterStats();
        return oStatistics.GetMeanMode();
    }

    TemporaryDirectory moFolder;
    int mnFiles = 0;
};

/// A table of zeros but for some entries.
std::vector<int> Entries(std::size_t nSize, const std::map<std::size_t, int>& oEntries)
{
    std::vector<int> vnTable(nSize, 0);
    for (const auto& [nClass, nValue] : oEntries)
    {
        vnTable[nClass] = nValue;
    }
    return vnTable;
}

using U8 = std::uint8_t;

// Class 1: (10 + 11) / 2 = 10.5, plus a half. Class 255: 7. All others have no pixel.
TEST_F(HomStatistics, RoundsTheMeanOfEachClass)
{
    EXPECT_EQ(Table(Image<U8>{{10, 11}, {7, 3}}, Image<U8>{{1, 1}, {255, 0}}, kMean),
              Entries(256, {{0, 3}, {1, 11}, {255, 7}}));
}

// -2.5 + 0.5 and -2.25 + 0.5, cut.
TEST_F(HomStatistics, CutsNegativeMeansTowardZero)
{
    EXPECT_EQ(Table(Image<short>{{-2, -3, -5, -2, -2, 0}}, Image<U8>{{1, 1, 2, 2, 2, 2}}, kMean),
              Entries(256, {{1, -2}, {2, -1}}));
}

TEST_F(HomStatistics, GivesTheNearestIntForMeansThatNoneCanHold)
{
    constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();
    EXPECT_EQ(
        Table(Image<float>{{3e9F, -3e9F, kNaN}}, Image<U8>{{1, 2, 3}}, kMean),
        Entries(256, {{1, std::numeric_limits<int>::max()}, {2, std::numeric_limits<int>::min()}}));
}

// In single precision 2^24 + 1 + 1 stays 2^24.
TEST_F(HomStatistics, SumsInSinglePrecision)
{
    EXPECT_EQ(Table(Image<float>{{16777216, 1, 1}}, Image<U8>{{9, 9, 9}}, kMean),
              Entries(256, {{9, static_cast<int>(16777216.0F / 3.0F + 0.5)}}));
}

TEST_F(HomStatistics, FindsTheModeOfEachClass)
{
    EXPECT_EQ(Table(Image<U8>{{4, 9, 9}, {200, 5, 4}}, Image<U8>{{1, 1, 1}, {2, 1, 1}}, kMode),
              Entries(256, {{1, 4}, {2, 200}}));
}

TEST_F(HomStatistics, TakesTheLowerOfTwoModes)
{
    EXPECT_EQ(Table(Image<U8>{{9, 4, 9, 4}}, Image<U8>{{1, 1, 1, 1}}, kMode),
              Entries(256, {{1, 4}}));
}

// Class 1: 2 of 4; class 2: 2 of 3. A class without a pixel keeps 0.
TEST_F(HomStatistics, GivesTheDefaultToAWeakMode)
{
    const Image<U8> oValues = {{9, 9, 4, 3, 6, 6, 5}};
    const Image<U8> oClasses = {{1, 1, 1, 1, 2, 2, 2}};
    EXPECT_EQ(Table(oValues, oClasses, kMode, 0.6F, -77), Entries(256, {{1, -77}, {2, 6}}));
    EXPECT_EQ(Table(oValues, oClasses, kMode, 0.5F, -77), Entries(256, {{1, 9}, {2, 6}}));
}

TEST_F(HomStatistics, SizesTheTableByTheTypeOfTheClasses)
{
    const Image<short> oValues = {{-5}};
    EXPECT_EQ(Table(oValues, Image<short>{{32766}}, kMean), Entries(32767, {{32766, -4}}));
    EXPECT_EQ(Table(oValues, Image<std::uint16_t>{{65535}}, kMean), Entries(65536, {{65535, -4}}));
    EXPECT_EQ(Table(oValues, Image<float>{{7.9F}}, kMean), Entries(65536, {{7, -4}}));
}

// 16-bit numbers of the other sign are indices from 32768 on, past a table of 32767.
TEST_F(HomStatistics, LeavesClassesOutsideTheTableOut)
{
    EXPECT_EQ(Table(Image<U8>{{1, 1, 6}}, Image<short>{{-1, 32767, 5}}, kMean),
              Entries(32767, {{5, 6}}));
    constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();
    const Image<float> oClasses = {{-1, 65536, kNaN, 1e20F, -0.9F, 65535.9F}};
    EXPECT_EQ(Table(Image<U8>{{1, 1, 1, 1, 2, 3}}, oClasses, kMean),
              Entries(65536, {{0, 2}, {65535, 3}}));
    EXPECT_EQ(Table(Image<U8>{{1, 1, 1, 1, 2, 3}}, oClasses, kMode),
              Entries(65536, {{0, 2}, {65535, 3}}));
}

// A value outside counts in the total: 7 has 1 of 2.
TEST_F(HomStatistics, CountsValuesOutsideTheTableInTheTotal)
{
    EXPECT_EQ(Table(Image<float>{{7, -8}}, Image<float>{{1, 1}}, kMode, 0.6F, 99),
              Entries(65536, {{1, 99}}));
    EXPECT_EQ(Table(Image<short>{{7, -8}}, Image<short>{{1, 1}}, kMode, 0.4F, 99),
              Entries(32767, {{1, 7}}));
}

// Two of three are 300, but a table of 256 classes is searched up to 255.
TEST_F(HomStatistics, SearchesTheModeAmongAsManyValuesAsThereAreClasses)
{
    EXPECT_EQ(Table(Image<std::uint16_t>{{300, 300, 255}}, Image<U8>{{1, 1, 1}}, kMode),
              Entries(256, {{1, 255}}));
    EXPECT_EQ(Table(Image<std::uint16_t>{{300, 300, 255}}, Image<U8>{{1, 1, 1}}, kMode, 0.5F, -1),
              Entries(256, {{1, -1}}));
    // Here there are fewer values than classes.
    EXPECT_EQ(Table(Image<U8>{{255, 255, 3}}, Image<short>{{400, 400, 400}}, kMode),
              Entries(32767, {{400, 255}}));
}

TEST_F(HomStatistics, CountsWideTypesByTheClassesThatOccur)
{
    EXPECT_EQ(Table(Image<std::uint16_t>{{65535, 7, 65535, 1, 1}},
                    Image<std::uint16_t>{{60000, 60000, 60000, 0, 65535}}, kMode),
              Entries(65536, {{0, 1}, {60000, 65535}, {65535, 1}}));
}

// An array of all values for each of these classes would take 16 GiB. Class c has c, c and 7.
TEST_F(HomStatistics, CountsInAllClassesOfAWideTypeAtOnce)
{
    std::vector<std::uint16_t> vnValues(3 * 65536, 7);
    std::vector<std::uint16_t> vnClasses(vnValues.size());
    std::vector<int> vnExpected(65536);
    for (std::size_t i = 0; i < vnClasses.size(); ++i)
    {
        vnClasses[i] = static_cast<std::uint16_t>(i % 65536);
        vnExpected[i % 65536] = vnClasses[i];
    }
    std::copy_n(vnClasses.begin(), 2 * 65536, vnValues.begin());
    const Image<std::uint16_t> oValues(65536, vnValues);
    const Image<std::uint16_t> oClasses(65536, vnClasses);
    EXPECT_EQ(Table(oValues, oClasses, kMode), vnExpected);
}

template <class TValue, class TClass>
constexpr bool kServed = (std::is_same_v<TValue, float> || std::is_same_v<TValue, unsigned short> ||
                          std::is_same_v<TValue, short>)&&(std::is_same_v<TClass, unsigned char> ||
                                                           std::is_same_v<TClass, float> ||
                                                           std::is_same_v<TClass, unsigned short> ||
                                                           std::is_same_v<TClass, short>) ||
                         (std::is_same_v<TValue, unsigned char> &&
                          (std::is_same_v<TClass, unsigned char> || std::is_same_v<TClass, float> ||
                           std::is_same_v<TClass, short>));

// One file with a channel of values and one of classes for each type.
TEST_F(HomStatistics, ServesSomePairsOfTypesAlone)
{
    std::string oFile = moFolder.File("types");
    {
        const Kordsk poKordsk = NewKordsk(oFile);
        ForEachElementType(
            [&]<class T>()
            {
                Append(*poKordsk, *RasterOf(Image<T>{{9}}));
                Append(*poKordsk, *RasterOf(Image<T>{{3}}));
            });
    }
    int nServed = 0;
    unsigned int nValues = 1;
    const auto oTest = [&]<class TValue, class TClass>(unsigned int nClasses)
    {
        const int nExpected = kServed<TValue, TClass> ? 9 : 0;
        for (const unsigned int nMode : {kMean, kMode})
        {
            HOMStatistics oStatistics(oFile, {nValues}, {nClasses}, {}, {nMode}, {0}, {0});
            oStatistics.GetRasterStats();
            EXPECT_EQ(oStatistics.GetMeanMode()[3], nExpected) << nValues << ", " << nClasses;
        }
        nServed += kServed<TValue, TClass> ? 1 : 0;
    };
    ForEachElementType(
        [&]<class TValue>()
        {
            unsigned int nClasses = 2;
            ForEachElementType(
                [&]<class TClass>()
                {
                    oTest.template operator()<TValue, TClass>(nClasses);
                    nClasses += 2;
                });
            nValues += 2;
        });
    EXPECT_EQ(nServed, 15);
}

TEST_F(HomStatistics, AppendsToItsTableWithEachRun)
{
    HOMStatistics oStatistics = Statistics(Write(Image<U8>{{8}}, Image<U8>{{1}}), kMean);
    oStatistics.SetMeanMode({5, 6, 7});
    oStatistics.GetRasterStats();
    EXPECT_EQ(oStatistics.GetMeanMode(), Entries(259, {{0, 5}, {1, 8}, {2, 7}}));
    oStatistics.GetRasterStats();
    EXPECT_EQ(oStatistics.GetMeanMode().size(), 515U);
    const HOMStatistics oCopy = oStatistics;
    EXPECT_EQ(oCopy.GetMeanMode(), oStatistics.GetMeanMode());
}

TEST_F(HomStatistics, ComputesNothingInOtherModesAndTakesZeroFromEmptyVectors)
{
    std::string oFile = Write(Image<U8>{{8, 8}}, Image<U8>{{1, 1}});
    HOMStatistics oOther(oFile, {1}, {2}, {}, {2}, {}, {});
    oOther.GetRasterStats();
    EXPECT_EQ(oOther.GetMeanMode(), Entries(256, {}));
    HOMStatistics oEmpty(oFile, {1}, {2}, {}, {}, {}, {});
    oEmpty.GetRasterStats();
    EXPECT_EQ(oEmpty.GetMeanMode(), Entries(256, {{1, 8}}));
    HOMStatistics oMode(oFile, {1}, {2}, {}, {kMode}, {}, {});
    oMode.GetRasterStats();
    EXPECT_EQ(oMode.GetMeanMode(), Entries(256, {{1, 8}}));
}

TEST_F(HomStatistics, TakesTheFirstOfSeveralChannels)
{
    std::string oFile = Write(Image<U8>{{8, 20}}, Image<U8>{{1, 2}});
    HOMStatistics oStatistics(oFile, {1, 2}, {2, 1}, {}, {kMean}, {}, {});
    oStatistics.GetRasterStats();
    EXPECT_EQ(oStatistics.GetMeanMode(), Entries(256, {{1, 8}, {2, 20}}));
}

TEST_F(HomStatistics, PassesTheErrorsOfTheReaderOn)
{
    EXPECT_THROW(Statistics(moFolder.File("nowhere"), kMean).GetRasterStats(), IOException);
    std::string oFile = Write(Image<U8>{{8}}, Image<U8>{{1}});
    HOMStatistics oMissing(oFile, {1}, {3}, {}, {kMean}, {}, {});
    EXPECT_THROW(oMissing.GetRasterStats(), IOException);
    const std::string oBroken = MemoryFileDriver::Write(
        moFolder,
        []
        {
            auto poDataset = std::make_unique<MemoryDataset>(2, 1, std::vector(2, tessel::eDT_8U));
            poDataset->mbBroken = true;
            return poDataset;
        });
    EXPECT_EQ(MessageOf<IOException>([&] { Statistics(oBroken, kMode).GetRasterStats(); }),
              "memory: broken");
}

// 20 MiB of values in rows of half a MiB: single precision keeps what the order of the rows makes.
TEST_F(HomStatistics, SumsLargeImagesInTheOrderOfTheirRows)
{
    constexpr std::size_t kWidth = 1U << 17;
    Random oRandom(32);
    std::vector<float> vfValues(kWidth * 40);
    std::vector<float> vfSums(2);
    for (std::size_t i = 0; i < vfValues.size(); ++i)
    {
        vfValues[i] = static_cast<float>(oRandom() % 100000) / 7;
        vfSums[i % 2] += vfValues[i];
    }
    std::vector<U8> vnClasses(vfValues.size());
    for (std::size_t i = 1; i < vnClasses.size(); i += 2)
    {
        vnClasses[i] = 1;
    }
    const auto fCount = static_cast<float>(kWidth * 20);
    EXPECT_EQ(Table(Image<float>(kWidth, vfValues), Image<U8>(kWidth, vnClasses), kMean),
              Entries(256, {{0, static_cast<int>(vfSums[0] / fCount + 0.5)},
                            {1, static_cast<int>(vfSums[1] / fCount + 0.5)}}));
}

// The definition, on random classes and values with a few hundred pixels each.
TEST_F(HomStatistics, FollowsTheDefinition)
{
    Random oRandom(31);
    for (const unsigned int nMode : {kMean, kMode})
    {
        Image<float> oValues(60, std::vector<float>(60 * 40));
        std::vector<float> vfValues(60 * 40);
        std::vector<short> vnClasses(60 * 40);
        std::vector<float> vfSums(9);
        std::vector<unsigned int> vnCounts(9);
        std::vector<std::map<int, unsigned int>> voHistograms(9);
        for (std::size_t i = 0; i < vfValues.size(); ++i)
        {
            const float f = static_cast<float>(oRandom() % 4000) / 64;
            const auto nClass = static_cast<std::size_t>(oRandom() % 9);
            vfValues[i] = f;
            vnClasses[i] = static_cast<short>(nClass);
            vfSums[nClass] += f;
            vnCounts[nClass] += 1;
            voHistograms[nClass][static_cast<int>(f)] += 1;
        }
        std::map<std::size_t, int> oExpected;
        for (std::size_t c = 0; c < 9; ++c)
        {
            unsigned int nBest = 0;
            int nValue = 0;
            for (const auto& [nCandidate, nCount] : voHistograms[c])
            {
                nValue = nCount > nBest ? nCandidate : nValue;
                nBest = std::max(nBest, nCount);
            }
            const float fMean = vfSums[c] / static_cast<float>(vnCounts[c]);
            const bool bWeak = 0.03F > static_cast<float>(nBest) / static_cast<float>(vnCounts[c]);
            oExpected[c] = nMode == kMean ? static_cast<int>(fMean + 0.5) : bWeak ? 999 : nValue;
        }
        EXPECT_EQ(Table(Image<float>(60, vfValues), Image<short>(60, vnClasses), nMode, 0.03F, 999),
                  Entries(32767, oExpected));
    }
}

}  // namespace
}  // namespace kor::filters
