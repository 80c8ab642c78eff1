#include <gtest/gtest.h>

#include <cmath>
#include <string>
#include <vector>

#include "platform/ledger/report.h"
#include "processes/qrdfilters/filterpca.h"
#include "tests/support/temporarydirectory.h"

namespace kor::filters
{
namespace
{

using Floats = std::vector<float>;
using Numbers = std::vector<unsigned int>;

/// Collects the report as long as it lives.
class Collected : public ledger::IReportSink
{
public:
    Collected() : mpoFormer(ledger::Report::SetSink(this)) {}
    Collected(const Collected&) = delete;
    Collected& operator=(const Collected&) = delete;
    ~Collected() override { ledger::Report::SetSink(mpoFormer); }

    void AddHeader(const std::string& oTitle, const std::string& oText) override
    {
        moText += "<" + oTitle + "|" + oText + ">";
    }
    void AddInfo(const std::string& oText) override { moText += oText; }
    const std::string& Text() const { return moText; }

private:
    ledger::IReportSink* mpoFormer;
    std::string moText;
};

template <class Make>
Floats Filled(std::size_t nCount, const Make& oMake)
{
    Floats vf(nCount);
    for (std::size_t i = 0; i < nCount; ++i)
    {
        vf[i] = static_cast<float>(oMake(static_cast<double>(i)));
    }
    return vf;
}

Numbers Counted(unsigned int nFirst, unsigned int nCount, int nStep)
{
    Numbers vn;
    for (unsigned int i = 0; i < nCount; ++i)
    {
        vn.push_back(
            static_cast<unsigned int>(static_cast<int>(nFirst) + static_cast<int>(i) * nStep));
    }
    return vn;
}

/// Prints an analysis of nInputs channels for nOutputs ones. All numbers are multiples of 1 / 64.
std::string Printed(const PCAStatistics& oStatistics, const char* pszMode, std::size_t nInputs,
                    std::size_t nOutputs)
{
    const auto n = static_cast<double>(nInputs);
    const auto oRow = [n](double i) { return std::floor(i / n); };
    const auto oColumn = [n](double i) { return std::fmod(i, n); };
    const Collected oCollected;
    oStatistics.GetPCAPrint(
        pszMode,
        Filled(nInputs * nInputs,
               [&](double i) { return (oRow(i) + 1) * (oColumn(i) + 1) * 0.25 - 3; }),
        Filled(nInputs, [](double i) { return 100.125 * (i + 1) - 250; }),
        Filled(nOutputs, [](double i) { return 127.5 + i; }),
        Filled(nOutputs, [](double i) { return std::fmod(i, 3) == 1 ? 0 : 1.5 * i + 0.125; }),
        Filled(nInputs, [](double i) { return 12345.5 * i; }),
        Filled(nInputs * nInputs, [&](double i) { return (oRow(i) - oColumn(i)) / 64; }),
        Filled(nInputs, [](double i) { return i < 6 ? 1000000.5 / std::exp2(i) : 0.015625 * i; }),
        Filled(nInputs, [](double i)
               { return std::fmod(i, 2) == 0 ? 50.5 / std::exp2(std::fmod(i, 6)) : 100; }),
        Filled(nInputs, [](double i) { return 1000.25 - i; }),
        Filled(nOutputs, [](double i) { return 0.015625 * (i + 1); }),
        Filled(nOutputs, [](double i) { return -1234.5 - i; }),
        Filled(nOutputs, [](double i) { return 98765.25 * (i + 1); }));
    return oCollected.Text();
}

std::string Expected(const std::string& oName)
{
    const std::string oText =
        test::BytesOf(std::string(KOR_TESTS_FOLDER) + "/processes/qrdfilters/" + oName);
    EXPECT_FALSE(oText.empty()) << oName;
    return oText;
}

PCAStatistics Statistics(const Numbers& vnInputs, const Numbers& vnOutputs = {},
                         const Numbers& vnEigens = {}, const Numbers& vnWindow = {5, 10, 1200, 7})
{
    std::string oFile = "scene.kordsk";
    return PCAStatistics(oFile, vnWindow, vnInputs, vnOutputs, vnEigens);
}

TEST(PcaReport, IsShortCharacterByCharacter)
{
    EXPECT_EQ(Printed(Statistics({3, 1, 12}), "SHORT", 3, 0), Expected("pcareport_short.txt"));
}

// More than sixteen channels, a bitmap that wins over the window, a signature, and scalings with a
// deviation range and without.
TEST(PcaReport, IsLongCharacterByCharacter)
{
    PCAStatistics oStatistics =
        Statistics(Counted(2, 18, 1), Counted(101, 17, 1), Counted(17, 17, -1));
    oStatistics.SetSegMask(4, 23);
    EXPECT_EQ(Printed(oStatistics, "long", 18, 17), Expected("pcareport_long.txt"));
}

bool Has(const std::string& oText, const std::string& oPart)
{
    return oText.find(oPart) != std::string::npos;
}

// Sixteen numbers fill a line; the seventeenth and the thirty-third start another one.
TEST(PcaReport, StartsALineBeforeEverySixteenthNumberAfterTheFirst)
{
    const std::string oIndent(17, ' ');
    EXPECT_TRUE(Has(Printed(Statistics(Counted(1, 16, 1)), "SHORT", 16, 0), "  15  16\n\n"));
    const std::string oText = Printed(Statistics(Counted(1, 33, 1)), "SHORT", 33, 0);
    EXPECT_TRUE(Has(oText, "  15  16\n" + oIndent + "  17  18"));
    EXPECT_TRUE(Has(oText, "  31  32\n" + oIndent + "  33\n\n"));
    // Lines of outputs and components stand a blank further in.
    EXPECT_TRUE(Has(Printed(Statistics({1}, Counted(1, 17, 1), Counted(2, 17, 1)), "SHORT", 1, 17),
                    "  16\n" + oIndent + "   17\n Eigenchannels  :   2"));
}

TEST(PcaReport, LeavesTheWindowOutBesideASegment)
{
    PCAStatistics oStatistics = Statistics({1});
    oStatistics.SetSegMask(7, 0);
    const std::string oSignature = Printed(oStatistics, "SHORT", 1, 0);
    EXPECT_TRUE(Has(oSignature, "   1\n\n Sampling Signature  :       7\n Sample Size"));
    EXPECT_FALSE(Has(oSignature, "Window"));
    oStatistics.SetSegMask(0, 2);
    const std::string oBitmap = Printed(oStatistics, "SHORT", 1, 0);
    EXPECT_TRUE(Has(oBitmap, "   1\n\n Sampling Bitmap  :       2\n Sample Size"));
    EXPECT_FALSE(Has(oBitmap, "Window"));
    EXPECT_TRUE(Has(Printed(Statistics({1}, {}, {}, {}), "SHORT", 1, 0),
                    "   1\n\n Sample Size      :                0\n\n"));
}

TEST(PcaReport, IsLongByTheFirstFourCharactersOfItsMode)
{
    const PCAStatistics oStatistics = Statistics({1});
    for (const char* pszMode : {"LONG", "lOnG", "longer"})
    {
        EXPECT_TRUE(Has(Printed(oStatistics, pszMode, 1, 0), "Covariance")) << pszMode;
    }
    for (const char* pszMode : {"LON", "", "SHORT", static_cast<const char*>(nullptr)})
    {
        EXPECT_FALSE(Has(Printed(oStatistics, pszMode, 1, 0), "Covariance"));
    }
}

TEST(PcaReport, ReadsZeroBehindTheEndOfAVector)
{
    const Collected oCollected;
    Statistics({1}, {2}, {}).GetPCAPrint("LONG", {}, {}, {}, {}, {}, {}, {}, {}, {}, {}, {}, {});
    EXPECT_TRUE(Has(oCollected.Text(),
                    "     0     2            0           0 all            0           0\n"));
}

std::string Matrix(int nMode, const Floats& vfMatrix, const Numbers& vnColumns,
                   const Numbers& vnRows)
{
    const Collected oCollected;
    Statistics({1}).matprt(nMode, vfMatrix, vnColumns, vnRows);
    return oCollected.Text();
}

TEST(PcaReport, DrawsAMatrixWithLabels)
{
    EXPECT_EQ(Matrix(1, {1, 2.5F, -3, 4}, {8, 9}, {10, 11}),
              "                  8             9\n"
              "   +--------------------------------\n"
              " 10|             1           2.5\n"
              " 11|            -3             4\n"
              "\n\n\n");
}

// Six columns make two pages: the first one holds all, the second one what is left of its lines.
TEST(PcaReport, LeavesLaterPagesOfAMatrixWithoutValues)
{
    EXPECT_EQ(Matrix(0, {1, 2, 3, 4, 5, 6}, {1, 2, 3, 4, 5, 6}, {1}),
              "             1             2             3             4             5             6"
              "\n\n\n\n\n\n\n\n");
    const std::string oLabelled = Matrix(1, {1, 2, 3, 4, 5, 6}, {1, 2, 3, 4, 5, 6}, {1});
    EXPECT_TRUE(oLabelled.ends_with("             6\n\n\n\n     \n   \n\n\n\n\n")) << oLabelled;
}

// Without rows no value is printed, so that no page leaves columns less to the next one.
TEST(PcaReport, RepeatsTheHeadOfAMatrixWithoutRows)
{
    const std::string oHead =
        "                  1             2             3             4             5             "
        "6\n"
        "   +--------------------------------" +
        std::string(64, '-') + "\n\n\n\n";
    EXPECT_EQ(Matrix(1, {}, {1, 2, 3, 4, 5, 6}, {}), oHead + oHead);
}

TEST(PcaReport, PrintsNoMatrixInOtherModes)
{
    EXPECT_EQ(Matrix(2, {1}, {1}, {1}), "");
    EXPECT_EQ(Matrix(-1, {1}, {1}, {1}), "");
    EXPECT_EQ(Matrix(0, {}, {}, {}), "\n\n\n");
}

}  // namespace
}  // namespace kor::filters
