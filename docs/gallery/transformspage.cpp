#include <memory>
#include <numeric>
#include <string>
#include <vector>

#include "docs/gallery/greyimage.h"
#include "docs/gallery/pages.h"
#include "examples/filterfile/principalcomponents.h"
#include "platform/datasources/basicreader.h"
#include "platform/datasources/basicwriter.h"
#include "platform/datasources/datasetmanager.h"
#include "processes/qrdfilters/filterhom.h"

namespace kor::gallery
{

namespace
{

using tessel::Raster;

constexpr std::uint32_t kBands = 6;
constexpr Area kShown = {20, 150, 180, 180};  ///< of single channels

/// All channels of a file, as a block and one by one.
struct Scene
{
    explicit Scene(const std::string& oFile) : mvnChannels(kBands)
    {
        std::iota(mvnChannels.begin(), mvnChannels.end(), 1U);
        datasources::BasicReader oReader(oFile, mvnChannels, 0);
        mpoBlock =
            std::make_unique<Raster>(tessel::RasterInfo(oReader.GetWidth(), oReader.GetHeight(),
                                                        kBands, oReader.GetDataType()),
                                     tessel::RasterContext());
        oReader.ReadRaster(mpoBlock.get());
    }

    std::vector<unsigned int> mvnChannels;
    std::unique_ptr<Raster> mpoBlock;
};

GreyImage ChannelOf(const Raster& oBytes, std::uint32_t nChannel)
{
    GreyImage oImage{oBytes.mnWidth, oBytes.mnHeight, {}};
    for (std::uint32_t y = 0; y < oBytes.mnHeight; ++y)
    {
        for (std::uint32_t x = 0; x < oBytes.mnWidth; ++x)
        {
            oImage.mvdfSamples.push_back(oBytes.GetPixel(x, y)[nChannel]);
        }
    }
    return oImage;
}

Colour Stretched(GreyImage oImage)
{
    const Scale oScale = ScaleOf(oImage);
    return {std::move(oImage), oScale};
}

/// The components in 8 bits.
Raster Transform(const std::string& oFile, const Scene& oScene)
{
    examples::Arguments oArguments({});
    examples::PrincipalComponents oComponents(oArguments, kBands);
    oComponents.Analyse({oFile, oScene.mvnChannels}, tessel::eDT_8U);
    Raster oResult({oScene.mpoBlock->mnWidth, oScene.mpoBlock->mnHeight, kBands, tessel::eDT_8U},
                   {});
    oComponents.GetFilter().Process(oScene.mpoBlock.get(), nullptr, &oResult);
    oComponents.Print("LONG");
    return oResult;
}

/// Classes from 0 to 63: four steps of each of the first three components.
Raster Classify(const Raster& oComponents)
{
    Raster oClasses({oComponents.mnWidth, oComponents.mnHeight, 1, tessel::eDT_8U}, {});
    for (std::uint32_t y = 0; y < oClasses.mnHeight; ++y)
    {
        for (std::uint32_t x = 0; x < oClasses.mnWidth; ++x)
        {
            const unsigned char* const pSteps = oComponents.GetPixel(x, y);
            *oClasses.GetPixel(x, y) = static_cast<unsigned char>(
                pSteps[0] / 64 * 16 + pSteps[1] / 64 * 4 + pSteps[2] / 64);
        }
    }
    return oClasses;
}

/// One band with the mean of its class in each pixel.
GreyImage Homogenised(const Scene& oScene, unsigned int nBand, Raster& oClasses,
                      const std::filesystem::path& oFolder)
{
    std::string oFile = oFolder / "classes.kordsk";
    {
        const std::unique_ptr<datasources::IDataset> poDataset(
            datasources::DatasetManager::GetInstance()->NewDataset(oFile, "KORDSK", ""));
        auto& oImage = dynamic_cast<datasources::IRasterDataset&>(*poDataset);
        oImage.CreateChannels(*oScene.mpoBlock);
        datasources::BasicWriter(&oImage, oScene.mvnChannels).WriteRaster(oScene.mpoBlock.get());
        const unsigned int nClasses = oImage.CreateChannels(oClasses);
        datasources::BasicWriter(&oImage, {nClasses}).WriteRaster(&oClasses);
    }
    filters::HOMStatistics oStatistics(oFile, {nBand}, {kBands + 1}, {}, {0}, {0.0F}, {0});
    oStatistics.GetRasterStats();
    std::filesystem::remove(oFile);
    filters::FilterHOM oFilter;
    oFilter.SetMeanMode(oStatistics.GetMeanMode());
    Raster oResult({oClasses.mnWidth, oClasses.mnHeight, 1, tessel::eDT_8U}, {});
    oFilter.Process(&oClasses, nullptr, &oResult);
    return ChannelOf(oResult, 0);
}

}  // namespace

void MakeTransformsPage(const std::string& oFile, const std::filesystem::path& oFolder)
{
    // The report is to show the name alone.
    const std::filesystem::path oPictures = std::filesystem::absolute(oFolder);
    const std::filesystem::path oPath = std::filesystem::absolute(oFile);
    std::filesystem::current_path(oPath.parent_path());

    const Scene oScene(oPath.filename());
    const Raster oComponents = Transform(oPath.filename(), oScene);
    std::array<Colour, 3> aoBands;
    std::array<Colour, 3> aoComponents;
    for (std::uint32_t c = 0; c < 3; ++c)
    {
        aoBands[c] = Stretched(ChannelOf(*oScene.mpoBlock, 2 - c));
        aoComponents[c] = Stretched(ChannelOf(oComponents, c));
    }
    WriteComposite(oPictures / "bands.png", aoBands);
    WriteComposite(oPictures / "components.png", aoComponents);
    for (std::uint32_t c = 0; c < kBands; ++c)
    {
        WritePicture(oPictures / ("component" + std::to_string(c + 1) + ".png"),
                     Crop(ChannelOf(oComponents, c), kShown), {0, 255}, 1);
    }
    Raster oClasses = Classify(oComponents);
    std::array<Colour, 3> aoClasses = aoBands;
    for (unsigned int c = 0; c < 3; ++c)
    {
        aoClasses[c].moImage = Homogenised(oScene, 3 - c, oClasses, oPictures);
    }
    WriteComposite(oPictures / "homogenised.png", aoClasses);
}

}  // namespace kor::gallery
