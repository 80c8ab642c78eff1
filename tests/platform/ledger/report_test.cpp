#include "platform/ledger/report.h"

#include <gtest/gtest.h>

#include <string>

namespace kor::ledger
{
namespace
{

class Notes : public IReportSink
{
public:
    void AddHeader(const std::string& oTitle, const std::string& oText) override
    {
        moText += "<" + oTitle + "|" + oText + ">";
    }
    void AddInfo(const std::string& oText) override { moText += "[" + oText + "]"; }

    std::string moText;
};

TEST(Report, GoesToTheSinkPieceByPiece)
{
    Notes oNotes;
    IReportSink* const poFormer = Report::SetSink(&oNotes);
    Report::AddHeader("PCA", "");
    Report::AddInfo("\n");
    Report::AddInfo(" 1%%");
    EXPECT_EQ(Report::SetSink(poFormer), &oNotes);
    EXPECT_EQ(oNotes.moText, "<PCA|>[\n][ 1%%]");
}

TEST(Report, GivesBackTheSinkBefore)
{
    Notes oFirst;
    Notes oSecond;
    IReportSink* const poFormer = Report::SetSink(&oFirst);
    EXPECT_EQ(Report::SetSink(&oSecond), &oFirst);
    EXPECT_EQ(Report::SetSink(poFormer), &oSecond);
    EXPECT_EQ(oFirst.moText + oSecond.moText, "");
}

TEST(Report, GoesToStandardOutputWithoutASink)
{
    IReportSink* const poFormer = Report::SetSink(nullptr);
    ::testing::internal::CaptureStdout();
    Report::AddHeader("PCA", "");
    Report::AddHeader("Title", "text");
    Report::AddInfo("no line end");
    Report::AddInfo("\n");
    EXPECT_EQ(::testing::internal::GetCapturedStdout(), "PCA\nTitle\ntext\nno line end\n");
    Report::SetSink(poFormer);
}

TEST(FormatString, FormatsLikePrintf)
{
    EXPECT_EQ(FormatString("%4d% 4d|%-5s|%7.2f|%12.4g", 7, 7, "ab", 1.005, 123456.0),
              "   7   7|ab   |   1.00|   1.235e+05");
    EXPECT_EQ(FormatString("%6.2g%%", 99.5), " 1e+02%");
    EXPECT_EQ(FormatString("%s", ""), "");
}

TEST(FormatString, HoldsTextOfAnyLength)
{
    const std::string oLong(5000, 'x');
    EXPECT_EQ(FormatString("<%s>", oLong.c_str()), "<" + oLong + ">");
}

}  // namespace
}  // namespace kor::ledger
