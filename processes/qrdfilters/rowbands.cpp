#include "processes/qrdfilters/rowbands.h"

#include <algorithm>
#include <atomic>
#include <exception>

#include "platform/system/omp.h"

namespace kor::filters
{

namespace
{

/// Keeps the first exception of a parallel region, since none may leave it.
class FirstError
{
public:
    template <class Work>
    void Guard(const Work& oWork) noexcept
    {
        if (mbFailed.load(std::memory_order_relaxed))
        {
            return;
        }
        try
        {
            oWork();
        }
        catch (...)
        {
            if (!mbFailed.exchange(true))
            {
                mpoError = std::current_exception();
            }
        }
    }

    void Rethrow() const
    {
        if (mpoError != nullptr)
        {
            std::rethrow_exception(mpoError);
        }
    }

private:
    std::atomic<bool> mbFailed = false;
    std::exception_ptr mpoError;
};

}  // namespace

void ForEachRowBand(std::uint32_t nRows, std::uint32_t nMostRows,
                    const std::function<void(std::uint32_t, std::uint32_t)>& oWork)
{
    const std::int64_t nSteps = OMPGetMaxThreads() * std::int64_t{kBandStep};
    const std::int64_t nShare = (nRows + nSteps - 1) / nSteps * kBandStep;
    const std::int64_t nBandRows = std::clamp<std::int64_t>(nShare, kBandStep, nMostRows);
    const std::int64_t nBands = (nRows + nBandRows - 1) / nBandRows;
    FirstError oError;
#pragma omp parallel for schedule(static) if (nBands > 1)
    for (std::int64_t nBand = 0; nBand < nBands; ++nBand)
    {
        const std::int64_t nFirst = nBand * nBandRows;
        const std::int64_t nEnd = std::min<std::int64_t>(nFirst + nBandRows, nRows);
        oError.Guard(
            [&] { oWork(static_cast<std::uint32_t>(nFirst), static_cast<std::uint32_t>(nEnd)); });
    }
    oError.Rethrow();
}

}  // namespace kor::filters
