#include "processes/qrdfilters/stretchvalidity.h"

#include <algorithm>
#include <functional>
#include <span>

#include "processes/qrdfilters/findbyte.h"

namespace kor::filters
{

namespace
{

void AndBytes(const unsigned char* pBytes, std::span<unsigned char> oResult)
{
    std::transform(oResult.begin(), oResult.end(), pBytes, oResult.begin(), std::bit_and<>());
}

}  // namespace

StretchValidity::StretchValidity(const tessel::Mask* poMask, const Window& oWindow)
    : mpoMask(poMask), moWindow(oWindow)
{
}

void StretchValidity::MoveTo(std::int64_t x, std::int64_t y, std::size_t nPixels)
{
    if (mpoMask == nullptr)
    {
        return;
    }
    mnPitch = nPixels + moWindow.GetWidth() - 1;
    mvValid.resize(moWindow.GetHeight() * mnPitch);
    std::vector<unsigned char> vColumns(mnPitch, 1);
    for (std::size_t r = 0; r < moWindow.GetHeight(); ++r)
    {
        unsigned char* const pRow = &mvValid[r * mnPitch];
        const std::int64_t nRow = y - moWindow.mnHalfY + static_cast<std::int64_t>(r);
        mpoMask->ExpandRow(x - moWindow.mnHalfX, nRow, {pRow, mnPitch});
        AndBytes(pRow, vColumns);
    }
    mbAllValid = FindByte(vColumns, 0, 0) == mnPitch;
    mvWhole.assign(nPixels, 1);
    for (std::size_t k = 0; k < moWindow.GetWidth() && !mbAllValid; ++k)
    {
        AndBytes(vColumns.data() + k, mvWhole);
    }
}

}  // namespace kor::filters
