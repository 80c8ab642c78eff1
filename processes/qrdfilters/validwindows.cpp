#include "processes/qrdfilters/validwindows.h"

#include <algorithm>
#include <vector>

namespace kor::filters
{

namespace
{

void AndRow(const unsigned char* pRow, std::span<unsigned char> oResult)
{
    for (std::size_t i = 0; i < oResult.size(); ++i)
    {
        oResult[i] &= pRow[i];
    }
}

}  // namespace

void FindWholeWindows(const tessel::Raster& oValid, std::size_t nHalfX, std::size_t nHalfY,
                      std::int64_t x, std::int64_t y, std::span<unsigned char> oWhole)
{
    const auto nAbove = static_cast<std::int64_t>(nHalfY);
    const auto nLeft = static_cast<std::int64_t>(nHalfX);
    std::vector<unsigned char> vColumns(oWhole.size() + 2 * nHalfX, 1);
    for (std::int64_t r = y - nAbove; r <= y + nAbove; ++r)
    {
        AndRow(oValid.GetPixel(x - nLeft, r), vColumns);
    }
    std::fill(oWhole.begin(), oWhole.end(), static_cast<unsigned char>(1));
    for (std::size_t k = 0; k <= 2 * nHalfX; ++k)
    {
        AndRow(vColumns.data() + k, oWhole);
    }
}

}  // namespace kor::filters
