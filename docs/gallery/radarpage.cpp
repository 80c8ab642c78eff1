#include <cstdio>
#include <string>
#include <vector>

#include "docs/gallery/greyimage.h"
#include "docs/gallery/pages.h"
#include "docs/gallery/quality.h"
#include "docs/gallery/speckle.h"

namespace kor::gallery
{

namespace
{

constexpr std::uint64_t kSeed = 20240229;
constexpr std::uint32_t kSide = 180;  ///< of the crops that are shown
constexpr std::uint32_t kZoom = 1;

struct Candidate
{
    std::string moFilter;
    std::vector<std::string> mvoWords;
};

/// The filters that smooth speckle, for intensities of so many looks.
std::vector<Candidate> SpeckleFilters(int nLooks)
{
    const std::string oLooks = "looks=" + std::to_string(nLooks);
    return {
        {"average", {}},
        {"median", {}},
        {"frost", {"damping=1"}},
        {"enhanced_frost", {oLooks, "damping=1"}},
        {"lee", {oLooks}},
        {"enhanced_lee", {oLooks, "damping=1"}},
        {"kuan", {oLooks}},
        {"gamma", {oLooks}},
        {"touzi", {oLooks, "values=intensity"}},
    };
}

void PrintSceneTable()
{
    const GreyImage oTruth = SyntheticScene();
    std::printf(
        "| filter | PSNR 1 look | ENL | mean | PSNR 4 looks | ENL | mean | PSNR 10 looks | ENL | "
        "mean |\n|---|---|---|---|---|---|---|---|---|---|\n");
    const int anLooks[] = {1, 4, 10};
    const auto oPrint = [&](const std::string& oName, const auto& oMake)
    {
        std::printf("| %s |", oName.c_str());
        for (const int nLooks : anLooks)
        {
            const GreyImage oImage = oMake(Speckled(oTruth, nLooks, kSeed), nLooks);
            std::printf(" %.2f | %.1f | %.3f |", PeakSignalToNoise(oImage, oTruth),
                        EquivalentLooks(oImage, UniformField()), MeanRatio(oImage, oTruth));
        }
        std::printf("\n");
    };
    oPrint("none", [](const GreyImage& oImage, int) { return oImage; });
    for (std::size_t i = 0; i < SpeckleFilters(1).size(); ++i)
    {
        oPrint(SpeckleFilters(1)[i].moFilter,
               [&](const GreyImage& oImage, int nLooks)
               {
                   const Candidate oFilter = SpeckleFilters(nLooks)[i];
                   return Filtered(oImage, oFilter.moFilter, oFilter.mvoWords);
               });
    }
}

/// The place where the image is most uniform: the greatest number of looks of all squares of nSide
/// pixels, on a grid.
Area MostUniform(const GreyImage& oImage, std::uint32_t nSide)
{
    Area oBest{0, 0, nSide, nSide};
    double dfMost = 0.0;
    for (std::uint32_t y = 0; y + nSide <= oImage.mnHeight; y += nSide / 4)
    {
        for (std::uint32_t x = 0; x + nSide <= oImage.mnWidth; x += nSide / 4)
        {
            const Area oArea{x, y, nSide, nSide};
            const double dfLooks = EquivalentLooks(oImage, oArea);
            if (dfLooks > dfMost)
            {
                dfMost = dfLooks;
                oBest = oArea;
            }
        }
    }
    return oBest;
}

}  // namespace

void MakeRadarPage(const std::string& oFile, unsigned int nChannel,
                   const std::filesystem::path& oFolder)
{
    constexpr int kLooks = 4;
    const GreyImage oTruth = Crop(ReadChannel(oFile, nChannel), {20, 150, kSide, kSide});
    const GreyImage oSpeckled = Speckled(oTruth, kLooks, kSeed);
    const Scale oScale = ScaleOf(oTruth);
    const Area oPatch = MostUniform(oTruth, 24);
    std::printf("| filter | ENL | edges | mean |\n|---|---|---|---|\n");
    const auto oShow = [&](const std::string& oName, const GreyImage& oImage)
    {
        WritePicture((oFolder / (oName + ".png")).string(), oImage, oScale, kZoom);
        std::printf("| %s | %.1f | %.3f | %.3f |\n", oName.c_str(), EquivalentLooks(oImage, oPatch),
                    EdgeCorrelation(oImage, oTruth), MeanRatio(oImage, oSpeckled));
    };
    oShow("truth", oTruth);
    oShow("speckled", oSpeckled);
    for (const Candidate& oFilter : SpeckleFilters(kLooks))
    {
        oShow(oFilter.moFilter, Filtered(oSpeckled, oFilter.moFilter, oFilter.mvoWords));
    }
    const GreyImage oTexture = Filtered(oSpeckled, "texture", {"measures=1"});
    WritePicture((oFolder / "texture.png").string(), oTexture, ScaleOf(oTexture), kZoom);
    std::printf("\n");
    PrintSceneTable();
}

void MeasureRadarImage(const std::string& oFile, unsigned int nChannel, int nLooks)
{
    const GreyImage oImage = ReadChannel(oFile, nChannel);
    const Area oPatch = MostUniform(oImage, 32);
    std::printf(
        "uniform patch: 32 x 32 pixels at %u, %u\n\n| filter | ENL | gradients | mean |\n"
        "|---|---|---|---|\n",
        oPatch.x, oPatch.y);
    const auto oPrint = [&](const std::string& oName, const GreyImage& oResult)
    {
        std::printf("| %s | %.1f | %.3f | %.3f |\n", oName.c_str(),
                    EquivalentLooks(oResult, oPatch), GradientRatio(oResult, oImage),
                    MeanRatio(oResult, oImage));
    };
    oPrint("none", oImage);
    for (const Candidate& oFilter : SpeckleFilters(nLooks))
    {
        oPrint(oFilter.moFilter, Filtered(oImage, oFilter.moFilter, oFilter.mvoWords));
    }
}

}  // namespace kor::gallery
