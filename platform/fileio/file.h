#pragma once

#include <string>

namespace kor::core::fileio
{

/// Questions about files by name.
class File
{
public:
    /// True when the name is taken: by a file, a directory, a link (even one that leads nowhere) or
    /// anything else. False where that cannot be found out, for instance in a directory that may
    /// not be searched; making the file then fails by itself. Throws nothing but std::bad_alloc.
    static bool Exists(const std::string& oFile);
};

}  // namespace kor::core::fileio
