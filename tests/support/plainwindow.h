#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"
#include "processes/qrdfilters/window.h"

/// The sliding window as it is defined: plain loops over pixels, one after the other. Tests compare
/// the engine with it bit by bit, benchmarks measure against it.
namespace kor::test
{

/// What a window sums: kTerms values of each valid sample, and their number. Terms::Of(x) gives the
/// values as an array.
template <class Terms>
struct WindowSums
{
    using Values = decltype(Terms::Of(0.0));

    void Add(double dfSample)
    {
        const Values oValues = Terms::Of(dfSample);
        std::transform(moValues.begin(), moValues.end(), oValues.begin(), moValues.begin(),
                       std::plus<>());
        mdfCount += 1.0;
    }
    void Subtract(double dfSample)
    {
        const Values oValues = Terms::Of(dfSample);
        std::transform(moValues.begin(), moValues.end(), oValues.begin(), moValues.begin(),
                       std::minus<>());
        mdfCount -= 1.0;
    }
    WindowSums& operator+=(const WindowSums& oOther)
    {
        std::transform(moValues.begin(), moValues.end(), oOther.moValues.begin(), moValues.begin(),
                       std::plus<>());
        mdfCount += oOther.mdfCount;
        return *this;
    }
    WindowSums& operator-=(const WindowSums& oOther)
    {
        std::transform(moValues.begin(), moValues.end(), oOther.moValues.begin(), moValues.begin(),
                       std::minus<>());
        mdfCount -= oOther.mdfCount;
        return *this;
    }

    Values moValues{};
    double mdfCount = 0.0;
};

/// Sum of squares, then sum.
struct MomentTerms
{
    static std::array<double, 2> Of(double x) { return {x * x, x}; }
};

struct SumTerm
{
    static std::array<double, 1> Of(double x) { return {x}; }
};

/// Filters blocks of TSample by the sums of Terms. Finish(sums, centre) gives the result as double.
template <class TSample, class Terms, class Finish>
class PlainWindowFilter
{
public:
    PlainWindowFilter(const tessel::Raster& oIn, const tessel::Mask* poMaskIn,
                      const filters::Window& oWindow, bool bBGZero, const Finish& oFinish,
                      tessel::Raster& oOut, const tessel::Mask* poMaskOut)
        : moIn(oIn),
          mpoValid(poMaskIn != nullptr ? poMaskIn->CreateRaster() : nullptr),
          mnHalfX(oWindow.mnHalfX),
          mnHalfY(oWindow.mnHalfY),
          mbBGZero(bBGZero),
          moFinish(oFinish),
          moOut(oOut),
          mpoWanted(poMaskOut != nullptr ? poMaskOut->CreateRaster() : nullptr),
          mvoColumns((oIn.mnWidth + 2 * std::size_t{oWindow.mnHalfX}) * oIn.mnChannels),
          mvoRunning(oIn.mnChannels)
    {
    }

    void Run()
    {
        for (std::int64_t x = -mnHalfX; x < moIn.mnWidth + mnHalfX; ++x)
        {
            for (std::int64_t y = -mnHalfY; y <= mnHalfY; ++y)
            {
                AddPixel(x, y);
            }
        }
        for (std::int64_t x = 0; x < moIn.mnWidth; ++x)
        {
            SumWindow(x);
            WritePixel(x, 0);
        }
        for (std::int64_t y = 1; y < moIn.mnHeight; ++y)
        {
            RunRow(y);
        }
    }

private:
    using Sums = WindowSums<Terms>;

    Sums* Column(std::int64_t x)
    {
        return &mvoColumns[static_cast<std::size_t>(x + mnHalfX) * moIn.mnChannels];
    }

    static bool IsSet(const std::unique_ptr<tessel::Raster>& poBytes, std::int64_t x,
                      std::int64_t y)
    {
        return poBytes == nullptr || *poBytes->GetPixel(x, y) != 0;
    }

    void AddPixel(std::int64_t x, std::int64_t y)
    {
        if (IsSet(mpoValid, x, y))
        {
            const TSample* pIn = moIn.GetPixelAs<const TSample>(x, y);
            Sums* poColumn = Column(x);
            for (std::size_t c = 0; c < mvoRunning.size(); ++c)
            {
                poColumn[c].Add(static_cast<double>(pIn[c]));
            }
        }
    }

    void SubtractPixel(std::int64_t x, std::int64_t y)
    {
        if (IsSet(mpoValid, x, y))
        {
            const TSample* pIn = moIn.GetPixelAs<const TSample>(x, y);
            Sums* poColumn = Column(x);
            for (std::size_t c = 0; c < mvoRunning.size(); ++c)
            {
                poColumn[c].Subtract(static_cast<double>(pIn[c]));
            }
        }
    }

    void SumWindow(std::int64_t x)
    {
        std::fill(mvoRunning.begin(), mvoRunning.end(), Sums());
        for (std::int64_t i = x - mnHalfX; i <= x + mnHalfX; ++i)
        {
            const Sums* poColumn = Column(i);
            for (std::size_t c = 0; c < mvoRunning.size(); ++c)
            {
                mvoRunning[c] += poColumn[c];
            }
        }
    }

    void RunRow(std::int64_t y)
    {
        for (std::int64_t x = -mnHalfX; x < moIn.mnWidth + mnHalfX; ++x)
        {
            SubtractPixel(x, y - mnHalfY - 1);
            AddPixel(x, y + mnHalfY);
        }
        SumWindow(0);
        WritePixel(0, y);
        for (std::int64_t x = 1; x < moIn.mnWidth; ++x)
        {
            const Sums* poLeaving = Column(x - mnHalfX - 1);
            const Sums* poEntering = Column(x + mnHalfX);
            for (std::size_t c = 0; c < mvoRunning.size(); ++c)
            {
                mvoRunning[c] -= poLeaving[c];
                mvoRunning[c] += poEntering[c];
            }
            WritePixel(x, y);
        }
    }

    void WritePixel(std::int64_t x, std::int64_t y)
    {
        const TSample* pIn = moIn.GetPixelAs<const TSample>(x, y);
        TSample* pOut = moOut.GetPixelAs<TSample>(x, y);
        if (!IsSet(mpoValid, x, y) || !IsSet(mpoWanted, x, y))
        {
            for (std::size_t c = 0; c < mvoRunning.size(); ++c)
            {
                pOut[c] = mbBGZero ? TSample(0) : pIn[c];
            }
            return;
        }
        for (std::size_t c = 0; c < mvoRunning.size(); ++c)
        {
            pOut[c] = static_cast<TSample>(moFinish(mvoRunning[c], static_cast<double>(pIn[c])));
        }
    }

    const tessel::Raster& moIn;
    std::unique_ptr<tessel::Raster> mpoValid;
    std::int64_t mnHalfX;
    std::int64_t mnHalfY;
    bool mbBGZero;
    const Finish& moFinish;
    tessel::Raster& moOut;
    std::unique_ptr<tessel::Raster> mpoWanted;
    std::vector<Sums> mvoColumns;
    std::vector<Sums> mvoRunning;
};

template <class TSample, class Terms, class Finish>
void FilterPlainly(const tessel::Raster& oIn, const tessel::Mask* poMaskIn,
                   const filters::Window& oWindow, bool bBGZero, const Finish& oFinish,
                   tessel::Raster& oOut, const tessel::Mask* poMaskOut)
{
    PlainWindowFilter<TSample, Terms, Finish>(oIn, poMaskIn, oWindow, bBGZero, oFinish, oOut,
                                              poMaskOut)
        .Run();
}

}  // namespace kor::test
