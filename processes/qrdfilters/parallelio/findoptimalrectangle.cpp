#include "processes/qrdfilters/parallelio/findoptimalrectangle.h"

#include <algorithm>
#include <cmath>

#include "platform/exception/exception.h"

namespace kor::parallelio
{

namespace
{

/// An image and its tiles, in pixels.
struct Layout
{
    explicit Layout(const datasources::IRasterAccess& oAccess)
        : mnWidth(oAccess.GetWidth()),
          mnHeight(oAccess.GetHeight()),
          mnTileWidth(std::max(1U, oAccess.GetTileWidth())),
          mnTileHeight(std::max(1U, oAccess.GetTileHeight()))
    {
    }

    bool IsTiled() const { return mnTileWidth != mnWidth || mnTileHeight != mnHeight; }
    std::uint64_t GetTileArea() const { return mnTileWidth * mnTileHeight; }

    std::uint64_t mnWidth;
    std::uint64_t mnHeight;
    std::uint64_t mnTileWidth;
    std::uint64_t mnTileHeight;
};

struct Shape
{
    std::uint64_t mnWidth;
    std::uint64_t mnHeight;
};

/// A group of whole tiles, or one strip of a tile that is too large.
Shape GroupOfTiles(const Layout& oSource, const Layout& oOutput, std::uint64_t nMaxPixels)
{
    if (oOutput.GetTileArea() > nMaxPixels)
    {
        return {oOutput.mnTileWidth, std::max<std::uint64_t>(1, nMaxPixels / oOutput.mnTileWidth)};
    }
    const std::uint64_t nArea = std::max(oSource.GetTileArea(), oOutput.GetTileArea());
    const std::uint64_t nTiles = std::max<std::uint64_t>(1, nMaxPixels / nArea);
    auto nDown = static_cast<std::uint64_t>(std::sqrt(static_cast<float>(nTiles)));
    std::uint64_t nAcross = nTiles / nDown;
    if (nAcross * oOutput.mnTileWidth > oOutput.mnWidth)
    {
        nAcross = (oOutput.mnWidth + oOutput.mnTileWidth - 1) / oOutput.mnTileWidth;
        nDown = nTiles / nAcross;
    }
    return {std::max<std::uint64_t>(1, nAcross * oOutput.mnTileWidth),
            std::max<std::uint64_t>(1, nDown * oOutput.mnTileHeight)};
}

/// Strips of the output's width. nSourceWidth is that of the source within the window.
Shape Strip(const Layout& oSource, bool bSourceTiled, std::uint64_t nSourceWidth,
            const Layout& oOutput, std::uint64_t nMaxPixels)
{
    const std::uint64_t nWider = std::max(nSourceWidth, oOutput.mnWidth);
    if (nWider >= nMaxPixels)
    {
        return {oOutput.mnWidth, 1};
    }
    std::uint64_t nHeight = nMaxPixels / nWider;
    if (oOutput.mnWidth != nWider)
    {
        nHeight = static_cast<std::uint64_t>(static_cast<double>(nHeight) *
                                             static_cast<double>(oOutput.mnWidth) /
                                             static_cast<double>(nSourceWidth));
        nHeight = std::max<std::uint64_t>(1, nHeight);
    }
    const bool bOutputTiled = oOutput.IsTiled();
    if (!bSourceTiled && bOutputTiled && nHeight > oOutput.mnTileHeight)
    {
        nHeight = nHeight / oOutput.mnTileHeight * oOutput.mnTileHeight;
    }
    if (bSourceTiled && !bOutputTiled && nHeight > oSource.mnTileHeight)
    {
        nHeight = nHeight / oSource.mnTileHeight * oSource.mnTileHeight;
    }
    return {oOutput.mnWidth, nHeight};
}

}  // namespace

void FindOptimalRasterSize(datasources::IRasterReader* poReader,
                           datasources::IRasterWriter* poWriter, unsigned int nMaxPixels,
                           unsigned int& nWidth, unsigned int& nHeight,
                           const ProcessWindow& oWindow)
{
    const datasources::IRasterAccess* poSource = poReader;
    if (poSource == nullptr)
    {
        poSource = poWriter;
    }
    Layout oSource(*poSource);
    const bool bSourceTiled = oSource.IsTiled();
    if (oWindow.mnWidth != 0 && oWindow.mnHeight != 0)
    {
        oSource.mnWidth = std::min<std::uint64_t>(oSource.mnWidth, oWindow.mnWidth);
        oSource.mnHeight = std::min<std::uint64_t>(oSource.mnHeight, oWindow.mnHeight);
    }
    const Layout oOutput = poWriter != nullptr ? Layout(*poWriter) : oSource;
    if (oSource.mnWidth == 0 || oSource.mnHeight == 0 || oOutput.mnWidth == 0 ||
        oOutput.mnHeight == 0)
    {
        throw Exception("Raster size is 0!", "processes/qrdfilters/parallelio/findoptimalrectangle",
                        "void FindOptimalRasterSize(IRasterReader*, IRasterWriter*, unsigned int, "
                        "unsigned int&, unsigned int&, const ProcessWindow&)",
                        46);
    }
    Shape oShape{oOutput.mnWidth, oOutput.mnHeight};
    if (std::max(oSource.mnWidth, oOutput.mnWidth) * std::max(oSource.mnHeight, oOutput.mnHeight) >=
        nMaxPixels)
    {
        const bool bTiles = bSourceTiled && (poWriter == nullptr || oOutput.IsTiled());
        oShape = bTiles ? GroupOfTiles(oSource, oOutput, nMaxPixels)
                        : Strip(oSource, bSourceTiled, oSource.mnWidth, oOutput, nMaxPixels);
    }
    nWidth = static_cast<unsigned int>(oShape.mnWidth);
    nHeight = static_cast<unsigned int>(oShape.mnHeight);
}

}  // namespace kor::parallelio
