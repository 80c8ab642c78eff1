#include "platform/fileio/file.h"

#include <gtest/gtest.h>

#include "tests/support/temporarydirectory.h"

namespace kor::core::fileio
{
namespace
{

TEST(File, ExistsWhereTheNameIsTaken)
{
    const test::TemporaryDirectory oDirectory;
    const std::string oFile = oDirectory.Write("file", "");
    std::filesystem::create_symlink("nowhere", oDirectory.File("dangling"));

    EXPECT_TRUE(File::Exists(oFile));
    EXPECT_TRUE(File::Exists(oDirectory.File("")));
    EXPECT_TRUE(File::Exists(oDirectory.File("dangling")));
}

TEST(File, DoesNotExistWhereTheNameIsFree)
{
    const test::TemporaryDirectory oDirectory;
    EXPECT_FALSE(File::Exists(oDirectory.File("file")));
    EXPECT_FALSE(File::Exists(oDirectory.File("no directory/file")));
    EXPECT_FALSE(File::Exists(""));
}

}  // namespace
}  // namespace kor::core::fileio
