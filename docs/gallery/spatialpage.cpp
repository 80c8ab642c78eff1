#include <algorithm>
#include <string>
#include <vector>

#include "docs/gallery/greyimage.h"
#include "docs/gallery/pages.h"

namespace kor::gallery
{

namespace
{

constexpr std::uint32_t kSide = 90;  ///< of the crop that is shown
constexpr std::uint32_t kZoom = 2;

/// How samples become grey.
enum class Tones
{
    eOfInput,  ///< as in the picture of the input
    eOwn,      ///< from the lowest to the highest of the result
    eCentred   ///< 0 is the middle grey
};

struct Picture
{
    std::string moName;
    std::string moFilter;
    std::vector<std::string> mvoWords;
    Tones meTones = Tones::eOfInput;
};

const std::vector<Picture>& Pictures()
{
    static const std::vector<Picture> kPictures = {
        {"average", "average", {"window=5"}},
        {"median", "median", {"window=5"}},
        {"gauss", "gauss", {"variance=2"}},
        {"gauss_difference", "gauss", {"variance=1", "variance2=3"}, Tones::eOwn},
        {"custom", "custom", {"kernel=-2,-1,0,-1,0,1,0,1,2"}, Tones::eCentred},
        {"edge", "edge", {"window=3"}, Tones::eOwn},
        {"sobel", "sobel", {}, Tones::eOwn},
        {"prewitt", "prewitt", {}, Tones::eOwn},
        {"sharp", "sharp", {"window=3"}},
        {"laplacian", "laplacian", {"window=3"}, Tones::eCentred},
        {"deviation", "deviation", {"window=5"}, Tones::eOwn},
        {"noise", "noise", {"window=5", "fail=0"}},
    };
    return kPictures;
}

Scale ScaleFor(Tones eTones, const GreyImage& oInput, const GreyImage& oResult)
{
    if (eTones == Tones::eOfInput)
    {
        return ScaleOf(oInput);
    }
    const Scale oScale = ScaleOf(oResult);
    const double dfMost = std::max(-oScale.mdfBlack, oScale.mdfWhite);
    return eTones == Tones::eOwn ? oScale : Scale{-dfMost, dfMost};
}

/// A map of as many classes as told, of equally wide ranges of samples.
GreyImage Classes(GreyImage oImage, int nClasses)
{
    const Scale oScale = ScaleOf(oImage);
    const double dfStep = (oScale.mdfWhite - oScale.mdfBlack) / nClasses;
    for (double& dfSample : oImage.mvdfSamples)
    {
        dfSample =
            std::clamp(static_cast<int>((dfSample - oScale.mdfBlack) / dfStep), 0, nClasses - 1);
    }
    return oImage;
}

}  // namespace

void MakeSpatialPage(const std::string& oFile, unsigned int nChannel,
                     const std::filesystem::path& oFolder)
{
    const GreyImage oInput = Crop(ReadChannel(oFile, nChannel), {155, 255, kSide, kSide});
    const auto oWrite = [&](const std::string& oName, const GreyImage& oImage, const Scale& oScale)
    { WritePicture((oFolder / (oName + ".png")).string(), oImage, oScale, kZoom); };
    oWrite("input", oInput, ScaleOf(oInput));
    for (const Picture& oPicture : Pictures())
    {
        const GreyImage oResult = Filtered(oInput, oPicture.moFilter, oPicture.mvoWords);
        oWrite(oPicture.moName, oResult, ScaleFor(oPicture.meTones, oInput, oResult));
    }
    constexpr int kClasses = 5;
    const GreyImage oClasses = Classes(oInput, kClasses);
    const Scale oScale = {0.0, kClasses - 1.0};
    oWrite("classes", oClasses, oScale);
    oWrite("mode", Filtered(oClasses, "mode", {"window=3"}), oScale);
}

}  // namespace kor::gallery
