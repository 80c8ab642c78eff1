#include "platform/system/translate.h"

#include <gtest/gtest.h>
#include <libintl.h>

#include <clocale>
#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>

namespace kor
{
namespace
{

/// A compiled message catalogue with one message.
std::string Catalogue(const std::string& oMessage, const std::string& oTranslation)
{
    const auto nMessage = static_cast<std::uint32_t>(oMessage.size());
    const auto nTranslation = static_cast<std::uint32_t>(oTranslation.size());
    const std::uint32_t anHeader[] = {0x950412DE, 0,        1,  28,           36,           0,
                                      44,         nMessage, 44, nTranslation, 45 + nMessage};
    return std::string(reinterpret_cast<const char*>(anHeader), sizeof(anHeader)) + oMessage +
           '\0' + oTranslation + '\0';
}

TEST(Translate, GivesTheTextItselfWithoutATranslation)
{
    const char* pszText = "There is no translation of this sentence.";
    EXPECT_EQ(_(pszText), pszText);
}

TEST(Translate, LooksTheTextUpInTheDomainOfTheLibrary)
{
    namespace fs = std::filesystem;
    if (std::setlocale(LC_ALL, "C.UTF-8") == nullptr)
    {
        GTEST_SKIP() << "no locale but C, which is never translated";
    }
    const fs::path oFolder = fs::path(::testing::TempDir()) / "kor_translate_test";
    fs::create_directories(oFolder / "de" / "LC_MESSAGES");
    std::ofstream(oFolder / "de" / "LC_MESSAGES" / "kor.mo", std::ios::binary)
        << Catalogue("margin", "Rand");
    setenv("LANGUAGE", "de", 1);
    bindtextdomain("kor", oFolder.c_str());

    EXPECT_STREQ(_("margin"), "Rand");
    EXPECT_STREQ(_("mask"), "mask");

    unsetenv("LANGUAGE");
    std::setlocale(LC_ALL, "C");
    EXPECT_STREQ(_("margin"), "margin");
    fs::remove_all(oFolder);
}

}  // namespace
}  // namespace kor
