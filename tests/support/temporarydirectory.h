#pragma once

#include <gtest/gtest.h>
#include <stdlib.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <set>
#include <string>

namespace kor::test
{

/// A directory of its own for one test, gone with all files in it at the end.
class TemporaryDirectory
{
public:
    TemporaryDirectory()
    {
        std::string oPattern = (std::filesystem::temp_directory_path() / "kor-XXXXXX").string();
        EXPECT_NE(mkdtemp(oPattern.data()), nullptr);
        moPath = oPattern;
    }
    TemporaryDirectory(const TemporaryDirectory&) = delete;
    TemporaryDirectory& operator=(const TemporaryDirectory&) = delete;
    ~TemporaryDirectory()
    {
        std::error_code oIgnored;
        std::filesystem::remove_all(moPath, oIgnored);
    }

    std::string File(const std::string& oName) const { return (moPath / oName).string(); }
    /// Makes a file with the given bytes and returns its full name.
    std::string Write(const std::string& oName, const std::string& oBytes) const
    {
        std::ofstream(File(oName), std::ios::binary) << oBytes;
        return File(oName);
    }
    /// Names of all files in it.
    std::set<std::string> Names() const
    {
        std::set<std::string> oNames;
        for (const auto& oEntry : std::filesystem::directory_iterator(moPath))
        {
            oNames.insert(oEntry.path().filename().string());
        }
        return oNames;
    }

    /// Removes the files in it whose names begin like that.
    void Clear(const std::string& oStart = "") const
    {
        for (const std::string& oName : Names())
        {
            if (oName.starts_with(oStart))
            {
                std::filesystem::remove(moPath / oName);
            }
        }
    }

private:
    std::filesystem::path moPath;
};

inline std::string BytesOf(const std::string& oFile)
{
    std::ifstream oStream(oFile, std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(oStream), {});
}

}  // namespace kor::test
