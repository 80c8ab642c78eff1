#pragma once

#include <array>
#include <cstdint>
#include <string>
#include <vector>

namespace kor::gallery
{

/// One channel of an image, row by row.
struct GreyImage
{
    std::uint32_t mnWidth = 0;
    std::uint32_t mnHeight = 0;
    std::vector<double> mvdfSamples;

    double& At(std::uint32_t x, std::uint32_t y)
    {
        return mvdfSamples[std::size_t{y} * mnWidth + x];
    }
    double At(std::uint32_t x, std::uint32_t y) const
    {
        return mvdfSamples[std::size_t{y} * mnWidth + x];
    }
};

/// A rectangle of an image, in pixels.
struct Area
{
    std::uint32_t x = 0;
    std::uint32_t y = 0;
    std::uint32_t mnWidth = 0;
    std::uint32_t mnHeight = 0;
};

GreyImage Crop(const GreyImage& oImage, const Area& oArea);
/// One channel of a file; complex samples as intensities.
GreyImage ReadChannel(const std::string& oFile, unsigned int nChannel);
/// The image after a filter of filter_file with its words, such as {"window=7"}; beyond the edge
/// the nearest pixel counts. The first channel of what it gives.
GreyImage Filtered(const GreyImage& oImage, const std::string& oFilter,
                   const std::vector<std::string>& voWords);

/// The samples that are black and white in a picture.
struct Scale
{
    double mdfBlack = 0.0;
    double mdfWhite = 1.0;
};

/// From the 1 % to the 99 % sample.
Scale ScaleOf(const GreyImage& oImage);
/// Each pixel is drawn as nZoom x nZoom.
void WritePicture(const std::string& oFile, const GreyImage& oImage, const Scale& oScale,
                  std::uint32_t nZoom);
/// A channel of a picture in colour, with its scale.
struct Colour
{
    GreyImage moImage;
    Scale moScale;
};
/// Red, green and blue, each of the same size.
void WriteComposite(const std::string& oFile, const std::array<Colour, 3>& aoColours);

}  // namespace kor::gallery
