#pragma once

#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <cstring>
#include <initializer_list>
#include <memory>
#include <ostream>
#include <random>
#include <string>
#include <vector>

#include "basic/core/typedispatch/typelist.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"

/// Blocks for tests: drawn as they lie, filled at random, compared bit by bit.
namespace kor::test
{

struct Margins
{
    std::uint32_t x = 0;
    std::uint32_t y = 0;
};

/// Samples drawn row by row; with several channels those of a pixel stand side by side.
template <class T>
class Image
{
public:
    Image(std::initializer_list<std::initializer_list<T>> oRows)
        : mnColumns(oRows.size() == 0 ? 0 : oRows.begin()->size())
    {
        for (const auto& oRow : oRows)
        {
            EXPECT_EQ(oRow.size(), mnColumns) << "a row of another length";
            mvSamples.insert(mvSamples.end(), oRow.begin(), oRow.end());
        }
    }
    Image(std::size_t nColumns, std::vector<T> vSamples)
        : mnColumns(nColumns), mvSamples(std::move(vSamples))
    {
    }

    std::size_t Columns() const { return mnColumns; }
    std::size_t Rows() const { return mnColumns == 0 ? 0 : mvSamples.size() / mnColumns; }
    const std::vector<T>& Samples() const { return mvSamples; }
    bool operator==(const Image&) const = default;

    friend void PrintTo(const Image& oImage, std::ostream* poStream)
    {
        for (std::size_t i = 0; i < oImage.mvSamples.size(); ++i)
        {
            *poStream << (i % oImage.mnColumns == 0 ? "\n" : " ") << +oImage.mvSamples[i];
        }
    }

private:
    std::size_t mnColumns;
    std::vector<T> mvSamples;
};

/// A raster of the given size whose bytes, margins included, are all 0xA5.
inline std::unique_ptr<tessel::Raster> BlankRaster(std::uint32_t nWidth, std::uint32_t nHeight,
                                                   std::uint32_t nChannels,
                                                   const tessel::DataType& oType,
                                                   Margins oMargins = {})
{
    auto poRaster =
        std::make_unique<tessel::Raster>(tessel::RasterInfo(nWidth, nHeight, nChannels, oType),
                                         tessel::RasterContext(oMargins.x, oMargins.y, 0, 0));
    std::memset(poRaster->mpBuffer, 0xA5, poRaster->mnBufferSize);
    return poRaster;
}

/// The image as a raster; the outer rows and columns of the drawing are the margins.
template <class T>
std::unique_ptr<tessel::Raster> RasterOf(const Image<T>& oImage, Margins oMargins = {},
                                         std::uint32_t nChannels = 1)
{
    auto poRaster =
        BlankRaster(static_cast<std::uint32_t>(oImage.Columns()) / nChannels - 2 * oMargins.x,
                    static_cast<std::uint32_t>(oImage.Rows()) - 2 * oMargins.y, nChannels,
                    typedispatch::RealDataType<T>(), oMargins);
    std::memcpy(poRaster->mpBuffer, oImage.Samples().data(), poRaster->mnBufferSize);
    return poRaster;
}

/// The block without its margins.
template <class T>
Image<T> ImageOf(const tessel::Raster& oRaster)
{
    EXPECT_EQ(oRaster.moDataType, typedispatch::RealDataType<T>());
    const std::size_t nColumns = std::size_t{oRaster.mnWidth} * oRaster.mnChannels;
    std::vector<T> vSamples;
    for (std::uint32_t y = 0; y < oRaster.mnHeight; ++y)
    {
        const T* pRow = oRaster.GetPixelAs<T>(0, y);
        vSamples.insert(vSamples.end(), pRow, pRow + nColumns);
    }
    return Image<T>(nColumns, std::move(vSamples));
}

/// The drawing as a mask, 0 masked; the outer rows and columns are the margins.
inline std::unique_ptr<tessel::Mask> MaskOf(const Image<int>& oImage, Margins oMargins = {})
{
    std::vector<unsigned char> vBytes;
    for (const int nSample : oImage.Samples())
    {
        vBytes.push_back(nSample != 0 ? 1 : 0);
    }
    const tessel::RasterInfo oInfo(static_cast<std::uint32_t>(oImage.Columns()) - 2 * oMargins.x,
                                   static_cast<std::uint32_t>(oImage.Rows()) - 2 * oMargins.y, 1,
                                   tessel::eDT_8U);
    return std::make_unique<tessel::Mask>(
        oInfo, tessel::RasterContext(oMargins.x, oMargins.y, 0, 0), vBytes.data(), false, false);
}

/// True when the bit of pixel (x, y) is set: the plain way, for reference loops.
inline bool IsValid(const tessel::Mask* poMask, std::int64_t x, std::int64_t y)
{
    if (poMask == nullptr)
    {
        return true;
    }
    const std::int64_t nBit =
        (y + poMask->mnMarginY) * poMask->mnTotalWidth + x + poMask->mnMarginX;
    return ((poMask->moBits[static_cast<std::size_t>(nBit >> 3)] << (nBit & 7)) & 128) != 0;
}

using Random = std::mt19937_64;

/// A mask of the given geometry in which each pixel is valid with probability dfValid.
inline std::unique_ptr<tessel::Mask> RandomMask(std::uint32_t nWidth, std::uint32_t nHeight,
                                                Margins oMargins, double dfValid, Random& oRandom)
{
    std::bernoulli_distribution oValid(dfValid);
    std::vector<unsigned char> vBytes((std::size_t{nWidth} + 2 * oMargins.x) *
                                      (nHeight + 2 * oMargins.y));
    for (unsigned char& nByte : vBytes)
    {
        nByte = oValid(oRandom) ? 1 : 0;
    }
    return std::make_unique<tessel::Mask>(tessel::RasterInfo(nWidth, nHeight, 1, tessel::eDT_8U),
                                          tessel::RasterContext(oMargins.x, oMargins.y, 0, 0),
                                          vBytes.data(), false, false);
}

enum class Samples
{
    Ordinary,  ///< integers over their whole range, floating point between -1000 and 1000
    Special    ///< among them not a number, infinities, zeros of both signs, huge and tiny values
};

template <class T>
T RandomSample(Samples eSamples, Random& oRandom)
{
    if constexpr (std::is_floating_point_v<T>)
    {
        if (eSamples == Samples::Special && oRandom() % 4 == 0)
        {
            constexpr T kInfinity = std::numeric_limits<T>::infinity();
            constexpr T kSpecial[] = {std::numeric_limits<T>::quiet_NaN(),
                                      kInfinity,
                                      -kInfinity,
                                      T(0),
                                      -T(0),
                                      std::numeric_limits<T>::max(),
                                      std::numeric_limits<T>::denorm_min(),
                                      T(-1e-300),
                                      T(1e17)};
            return kSpecial[oRandom() % std::size(kSpecial)];
        }
        return std::uniform_real_distribution<T>(-1000, 1000)(oRandom);
    }
    else
    {
        return static_cast<T>(oRandom());
    }
}

/// Fills all samples of a raster, margins included.
inline void FillRandom(tessel::Raster& oRaster, Samples eSamples, Random& oRandom)
{
    using List = typedispatch::StandardTypeList;
    const auto oFill = [&]<class T>()
    {
        T* pSamples = reinterpret_cast<T*>(oRaster.mpBuffer);
        for (std::uint64_t i = 0; i < oRaster.mnBufferSize / sizeof(T); ++i)
        {
            pSamples[i] = RandomSample<T>(eSamples, oRandom);
        }
    };
    typedispatch::VisitType<List>(typedispatch::FindDataType<List>(oRaster.moDataType, true), oFill,
                                  [] { ADD_FAILURE() << "no samples of this type"; });
}

inline std::unique_ptr<tessel::Raster> RandomRaster(std::uint32_t nWidth, std::uint32_t nHeight,
                                                    std::uint32_t nChannels,
                                                    const tessel::DataType& oType, Margins oMargins,
                                                    Samples eSamples, Random& oRandom)
{
    auto poRaster = BlankRaster(nWidth, nHeight, nChannels, oType, oMargins);
    FillRandom(*poRaster, eSamples, oRandom);
    return poRaster;
}

/// Bit by bit; all NaNs count as equal.
template <class T>
bool SameSample(T a, T b)
{
    if constexpr (std::is_floating_point_v<T>)
    {
        if (std::isnan(a) || std::isnan(b))
        {
            return std::isnan(a) && std::isnan(b);
        }
    }
    return std::memcmp(&a, &b, sizeof(T)) == 0;
}

/// Compares all samples of two rasters of the same geometry, margins included.
inline ::testing::AssertionResult SameBits(const tessel::Raster& oActual,
                                           const tessel::Raster& oExpected)
{
    if (oActual.moDataType != oExpected.moDataType ||
        oActual.mnTotalWidth != oExpected.mnTotalWidth ||
        oActual.mnTotalHeight != oExpected.mnTotalHeight ||
        oActual.mnChannels != oExpected.mnChannels)
    {
        return ::testing::AssertionFailure() << "the rasters have another geometry or type";
    }
    auto oResult = ::testing::AssertionSuccess();
    const auto oCompare = [&]<class T>()
    {
        const T* pActual = reinterpret_cast<const T*>(oActual.mpBuffer);
        const T* pExpected = reinterpret_cast<const T*>(oExpected.mpBuffer);
        const std::uint64_t nRow = oActual.GetRowSamples();
        for (std::uint64_t i = 0; i < nRow * oActual.mnTotalHeight; ++i)
        {
            if (!SameSample(pActual[i], pExpected[i]))
            {
                oResult = ::testing::AssertionFailure()
                          << "sample " << i % nRow << " of row " << i / nRow
                          << " (margins counted) is " << +pActual[i] << " and not "
                          << +pExpected[i];
                return;
            }
        }
    };
    using List = typedispatch::StandardTypeList;
    typedispatch::VisitType<List>(typedispatch::FindDataType<List>(oActual.moDataType, true),
                                  oCompare, [] {});
    return oResult;
}

/// Calls oVisit<T>() for each of the ten element types.
template <class Visit>
void ForEachElementType(const Visit& oVisit)
{
    using List = typedispatch::StandardTypeList;
    for (std::size_t i = 0; i < 10; ++i)
    {
        typedispatch::VisitType<List>(i, oVisit, [] {});
    }
}

}  // namespace kor::test
