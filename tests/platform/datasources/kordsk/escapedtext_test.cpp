#include "platform/datasources/kordsk/escapedtext.h"

#include <gtest/gtest.h>

namespace kor::datasources
{
namespace
{

using namespace std::string_literals;

TEST(EscapedText, PlainTextStaysAsItIs)
{
    EXPECT_EQ(Escape("Layover mask: [dB] 100%"), "Layover mask: [dB] 100%");
    EXPECT_EQ(Escape("Z\xC3\xBCrich \xE2\x82\xAC \xF0\x9F\x9B\xB0"),
              "Z\xC3\xBCrich \xE2\x82\xAC \xF0\x9F\x9B\xB0");
}

TEST(EscapedText, WhatWouldBreakALineIsWrittenInHexadecimal)
{
    EXPECT_EQ(Escape("a=b\nc\\x41\0\x7F\r"s), "a\\x3Db\\x0Ac\\x5Cx41\\x00\\x7F\\x0D");
}

TEST(EscapedText, BytesThatAreNoUtf8AreWrittenInHexadecimal)
{
    EXPECT_EQ(Escape("\xFC"), "\\xFC");
    EXPECT_EQ(Escape("\xC3"), "\\xC3");
    EXPECT_EQ(Escape("\xC0\xAF"), "\\xC0\\xAF");
    EXPECT_EQ(Escape("\xE0\x9F\xBF"), "\\xE0\\x9F\\xBF");
    EXPECT_EQ(Escape("\xED\xA0\x80"), "\\xED\\xA0\\x80");
    EXPECT_EQ(Escape("\xF4\x90\x80\x80"), "\\xF4\\x90\\x80\\x80");
    EXPECT_EQ(Escape("\xE2\x82"), "\\xE2\\x82");
}

TEST(EscapedText, EveryTextComesBack)
{
    std::string oText;
    for (int i = 0; i < 256; ++i)
    {
        for (int k = 0; k < 256; k += 3)
        {
            oText += static_cast<char>(i);
            oText += static_cast<char>(k);
        }
    }
    EXPECT_EQ(Unescape(Escape(oText)), oText);
    EXPECT_EQ(Escape(oText).find_first_of("\n="), std::string::npos);
}

TEST(EscapedText, BrokenEscapesAreRefused)
{
    for (const char* pszText : {"\\", "\\x", "\\x4", "\\x4G", "\\xG4", "\\n", "\\x-1", "a\\x 1"})
    {
        EXPECT_EQ(Unescape(pszText), std::nullopt) << pszText;
    }
    EXPECT_EQ(Unescape("\\x41\\x6a"), "Aj");
}

}  // namespace
}  // namespace kor::datasources
