#pragma once

#include <gdal.h>

#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

#include "basic/tessel/raster/raster.h"
#include "platform/datasources/gdal/gdalerrors.h"

namespace kor::datasources
{

struct CloseGdalDataset
{
    void operator()(void* hDataset) const;
};

using OwnedGdalDataset = std::unique_ptr<void, CloseGdalDataset>;

/// One GDAL handle on a file, which serves one thread at a time: two threads on one handle get
/// wrong samples without an error, so those who share it take turns.
class GdalFile
{
public:
    /// Opens a file as one of the formats that are allowed. Throws kor::FileException.
    static std::shared_ptr<GdalFile> Open(const std::string& oFile, bool bUpdate);
    /// Makes a file over an empty one of that name, which the caller has made to take the name and
    /// takes away when this fails. Throws kor::DataException when the format cannot hold such
    /// channels, else kor::FileException.
    static std::shared_ptr<GdalFile> Create(const std::string& oFile, const std::string& oFormat,
                                            const std::vector<std::string>& voOptions,
                                            const tessel::RasterInfo& oInfo);
    GdalFile(const GdalFile&) = delete;
    GdalFile& operator=(const GdalFile&) = delete;

    /// Runs oAction with the handle, alone on it, opening the file anew where it was flushed.
    /// Throws kor::IOException with oTask ("cannot read pixels") and GDAL's reason when oAction
    /// returns false or GDAL reports an error.
    void Do(const std::string& oTask, const std::function<bool(GDALDatasetH)>& oAction);

    /// Closes the file, so that all is written. Throws kor::IOException when GDAL reports an error.
    void Flush();

    const std::string& GetFileName() const { return moFile; }
    const std::string& GetFormat() const { return moFormat; }
    bool IsUpdate() const { return mbUpdate; }

private:
    GdalFile(OwnedGdalDataset poDataset, std::string oFile, bool bUpdate);
    [[noreturn]] void Throw(const std::string& oTask, const GdalErrors& oErrors) const;

    std::mutex moMutex;
    OwnedGdalDataset mpoDataset;  ///< null once it was flushed
    std::string moFile;
    std::string moFormat;
    bool mbUpdate;
};

}  // namespace kor::datasources
