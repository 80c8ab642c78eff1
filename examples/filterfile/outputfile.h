#pragma once

#include <filesystem>
#include <memory>
#include <string>

#include "platform/datasources/irasterdataset.h"

namespace kor::examples
{

/// A new image file that comes under its name only when it is complete. Until then it grows in a
/// folder beside that name, with whatever files its format puts next to it; the folder goes with
/// this object, finished or not.
class OutputFile
{
public:
    /// oFormat: "KORDSK" or a name of GDAL's, "GTiff" for instance; empty goes by the suffix.
    /// Throws UsageError when the file exists and is not to be replaced, or the suffix is unknown.
    OutputFile(std::filesystem::path oFile, const std::string& oFormat, const std::string& oOptions,
               bool bReplace);
    OutputFile(const OutputFile&) = delete;
    OutputFile& operator=(const OutputFile&) = delete;
    ~OutputFile();

    datasources::IRasterDataset& GetDataset() const;
    /// Closes the file and brings it under its name. Writers must be gone.
    void Finish();

private:
    std::filesystem::path moFile;
    std::filesystem::path moFolder;
    std::unique_ptr<datasources::IDataset> mpoDataset;
};

}  // namespace kor::examples
