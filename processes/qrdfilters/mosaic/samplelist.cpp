#include "processes/qrdfilters/mosaic/samplelist.h"

#include <algorithm>
#include <cmath>
#include <optional>
#include <vector>

#include "processes/qrdfilters/mosaic/ascending.h"
#include "processes/qrdfilters/sampleconversion.h"

namespace kor::filters
{

namespace
{

/// dfValue as a sample of T by the language's own conversion; none where T cannot hold it.
template <class T>
std::optional<T> Narrow(double dfValue)
{
    if constexpr (std::is_floating_point_v<T>)
    {
        const auto x = static_cast<T>(dfValue);
        return std::isinf(x) && !std::isinf(dfValue) ? std::nullopt : std::optional<T>(x);
    }
    else
    {
        // Powers of two, which double holds for the 64-bit types as well.
        constexpr int kDigits = std::numeric_limits<T>::digits;
        const double dfWhole = std::trunc(dfValue);
        const double dfEnd = std::ldexp(1.0, kDigits);
        const double dfLowest = std::is_signed_v<T> ? -dfEnd : 0.0;
        return dfWhole >= dfLowest && dfWhole < dfEnd ? std::optional<T>(static_cast<T>(dfWhole))
                                                      : std::nullopt;
    }
}

/// Integers add without overflow: in 64 bits, which wrap where four samples of 64 bits are more.
template <class T>
T MeanOfFour(T a, T b, T c, T d)
{
    if constexpr (std::is_floating_point_v<T>)
    {
        return (a + b + c + d) * T(0.25);
    }
    else
    {
        using Sum = std::conditional_t<std::is_signed_v<T>, int64, uint64>;
        const auto nSum = static_cast<uint64>(a) + static_cast<uint64>(b) + static_cast<uint64>(c) +
                          static_cast<uint64>(d);
        return static_cast<T>(static_cast<Sum>(nSum) / 4);
    }
}

/// T is an arithmetic type: signed char for samples of type char.
template <class T>
class SampleList : public ISampleList
{
public:
    std::unique_ptr<ISampleList> MakeEmpty() const override
    {
        return std::make_unique<SampleList>();
    }

    void DropNoData(const tessel::Raster& oRaster, std::uint32_t y, double dfNoData,
                    std::span<unsigned char> oTaken) const override
    {
        const std::optional<T> oNoData = Narrow<T>(dfNoData);
        if (!oNoData)
        {
            return;
        }
        const T* pSample = oRaster.GetPixelAs<const T>(0, y);
        for (unsigned char& nTaken : oTaken)
        {
            nTaken &= static_cast<unsigned char>(!(*pSample == *oNoData));
            pSample += oRaster.mnChannels;
        }
    }

    void FindRange(const tessel::Raster& oRaster, std::uint32_t y,
                   std::span<const unsigned char> oTaken, SampleRange& oRange) const override
    {
        const T* pSample = oRaster.GetPixelAs<const T>(0, y);
        for (const unsigned char nTaken : oTaken)
        {
            if (nTaken != 0)
            {
                oRange.Widen(ConvertSample<T, double>(*pSample));
            }
            pSample += oRaster.mnChannels;
        }
    }

    void AppendMeans(const tessel::Raster& oRaster, std::uint32_t y,
                     std::span<const unsigned char> oTaken) override
    {
        const std::size_t nRight = oRaster.mnChannels;
        const T* pTop = oRaster.GetPixelAs<const T>(0, y);
        const T* pBottom = oRaster.GetPixelAs<const T>(0, std::int64_t{y} + 1);
        for (std::size_t x = 0; x < oTaken.size(); ++x)
        {
            if (oTaken[x] != 0)
            {
                const std::size_t i = x * nRight;
                mvSamples.push_back(
                    MeanOfFour<T>(pTop[i], pTop[i + nRight], pBottom[i], pBottom[i + nRight]));
            }
        }
    }

    void Append(const ISampleList& oOther) override
    {
        const auto& vSamples = dynamic_cast<const SampleList&>(oOther).mvSamples;
        mvSamples.insert(mvSamples.end(), vSamples.begin(), vSamples.end());
    }

    std::size_t GetCount() const override { return mvSamples.size(); }
    double GetSample(std::size_t i) const override
    {
        return ConvertSample<T, double>(mvSamples[i]);
    }
    bool Differ(std::size_t i, std::size_t j) const override
    {
        return mvSamples[i] != mvSamples[j];
    }

    SampleRange GetRange() const override
    {
        SampleRange oRange;
        for (const T x : mvSamples)
        {
            oRange.Widen(ConvertSample<T, double>(x));
        }
        return oRange;
    }

    double TakeRanked(std::size_t nRank) override
    {
        const auto itRank = mvSamples.begin() + static_cast<std::ptrdiff_t>(nRank);
        std::nth_element(mvSamples.begin(), itRank, mvSamples.end(), Ascending());
        return ConvertSample<T, double>(*itRank);
    }

private:
    std::vector<T> mvSamples;
};

}  // namespace

template <class T>
std::unique_ptr<ISampleList> MakeSampleList()
{
    return std::make_unique<SampleList<Arithmetic<T>>>();
}

template std::unique_ptr<ISampleList> MakeSampleList<char>();
template std::unique_ptr<ISampleList> MakeSampleList<unsigned char>();
template std::unique_ptr<ISampleList> MakeSampleList<short>();
template std::unique_ptr<ISampleList> MakeSampleList<unsigned short>();
template std::unique_ptr<ISampleList> MakeSampleList<int>();
template std::unique_ptr<ISampleList> MakeSampleList<unsigned int>();
template std::unique_ptr<ISampleList> MakeSampleList<float>();
template std::unique_ptr<ISampleList> MakeSampleList<double>();
template std::unique_ptr<ISampleList> MakeSampleList<int64>();
template std::unique_ptr<ISampleList> MakeSampleList<uint64>();

}  // namespace kor::filters
