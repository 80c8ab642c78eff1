#pragma once

#include <memory>
#include <mutex>
#include <string>
#include <vector>

#include "platform/datasources/idatasetdriver.h"

namespace kor::datasources
{

/// Opens and makes datasets, by the drivers that it knows: that of KORDSK files from the start.
///
/// Names are names of regular files. What is not one (a directory, a device, "/vsizip/...",
/// "http://...", a text that describes a dataset) is refused before any driver sees it.
///
/// Errors   kor::FileException when the file is missing, exists already where it is to be made, or
///          is not a file that any driver knows; what the drivers themselves throw is
///          kor::Exception of some kind with the file's name in the message.
/// Threads  may be used from any number of threads.
class DatasetManager
{
public:
    /// The one instance.
    static DatasetManager* GetInstance();

    /// nAccess: 0 for reading, 1 for changing the file as well; kor::DataException for others. The
    /// caller deletes the result.
    IDataset* Open(const std::string& oFile, int nAccess);

    /// Makes a new file. oFormat is the format's name ("KORDSK", "GTiff"), oOptions its options,
    /// separated by blanks ("TILED=YES COMPRESS=DEFLATE"). An existing file is never overwritten:
    /// kor::FileException. An unknown format, one that cannot make files, or an option that it does
    /// not know: kor::DataException. The caller deletes the result.
    IDataset* NewDataset(const std::string& oFile, const std::string& oFormat,
                         const std::string& oOptions);

    /// Adds a driver. The manager asks the drivers in the order in which they were added. One whose
    /// GetName is that of a driver added before is dropped: adding twice is harmless.
    static void RegisterDriver(std::unique_ptr<IDatasetDriver> poDriver);

    /// Lets files of one more format be opened, by the name that its driver has for it ("netCDF").
    /// The formats allowed from the start are those that can be opened without trusting the file.
    /// Throws kor::DataException when no registered driver knows the name.
    static void AllowDriver(const std::string& oFormat);

private:
    DatasetManager();

    std::vector<std::shared_ptr<IDatasetDriver>> GetDrivers() const;

    mutable std::mutex moMutex;  ///< guards the list; drivers are called without it
    std::vector<std::shared_ptr<IDatasetDriver>> mvpoDrivers;
};

}  // namespace kor::datasources
