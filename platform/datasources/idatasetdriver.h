#pragma once

#include <memory>
#include <string>

#include "platform/datasources/idataset.h"

namespace kor::datasources
{

/// A family of file formats, known to DatasetManager. Its methods are called from any thread.
class IDatasetDriver
{
public:
    virtual ~IDatasetDriver() = default;

    /// For error messages: what the driver is called, with its formats.
    virtual std::string GetName() const = 0;

    /// True when the file is one of this driver's. It exists, is a regular file, and may hold
    /// anything.
    virtual bool Recognizes(const std::string& oFile) const = 0;
    /// Opens a file that Recognizes was true for. Never null.
    virtual std::unique_ptr<IDataset> Open(const std::string& oFile, bool bUpdate) const = 0;

    /// True when oFormat is the name of one of this driver's formats, even of one that it can only
    /// read.
    virtual bool HasFormat(const std::string& oFormat) const = 0;
    /// Makes a new file, which does not exist, of a format of this driver. Never null.
    virtual std::unique_ptr<IDataset> Create(const std::string& oFile, const std::string& oFormat,
                                             const std::string& oOptions) const = 0;

    /// Lets the driver open files of one more of the formats it knows. False when it knows none of
    /// that name.
    virtual bool AllowFormat(const std::string& /*oFormat*/) { return false; }
};

}  // namespace kor::datasources
