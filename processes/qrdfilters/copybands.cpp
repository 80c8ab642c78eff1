#include <algorithm>
#include <filesystem>
#include <memory>
#include <numeric>
#include <system_error>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/basicwriter.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/exception/exception.h"
#include "platform/fileio/file.h"
#include "platform/system/translate.h"
#include "processes/qrdfilters/datacopy.h"
#include "processes/qrdfilters/parallelio/filteriodriver.h"

namespace kor::filters
{

using datasources::IRasterDataset;

namespace
{

constexpr const char* kSource = "processes/qrdfilters/datacopy";

/// Channels of one data type: their numbers in the input and in the output, in one order.
struct ChannelGroup
{
    tessel::DataType moType;
    std::vector<unsigned int> mvnInput;
    std::vector<unsigned int> mvnOutput;
};

/// The channels by data type, the types in the order in which they are met.
std::vector<ChannelGroup> GroupByType(const IRasterDataset& oInput,
                                      const std::vector<unsigned int>& oChannels)
{
    std::vector<ChannelGroup> voGroups;
    for (const unsigned int nChannel : oChannels)
    {
        const tessel::DataType oType = oInput.GetChannelType(nChannel);
        auto itGroup =
            std::find_if(voGroups.begin(), voGroups.end(),
                         [&](const ChannelGroup& oGroup) { return oGroup.moType == oType; });
        if (itGroup == voGroups.end())
        {
            itGroup = voGroups.insert(itGroup, ChannelGroup{oType, {}, {}});
        }
        itGroup->mvnInput.push_back(nChannel);
    }
    return voGroups;
}

void CreateOutputChannels(const IRasterDataset& oInput, IRasterDataset& oOutput,
                          ChannelGroup& oGroup)
{
    const auto nCount = static_cast<std::uint32_t>(oGroup.mvnInput.size());
    const unsigned int nFirst =
        oOutput.CreateChannels({oInput.GetWidth(), oInput.GetHeight(), nCount, oGroup.moType});
    oGroup.mvnOutput.resize(nCount);
    std::iota(oGroup.mvnOutput.begin(), oGroup.mvnOutput.end(), nFirst);
}

void CopyPixels(IRasterDataset& oInput, IRasterDataset& oOutput, const ChannelGroup& oGroup)
{
    datasources::BasicReader oReader(&oInput, oGroup.mvnInput);
    datasources::BasicWriter oWriter(&oOutput, oGroup.mvnOutput);
    parallelio::FilterIODriver<QRDDataCopyAlgorithm, parallelio::DefaultAccessPolicy,
                               parallelio::DefaultUpdateStrategy>
        oDriver;
    oDriver.Run(&oReader, &oWriter);
}

void CopyAuxiliaryData(IRasterDataset& oInput, IRasterDataset& oOutput,
                       const std::vector<ChannelGroup>& voGroups)
{
    const datasources::AuxiliaryData oFrom = oInput.GetAuxiliaryData();
    datasources::AuxiliaryData oTo;
    for (const ChannelGroup& oGroup : voGroups)
    {
        for (std::size_t i = 0; i < oGroup.mvnInput.size(); ++i)
        {
            const unsigned int nIn = oGroup.mvnInput[i];
            const unsigned int nOut = oGroup.mvnOutput[i];
            oTo.SetChannelDescription(oFrom.GetChannelDescription(nIn), nOut);
            oTo.SetChanMetadata(oFrom.GetChanMetadata(nIn), nOut);
            oTo.SetChannelNoData(oFrom.GetChannelNoData(nIn), nOut);
        }
    }
    oTo.SetFileMetadata(oFrom.GetFileMetadata());
    oOutput.SetAuxiliaryData(oTo);
    oOutput.SetGeocodingInfo(oInput.GetGeocodingInfo());
}

/// The dataset as one of channels.
IRasterDataset& RasterDatasetOf(datasources::IDataset& oDataset)
{
    auto* poRasterDataset = dynamic_cast<IRasterDataset*>(&oDataset);
    if (poRasterDataset == nullptr)
    {
        throw DataException(oDataset.GetFileName() + ": this file has no channels", kSource,
                            __PRETTY_FUNCTION__, __LINE__);
    }
    return *poRasterDataset;
}

/// A new file, which goes again if it is not completed.
class NewFile
{
public:
    explicit NewFile(const std::string& oFile)
        : moFile(oFile),
          mpoDataset(
              datasources::DatasetManager::GetInstance()->NewDataset(oFile, "KORDSK", "BAND"))
    {
    }
    NewFile(const NewFile&) = delete;
    NewFile& operator=(const NewFile&) = delete;
    ~NewFile()
    {
        mpoDataset.reset();
        if (!mbComplete)
        {
            std::error_code oIgnored;
            std::filesystem::remove(moFile, oIgnored);
        }
    }

    datasources::IDataset& GetDataset() const { return *mpoDataset; }
    void Complete()
    {
        mpoDataset->Flush();
        mbComplete = true;
    }

private:
    std::string moFile;
    std::unique_ptr<datasources::IDataset> mpoDataset;
    bool mbComplete = false;
};

}  // namespace

void CopyChannels(IRasterDataset& oInput, IRasterDataset& oOutput,
                  const std::vector<unsigned int>& oChannels)
{
    std::vector<unsigned int> vnChannels = oChannels;
    if (vnChannels.empty())
    {
        vnChannels.resize(oInput.GetChannelCount());
        std::iota(vnChannels.begin(), vnChannels.end(), 1U);
    }
    std::vector<ChannelGroup> voGroups = GroupByType(oInput, vnChannels);
    for (ChannelGroup& oGroup : voGroups)
    {
        CreateOutputChannels(oInput, oOutput, oGroup);
    }
    for (const ChannelGroup& oGroup : voGroups)
    {
        CopyPixels(oInput, oOutput, oGroup);
    }
    CopyAuxiliaryData(oInput, oOutput, voGroups);
}

void CopyBands(std::string oInputFile, std::string oOutputFile, std::vector<unsigned int> oChannels)
{
    const std::unique_ptr<datasources::IDataset> poInput(
        datasources::DatasetManager::GetInstance()->Open(oInputFile, 0));
    if (core::fileio::File::Exists(oOutputFile))
    {
        throw FileException(_("File already exists.\n"), oOutputFile, "", "", 0);
    }
    IRasterDataset& oInput = RasterDatasetOf(*poInput);
    NewFile oOutput(oOutputFile);
    CopyChannels(oInput, RasterDatasetOf(oOutput.GetDataset()), oChannels);
    oOutput.Complete();
}

}  // namespace kor::filters
