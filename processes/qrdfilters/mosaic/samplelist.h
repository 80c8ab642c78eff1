#pragma once

#include <cstddef>
#include <cstdint>
#include <limits>
#include <memory>
#include <span>

#include "basic/tessel/raster/raster.h"

namespace kor::filters
{

/// The extremes of what was seen. Starts as the empty range, each end at the far end of double.
struct SampleRange
{
    /// Not a number is passed over.
    void Widen(double x)
    {
        mdfLowest = x < mdfLowest ? x : mdfLowest;
        mdfHighest = x > mdfHighest ? x : mdfHighest;
    }
    void Widen(const SampleRange& oOther)
    {
        mdfLowest = oOther.mdfLowest < mdfLowest ? oOther.mdfLowest : mdfLowest;
        mdfHighest = oOther.mdfHighest > mdfHighest ? oOther.mdfHighest : mdfHighest;
    }
    bool IsEmpty() const { return mdfLowest > mdfHighest; }

    double mdfLowest = std::numeric_limits<double>::max();
    double mdfHighest = std::numeric_limits<double>::lowest();
};

/// Samples of one element type, gathered from the first channel of rasters of that type. The type
/// is chosen when the list is made; pixel loops stand behind its methods, one virtual call a row.
class ISampleList
{
public:
    virtual ~ISampleList() = default;

    /// An empty list of the same type.
    virtual std::unique_ptr<ISampleList> MakeEmpty() const = 0;

    /// Clears oTaken[x] where the sample at (x, y) equals dfNoData, which loses its fraction in an
    /// integer type. A value that the type cannot hold equals nothing.
    virtual void DropNoData(const tessel::Raster& oRaster, std::uint32_t y, double dfNoData,
                            std::span<unsigned char> oTaken) const = 0;
    /// Widens oRange by the samples at (x, y) where oTaken[x] is set.
    virtual void FindRange(const tessel::Raster& oRaster, std::uint32_t y,
                           std::span<const unsigned char> oTaken, SampleRange& oRange) const = 0;

    /// Appends for each x with oTaken[x] set the mean of the samples at (x, y), (x + 1, y),
    /// (x, y + 1) and (x + 1, y + 1), added in this order: in the type of the sample, integers with
    /// a sum of 64 bits that is divided by 4 and cut.
    virtual void AppendMeans(const tessel::Raster& oRaster, std::uint32_t y,
                             std::span<const unsigned char> oTaken) = 0;
    /// Appends the samples of a list of the same type.
    virtual void Append(const ISampleList& oOther) = 0;

    virtual std::size_t GetCount() const = 0;
    virtual double GetSample(std::size_t i) const = 0;
    /// True when two samples differ, which 64-bit ones may do that are equal as double.
    virtual bool Differ(std::size_t i, std::size_t j) const = 0;
    virtual SampleRange GetRange() const = 0;
    /// Sample number nRank in ascending order, counted from 0 (see Ascending). Puts the list in
    /// another order.
    virtual double TakeRanked(std::size_t nRank) = 0;
};

/// An empty list for element type T, one of the ten.
template <class T>
std::unique_ptr<ISampleList> MakeSampleList();

}  // namespace kor::filters
