#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <vector>

#include "basic/tessel/raster/raster.h"
#include "processes/qrdfilters/mosaic/colourbalance.h"

namespace kor::filters
{

/// A bend in the brightness curve: for mdfStart < t < mdfHigh, t becomes
/// (t - mdfLow)^2 / (mdfHigh - mdfLow) + mdfLow.
struct SoftKnee
{
    double mdfHigh;
    double mdfLow;
    double mdfStart;
};

/// How a block is written onto a mosaic.
struct WriteRules
{
    BalanceLine moLine;
    std::optional<SoftKnee> moKnee;
    int mnBlendWidth;                     ///< pixels
    std::optional<float> mfInputNoData;   ///< input samples that are not copied
    std::optional<float> mfOutputNoData;  ///< output samples not blended with, and never written
};

/// Writes rows of a block onto a mosaic. Types are met where samples are loaded and stored, between
/// them all is double and float. Holds the memory that one thread works in.
class RowWriter
{
public:
    /// Two blocks of one size and number of channels, whose element types stand at the positions
    /// nIn and nOut of StandardTypeList. Borrows the rules and the blocks.
    RowWriter(const WriteRules& oRules, std::size_t nIn, std::size_t nOut,
              const tessel::Raster& oIn, const tessel::Raster& oOut);

    /// oDistances: of the row's pixels from the valid area, in pixels.
    void WriteRow(std::uint32_t y, std::span<const std::uint32_t> oDistances);

private:
    void WritePart(const unsigned char* pIn, unsigned char* pOut,
                   std::span<const std::uint32_t> oDistances);
    void FindFates(const unsigned char* pIn, std::span<const std::uint32_t> oDistances);
    void Balance(const unsigned char* pIn);
    void Blend(const unsigned char* pOut, std::span<const std::uint32_t> oDistances);
    void Store(unsigned char* pOut) const;
    void MoveOffNoData(unsigned char* pOut);

    const WriteRules& moRules;
    const tessel::Raster& moIn;
    const tessel::Raster& moOut;
    std::size_t mnIn;
    std::size_t mnOut;
    std::size_t mnChannels;
    std::size_t mnElementBytesOut;

    // Of the part of a row that is being written, a sample each.
    std::vector<double> mvdfIn;
    std::vector<float> mvfNew;
    std::vector<float> mvfOther;  ///< what is compared or blended with
    std::vector<unsigned char> mvnFates;
};

}  // namespace kor::filters
