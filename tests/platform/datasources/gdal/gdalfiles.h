#pragma once

#include <cpl_error.h>
#include <gtest/gtest.h>
#include <sys/resource.h>

#include <csignal>
#include <memory>
#include <string>
#include <vector>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/basicwriter.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "tests/support/blocks.h"
#include "tests/support/exceptions.h"
#include "tests/support/temporarydirectory.h"

namespace kor::test
{

/// While it lives, files of this process cannot grow beyond a size: a disk that is full.
class FullDisk
{
public:
    explicit FullDisk(rlim_t nBytes) : mpFormerHandler(std::signal(SIGXFSZ, SIG_IGN))
    {
        getrlimit(RLIMIT_FSIZE, &moFormer);
        const rlimit oLimit{nBytes, moFormer.rlim_max};
        setrlimit(RLIMIT_FSIZE, &oLimit);
    }
    FullDisk(const FullDisk&) = delete;
    FullDisk& operator=(const FullDisk&) = delete;
    ~FullDisk()
    {
        setrlimit(RLIMIT_FSIZE, &moFormer);
        std::signal(SIGXFSZ, mpFormerHandler);
    }

private:
    rlimit moFormer{};
    void (*mpFormerHandler)(int);
};

/// A test with files of its own. It fails when GDAL reports anything past the library, which would
/// have been printed.
class GdalFilesTest : public ::testing::Test
{
protected:
    GdalFilesTest()
    {
        CPLPushErrorHandlerEx(&GdalFilesTest::Report, nullptr);
        datasources::RegisterGdalDriver();
    }
    ~GdalFilesTest() override { CPLPopErrorHandler(); }

    std::string File(const std::string& oName) const { return moDirectory.File(oName); }

    static std::unique_ptr<datasources::IRasterDataset> Open(const std::string& oFile, bool bUpdate)
    {
        return AsRaster(datasources::DatasetManager::GetInstance()->Open(oFile, bUpdate ? 1 : 0));
    }
    static std::unique_ptr<datasources::IRasterDataset> New(const std::string& oFile,
                                                            const std::string& oFormat = "GTiff",
                                                            const std::string& oOptions = "")
    {
        return AsRaster(
            datasources::DatasetManager::GetInstance()->NewDataset(oFile, oFormat, oOptions));
    }

    /// Makes a file of one block and returns it as it was written.
    static std::unique_ptr<tessel::Raster> MakeFile(const std::string& oFile,
                                                    const std::string& oFormat,
                                                    const std::string& oOptions,
                                                    const tessel::RasterInfo& oInfo,
                                                    Random& oRandom)
    {
        auto poRaster = RandomRaster(oInfo.mnWidth, oInfo.mnHeight, oInfo.mnChannels,
                                     oInfo.moDataType, {}, Samples::Special, oRandom);
        const auto poDataset = New(oFile, oFormat, oOptions);
        EXPECT_EQ(poDataset->CreateChannels(oInfo), 1U);
        datasources::BasicWriter oWriter(poDataset.get(), Numbers(oInfo.mnChannels));
        oWriter.WriteRaster(poRaster.get());
        oWriter.Flush();
        return poRaster;
    }

    /// All channels of a file as one block.
    static std::unique_ptr<tessel::Raster> ReadFile(const std::string& oFile)
    {
        const auto poDataset = Open(oFile, false);
        datasources::BasicReader oReader(poDataset.get(), Numbers(poDataset->GetChannelCount()));
        oReader.SetTileSize(oReader.GetWidth(), oReader.GetHeight());
        return std::unique_ptr<tessel::Raster>(oReader.GetRaster(0));
    }

    static std::vector<unsigned int> Numbers(unsigned int nChannels)
    {
        std::vector<unsigned int> vnNumbers;
        for (unsigned int nChannel = 1; nChannel <= nChannels; ++nChannel)
        {
            vnNumbers.push_back(nChannel);
        }
        return vnNumbers;
    }

    TemporaryDirectory moDirectory;

private:
    static std::unique_ptr<datasources::IRasterDataset> AsRaster(datasources::IDataset* poDataset)
    {
        return std::unique_ptr<datasources::IRasterDataset>(
            dynamic_cast<datasources::IRasterDataset*>(poDataset));
    }
    static void CPL_STDCALL Report(CPLErr eClass, CPLErrorNum /*nNumber*/, const char* pszText)
    {
        if (eClass != CE_Debug)
        {
            ADD_FAILURE() << "GDAL reported: " << pszText;
        }
    }
};

}  // namespace kor::test
