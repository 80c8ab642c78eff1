// Pictures of image files to look at, all on the grey scale of the first one:
//
//     quicklook FOLDER FILE...
//
// writes FOLDER/<name>.png for each file, without its suffix: red, green and blue of the third,
// second and first channel where there are more than four, of the first three where there are three
// or four, else the first channel in grey. Black is the 2 % sample and white the 98 % sample.
// Samples that are missing are black. Large images are thinned out.

#include <cmath>
#include <cstdint>
#include <filesystem>
#include <iostream>
#include <memory>
#include <numeric>
#include <stdexcept>
#include <string>
#include <vector>

#include "examples/picture.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "platform/datasources/multitypereader.h"
#include "platform/exception/exception.h"
#include "processes/qrdfilters/validmaskbuilder.h"

namespace
{

using namespace kor;
using examples::Picture;

Picture PictureOf(const std::string& oFile)
{
    const std::unique_ptr<datasources::IDataset> poDataset(
        datasources::DatasetManager::GetInstance()->Open(oFile, 0));
    const auto* poImage = dynamic_cast<const datasources::IRasterDataset*>(poDataset.get());
    if (poImage == nullptr || poImage->GetChannelCount() == 0)
    {
        throw std::runtime_error(oFile + " holds no image channels");
    }
    std::vector<unsigned int> vnChannels(poImage->GetChannelCount());
    std::iota(vnChannels.begin(), vnChannels.end(), 1U);
    datasources::MultiTypeReader oReader(poDataset.get(), vnChannels, tessel::eDT_64R);

    const filters::ValidMaskBuilder oMaskBuilder(oReader.GetAuxiliaryData().GetNoDataValues());
    const tessel::RasterInfo oRow(oReader.GetWidth(), 1, oReader.GetChannelCount(),
                                  tessel::eDT_64R);
    Picture oPicture(
        {oReader.GetWidth(), oReader.GetHeight(), oReader.GetChannelCount(), tessel::eDT_64R});
    for (std::uint32_t y = 0; y < oReader.GetHeight(); y += oPicture.GetStep())
    {
        tessel::Raster oBlock(oRow, {0, 0, 0, y});
        oReader.ReadRaster(&oBlock);
        const std::unique_ptr<tessel::Mask> poMask(oMaskBuilder.BuildMask(oBlock));
        oPicture.Add(oBlock, poMask.get());
    }
    return oPicture;
}

void WritePictures(const std::filesystem::path& oFolder, const std::vector<std::string>& voFiles)
{
    std::vector<Picture> voPictures;
    for (const std::string& oFile : voFiles)
    {
        voPictures.push_back(PictureOf(oFile));
    }
    std::filesystem::create_directories(oFolder);
    for (std::size_t i = 0; i < voFiles.size(); ++i)
    {
        const std::filesystem::path oName = std::filesystem::path(voFiles[i]).stem();
        voPictures[i].Write(oFolder / (oName.string() + ".png"), voPictures.front());
        std::cout << (oFolder / (oName.string() + ".png")).string() << '\n';
    }
    std::cout << voPictures.front().Describe() << '\n';
}

}  // namespace

int main(int nArguments, char* apszArguments[])
{
    if (nArguments < 3)
    {
        std::cerr << "Usage: quicklook FOLDER FILE...\n";
        return 2;
    }
    try
    {
        datasources::RegisterGdalDriver();
        WritePictures(apszArguments[1], {apszArguments + 2, apszArguments + nArguments});
    }
    catch (const std::exception& oError)
    {
        std::cerr << "quicklook: " << oError.what() << '\n';
        return 1;
    }
    return 0;
}
