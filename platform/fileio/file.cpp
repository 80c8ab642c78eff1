#include "platform/fileio/file.h"

#include <filesystem>
#include <system_error>

namespace kor::core::fileio
{

bool File::Exists(const std::string& oFile)
{
    std::error_code oError;
    return std::filesystem::exists(std::filesystem::symlink_status(oFile, oError));
}

}  // namespace kor::core::fileio
