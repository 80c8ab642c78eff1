#include "platform/datasources/datasetmanager.h"

#include <filesystem>
#include <system_error>

#include "platform/datasources/guard.h"
#include "platform/datasources/kordsk/kordskdriver.h"
#include "platform/fileio/file.h"

namespace kor::datasources
{

namespace
{

constexpr const char* kSource = "platform/datasources/datasetmanager";

/// A name that a driver could take for something else than a file of the file system.
void RequirePlainName(const std::string& oFile)
{
    const char* pszWhat = nullptr;
    if (oFile.empty())
    {
        pszWhat = "the file's name is empty";
    }
    else if (oFile.find('\0') != std::string::npos)
    {
        pszWhat = "the file's name has a zero byte in it";
    }
    else if (oFile.find("://") != std::string::npos)
    {
        pszWhat = "this is a network address and not a file";
    }
    else if (oFile.starts_with("/vsi"))
    {
        pszWhat = "this is the name of a virtual file; only files of the file system are used";
    }
    if (pszWhat != nullptr)
    {
        throw FileException(oFile + ": " + pszWhat, oFile, kSource, __PRETTY_FUNCTION__, __LINE__);
    }
}

void RequireRegularFile(const std::string& oFile)
{
    std::error_code oError;
    const std::filesystem::file_status oStatus = std::filesystem::status(oFile, oError);
    std::string oWhat;
    switch (oStatus.type())
    {
        case std::filesystem::file_type::regular:
            return;
        case std::filesystem::file_type::not_found:
            oWhat = "there is no such file";
            break;
        case std::filesystem::file_type::directory:
            oWhat = "this is a directory and not a file";
            break;
        case std::filesystem::file_type::none:
            oWhat = oError.message();
            break;
        default:
            oWhat = "this is not a regular file";
    }
    throw FileException(oFile + ": " + oWhat, oFile, kSource, __PRETTY_FUNCTION__, __LINE__);
}

std::string NamesOf(const std::vector<std::shared_ptr<IDatasetDriver>>& vpoDrivers)
{
    std::string oNames;
    for (const auto& poDriver : vpoDrivers)
    {
        oNames += (oNames.empty() ? "" : ", ") + poDriver->GetName();
    }
    return oNames.empty() ? "none" : oNames;
}

}  // namespace

DatasetManager::DatasetManager()
{
    mvpoDrivers.push_back(MakeKordskDriver());
}

DatasetManager* DatasetManager::GetInstance()
{
    static DatasetManager oInstance;
    return &oInstance;
}

std::vector<std::shared_ptr<IDatasetDriver>> DatasetManager::GetDrivers() const
{
    const std::lock_guard oLock(moMutex);
    return mvpoDrivers;
}

void DatasetManager::RegisterDriver(std::unique_ptr<IDatasetDriver> poDriver)
{
    DatasetManager& oManager = *GetInstance();
    const std::lock_guard oLock(oManager.moMutex);
    for (const auto& poKnown : oManager.mvpoDrivers)
    {
        if (poKnown->GetName() == poDriver->GetName())
        {
            return;
        }
    }
    oManager.mvpoDrivers.push_back(std::move(poDriver));
}

void DatasetManager::AllowDriver(const std::string& oFormat)
{
    const auto vpoDrivers = GetInstance()->GetDrivers();
    for (const auto& poDriver : vpoDrivers)
    {
        if (poDriver->AllowFormat(oFormat))
        {
            return;
        }
    }
    throw DataException(
        "No driver knows a format \"" + oFormat + "\"; drivers: " + NamesOf(vpoDrivers), kSource,
        __PRETTY_FUNCTION__, __LINE__);
}

IDataset* DatasetManager::Open(const std::string& oFile, int nAccess)
{
    if (nAccess != 0 && nAccess != 1)
    {
        throw DataException(oFile + ": nAccess is " + std::to_string(nAccess) +
                                "; it can be 0 (reading) or 1 (changing)",
                            kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    return Guarded(
        oFile,
        [&]
        {
            RequirePlainName(oFile);
            RequireRegularFile(oFile);
            const auto vpoDrivers = GetDrivers();
            for (const auto& poDriver : vpoDrivers)
            {
                if (poDriver->Recognizes(oFile))
                {
                    return poDriver->Open(oFile, nAccess == 1).release();
                }
            }
            throw FileException(
                oFile + ": no driver knows this kind of file; drivers: " + NamesOf(vpoDrivers),
                oFile, kSource, __PRETTY_FUNCTION__, __LINE__);
        });
}

IDataset* DatasetManager::NewDataset(const std::string& oFile, const std::string& oFormat,
                                     const std::string& oOptions)
{
    return Guarded(oFile,
                   [&]
                   {
                       RequirePlainName(oFile);
                       if (core::fileio::File::Exists(oFile))
                       {
                           throw FileException(
                               oFile + ": this file exists already and is not overwritten", oFile,
                               kSource, __PRETTY_FUNCTION__, __LINE__);
                       }
                       const auto vpoDrivers = GetDrivers();
                       for (const auto& poDriver : vpoDrivers)
                       {
                           if (poDriver->HasFormat(oFormat))
                           {
                               return poDriver->Create(oFile, oFormat, oOptions).release();
                           }
                       }
                       throw DataException(oFile + ": no driver knows a format \"" + oFormat +
                                               "\"; drivers: " + NamesOf(vpoDrivers),
                                           kSource, __PRETTY_FUNCTION__, __LINE__);
                   });
}

}  // namespace kor::datasources
