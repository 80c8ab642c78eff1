#pragma once

#include <algorithm>
#include <cstdint>
#include <vector>

namespace kor::filters::simulation
{

/// What the scan has met so far on each line, from near to far: the largest look angle and the
/// largest ground range. A line beyond the tables reads 0 and is not kept.
class LineMaxima
{
public:
    LineMaxima(std::int64_t nDemWidth, double dfNearRange)
        : mvfLook(static_cast<std::size_t>(kKept * nDemWidth), 0.0F),
          mvfRange(static_cast<std::size_t>(kKept * nDemWidth), 0.0F)
    {
        // Meant: the lines behind these start at a range of 0.
        std::fill_n(mvfRange.begin(), kStarted * nDemWidth, static_cast<float>(dfNearRange));
    }

    static double GetBytes(std::int64_t nDemWidth)
    {
        return 2.0 * sizeof(float) * kKept * static_cast<double>(nDemWidth);
    }

    /// True when a point nearer on the line, counted from 1, was seen under a larger look angle.
    bool IsInShadow(std::int64_t nLine, double dfLook)
    {
        float* pMaximum = Find(mvfLook, nLine);
        if ((pMaximum != nullptr ? static_cast<double>(*pMaximum) : 0.0) > dfLook)
        {
            return true;
        }
        if (pMaximum != nullptr)
        {
            *pMaximum = static_cast<float>(dfLook);
        }
        return false;
    }

    /// True when a point before on the line fell farther by half a pixel at least.
    bool IsInLayover(std::int64_t nLine, double dfRange, double dfHalfPixel)
    {
        float* pMaximum = Find(mvfRange, nLine);
        const double dfMaximum = pMaximum != nullptr ? static_cast<double>(*pMaximum) : 0.0;
        if (dfMaximum - dfHalfPixel >= dfRange)
        {
            return true;
        }
        if (pMaximum != nullptr && dfRange > dfMaximum)
        {
            *pMaximum = static_cast<float>(dfRange);
        }
        return false;
    }

private:
    static constexpr std::int64_t kKept = 16;    ///< lines for each DEM column
    static constexpr std::int64_t kStarted = 4;  ///< those that start at the near range

    static float* Find(std::vector<float>& vfMaxima, std::int64_t nLine)
    {
        const auto nPlace = static_cast<std::uint64_t>(nLine - 1);
        return nPlace < vfMaxima.size() ? &vfMaxima[nPlace] : nullptr;
    }

    std::vector<float> mvfLook;
    std::vector<float> mvfRange;
};

}  // namespace kor::filters::simulation
