#include "processes/qrdfilters/kernels/touzirow.h"

#include "processes/qrdfilters/kernels/targets.h"

#include <algorithm>

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "processes/qrdfilters/kernels/touzirow.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

HWY_BEFORE_NAMESPACE();
namespace kor::filters::kernels::HWY_NAMESPACE
{

namespace hn = hwy::HWY_NAMESPACE;

// One lane, one pixel: all lanes go through the decisions together, each with its own answers, and
// a step that no lane needs is left out. Sums are float and added in row order; all else is double.
using Doubles = hn::CappedTag<double, 8>;
using Floats = hn::Rebind<float, Doubles>;
using Vector = hn::Vec<Doubles>;
using FloatVector = hn::Vec<Floats>;
using Lanes = hn::Mask<Doubles>;
constexpr Doubles kTag;
constexpr Floats kFloatTag;
constexpr std::size_t kLanes = hn::MaxLanes(kTag);

enum Direction
{
    ROW = 1,
    COLUMN = 2,
    DIAGONAL = 3,     ///< dy = dx
    ANTIDIAGONAL = 4  ///< dy = -dx
};

HWY_INLINE Vector Constant(double dfValue)
{
    return hn::Set(kTag, dfValue);
}

HWY_INLINE Lanes NoLanes()
{
    return hn::MaskFromVec(hn::Zero(kTag));
}

HWY_INLINE bool IsAny(Lanes oLanes)
{
    return !hn::AllFalse(kTag, oLanes);
}

/// A mean of a float sum.
HWY_INLINE Vector Mean(FloatVector oSum, double dfCount)
{
    return hn::Div(hn::PromoteTo(kTag, oSum), Constant(dfCount));
}

/// The neighbourhoods of a vector of pixels.
class Neighbours
{
public:
    Neighbours(const TouziRows& oRows, const TouziThresholds& oThresholds, std::size_t nFirst)
        : mpSamples(oRows.moSamples.data() + oRows.mnReach),
          mpSquares(oRows.moSquares.data() + oRows.mnReach),
          mnMargin(oThresholds.mnMargin),
          mnFirst(static_cast<std::ptrdiff_t>(nFirst))
    {
    }

    HWY_INLINE FloatVector Sample(int dy, int dx) const
    {
        return hn::LoadU(kFloatTag, mpSamples[dy] + mnFirst + dx);
    }
    HWY_INLINE FloatVector Square(int dy, int dx) const
    {
        return hn::LoadU(kFloatTag, mpSquares[dy] + mnFirst + dx);
    }
    int GetMargin() const { return mnMargin; }

private:
    const float* const* mpSamples;
    const float* const* mpSquares;
    int mnMargin;
    std::ptrdiff_t mnFirst;
};

/// Columns of one row of a window, none where the first lies behind the last.
struct Columns
{
    int mnFirst;
    int mnLast;
};

/// Sum of the samples of one row, added to what is there.
HWY_INLINE void AddRow(const Neighbours& oPixels, int dy, Columns oColumns, FloatVector& oSum)
{
    for (int dx = oColumns.mnFirst; dx <= oColumns.mnLast; ++dx)
    {
        oSum = hn::Add(oSum, oPixels.Sample(dy, dx));
    }
}

/// Mean and variation coefficient of a window.
struct Variation
{
    Vector moMean;
    Vector moCv;
};

struct Moments
{
    // A constructor that the compiler writes itself would not be compiled for the target.
    HWY_INLINE Moments() : moSum(hn::Zero(kFloatTag)), moSquares(hn::Zero(kFloatTag)) {}

    FloatVector moSum;
    FloatVector moSquares;

    HWY_INLINE void AddRow(const Neighbours& oPixels, int dy, Columns oColumns)
    {
        for (int dx = oColumns.mnFirst; dx <= oColumns.mnLast; ++dx)
        {
            moSum = hn::Add(moSum, oPixels.Sample(dy, dx));
            moSquares = hn::Add(moSquares, oPixels.Square(dy, dx));
        }
    }

    HWY_INLINE Variation GetVariation(double dfCount) const
    {
        const Vector oMean = Mean(moSum, dfCount);
        const Vector oVariance = hn::Sub(Mean(moSquares, dfCount), hn::Mul(oMean, oMean));
        const Vector oCv = hn::Div(hn::Sqrt(oVariance), oMean);
        return {oMean, hn::IfThenZeroElse(hn::Eq(oMean, hn::Zero(kTag)), oCv)};
    }
};

/// The window is cut at the margin; the count it is divided by is not.
Variation WindowVariation(const Neighbours& oPixels, int nSize)
{
    const int nHalf = std::min((nSize - 1) / 2, oPixels.GetMargin());
    Moments oMoments;
    for (int dy = -nHalf; dy <= nHalf; ++dy)
    {
        oMoments.AddRow(oPixels, dy, {-nHalf, nHalf});
    }
    return oMoments.GetVariation(static_cast<double>(nSize) * nSize);
}

/// The columns of row dy that lie on one side of the line through the centre, the line included.
Columns HalfOfRow(int nDirection, int nSide, int dy, int nHalf)
{
    const bool bFirst = nSide == 1;
    switch (nDirection)
    {
        case ROW:
            return (bFirst ? dy <= 0 : dy >= 0) ? Columns{-nHalf, nHalf} : Columns{0, -1};
        case COLUMN:
            return bFirst ? Columns{-nHalf, 0} : Columns{0, nHalf};
        case DIAGONAL:
            return bFirst ? Columns{-nHalf, dy} : Columns{dy, nHalf};
        default:
            return bFirst ? Columns{-nHalf, -dy} : Columns{-dy, nHalf};
    }
}

Variation HalfWindowVariation(const Neighbours& oPixels, int nSize, int nDirection, int nSide)
{
    const int nHalf = std::min((nSize - 1) / 2, oPixels.GetMargin());
    Moments oMoments;
    for (int dy = -nHalf; dy <= nHalf; ++dy)
    {
        oMoments.AddRow(oPixels, dy, HalfOfRow(nDirection, nSide, dy, nHalf));
    }
    return oMoments.GetVariation(((nSize - 1) / 2 + 1.0) * nSize);
}

/// The direction with the smallest ratio, and how far the ratios lie apart. No direction is 0: that
/// of a window in which no ratio is a number.
struct Detection
{
    HWY_INLINE Detection()
        : moBest(Constant(1.0)),
          moWorst(hn::Zero(kTag)),
          moDirection(hn::Zero(kTag)),
          moFirstMean(hn::Zero(kTag)),
          moSecondMean(hn::Zero(kTag))
    {
    }

    Vector moBest;
    Vector moWorst;
    Vector moDirection;
    Vector moFirstMean;   ///< of the line, or of the first side of an edge
    Vector moSecondMean;  ///< of the second side

    HWY_INLINE void Take(int nDirection, Vector oRatio, Vector oFirst, Vector oSecond)
    {
        // A tie goes to the later direction.
        const auto oBetter = hn::Le(oRatio, moBest);
        moBest = hn::IfThenElse(oBetter, oRatio, moBest);
        moDirection = hn::IfThenElse(oBetter, Constant(nDirection), moDirection);
        moFirstMean = hn::IfThenElse(oBetter, oFirst, moFirstMean);
        moSecondMean = hn::IfThenElse(oBetter, oSecond, moSecondMean);
        moWorst = hn::IfThenElse(hn::Le(moWorst, oRatio), oRatio, moWorst);
    }

    HWY_INLINE Vector GetSpread() const { return hn::Sub(moWorst, moBest); }
    HWY_INLINE Lanes Has(int nDirection) const { return hn::Eq(moDirection, Constant(nDirection)); }
};

/// At most 1: the reciprocal of what is above.
HWY_INLINE Vector AtMostOne(Vector oRatio)
{
    const Vector oOne = Constant(1.0);
    return hn::IfThenElse(hn::Gt(oRatio, oOne), hn::Div(oOne, oRatio), oRatio);
}

/// The neighbours of a diagonal line in one row: two on either side of it, as far as they lie in
/// the window. Adds how many there were to nCount.
HWY_INLINE void AddBesideLine(const Neighbours& oPixels, int dy, int nLine, int nHalf,
                              FloatVector& oSum, int& nCount)
{
    for (const int nOffset : {1, -1, 2, -2})
    {
        const int dx = nLine + nOffset;
        if (dx >= -nHalf && dx <= nHalf)
        {
            oSum = hn::Add(oSum, oPixels.Sample(dy, dx));
            ++nCount;
        }
    }
}

struct LineSums
{
    FloatVector maoLine[4] = {hn::Zero(kFloatTag), hn::Zero(kFloatTag), hn::Zero(kFloatTag),
                              hn::Zero(kFloatTag)};
    /// Five lines wide, the line itself included, for rows and columns.
    FloatVector maoBand[2] = {hn::Zero(kFloatTag), hn::Zero(kFloatTag)};
    /// Without the line itself, for the diagonals.
    FloatVector maoBeside[2] = {hn::Zero(kFloatTag), hn::Zero(kFloatTag)};
    int manBeside[2] = {0, 0};

    HWY_INLINE LineSums(const Neighbours& oPixels, int nHalf)
    {
        for (int dy = -2; dy <= 2; ++dy)
        {
            AddRow(oPixels, dy, {-nHalf, nHalf}, maoBand[0]);
        }
        for (int k = -nHalf; k <= nHalf; ++k)
        {
            maoLine[0] = hn::Add(maoLine[0], oPixels.Sample(0, k));
            maoLine[1] = hn::Add(maoLine[1], oPixels.Sample(k, 0));
            maoLine[2] = hn::Add(maoLine[2], oPixels.Sample(k, k));
            maoLine[3] = hn::Add(maoLine[3], oPixels.Sample(k, -k));
            AddRow(oPixels, k, {-2, 2}, maoBand[1]);
            AddBesideLine(oPixels, k, k, nHalf, maoBeside[0], manBeside[0]);
            AddBesideLine(oPixels, k, -k, nHalf, maoBeside[1], manBeside[1]);
        }
    }

    /// The mean beside the line.
    HWY_INLINE Vector NeighbourMean(int nDirection, int nSize) const
    {
        if (nDirection <= COLUMN)
        {
            const Vector oBand = hn::PromoteTo(kTag, maoBand[nDirection - 1]);
            const Vector oLine = hn::PromoteTo(kTag, maoLine[nDirection - 1]);
            return hn::Div(hn::Sub(oBand, oLine), Constant(4.0 * nSize));
        }
        return Mean(maoBeside[nDirection - DIAGONAL], manBeside[nDirection - DIAGONAL]);
    }
};

Detection DetectLine(const Neighbours& oPixels, int nSize)
{
    const LineSums oSums(oPixels, (nSize - 1) / 2);
    Detection oDetection;
    for (int nDirection = ROW; nDirection <= ANTIDIAGONAL; ++nDirection)
    {
        const Vector oLine = Mean(oSums.maoLine[nDirection - 1], nSize);
        const Vector oBeside = oSums.NeighbourMean(nDirection, nSize);
        const Vector oRatio = AtMostOne(hn::Div(oLine, oBeside));
        const auto oNone = hn::Eq(oBeside, hn::Zero(kTag));
        oDetection.Take(nDirection, hn::IfThenZeroElse(oNone, oRatio), oLine, oLine);
    }
    return oDetection;
}

/// The sums of the halves of a window on either side of a line through its centre.
struct EdgeSums
{
    FloatVector maoFirst[4] = {hn::Zero(kFloatTag), hn::Zero(kFloatTag), hn::Zero(kFloatTag),
                               hn::Zero(kFloatTag)};
    FloatVector maoSecond[4] = {hn::Zero(kFloatTag), hn::Zero(kFloatTag), hn::Zero(kFloatTag),
                                hn::Zero(kFloatTag)};

    HWY_INLINE EdgeSums(const Neighbours& oPixels, int nHalf)
    {
        // Above and below take turns, so that two sums are under way.
        for (int k = 1; k <= nHalf; ++k)
        {
            for (int dx = -nHalf; dx <= nHalf; ++dx)
            {
                maoFirst[0] = hn::Add(maoFirst[0], oPixels.Sample(k - nHalf - 1, dx));
                maoSecond[0] = hn::Add(maoSecond[0], oPixels.Sample(k, dx));
            }
        }
        for (int dy = -nHalf; dy <= nHalf; ++dy)
        {
            AddHalves(oPixels, dy, {-nHalf, -1}, {1, nHalf}, COLUMN);
            AddHalves(oPixels, dy, {-nHalf, dy - 1}, {dy + 1, nHalf}, DIAGONAL);
            AddHalves(oPixels, dy, {-nHalf, -dy - 1}, {-dy + 1, nHalf}, ANTIDIAGONAL);
        }
    }

private:
    HWY_INLINE void AddHalves(const Neighbours& oPixels, int dy, Columns oFirst, Columns oSecond,
                              int nDirection)
    {
        AddRow(oPixels, dy, oFirst, maoFirst[nDirection - 1]);
        AddRow(oPixels, dy, oSecond, maoSecond[nDirection - 1]);
    }
};

Detection DetectEdge(const Neighbours& oPixels, int nSize)
{
    const int nHalf = (nSize - 1) / 2;
    const EdgeSums oSums(oPixels, nHalf);
    Detection oDetection;
    for (int nDirection = ROW; nDirection <= ANTIDIAGONAL; ++nDirection)
    {
        const FloatVector oFirst = oSums.maoFirst[nDirection - 1];
        const FloatVector oSecond = oSums.maoSecond[nDirection - 1];
        const Vector oRatio =
            AtMostOne(hn::Div(hn::PromoteTo(kTag, oFirst), hn::PromoteTo(kTag, oSecond)));
        const double dfCount = static_cast<double>(nSize) * nHalf;
        oDetection.Take(nDirection, oRatio, Mean(oFirst, dfCount), Mean(oSecond, dfCount));
    }
    return oDetection;
}

/// Sum over a line parallel to the one through the centre, nShift lines below it (for columns: to
/// the right of it), as far as it lies in the window.
HWY_INLINE FloatVector ParallelSum(const Neighbours& oPixels, int nHalf, int nDirection, int nShift)
{
    FloatVector oSum = hn::Zero(kFloatTag);
    if (nDirection == ROW)
    {
        AddRow(oPixels, nShift, {-nHalf, nHalf}, oSum);
        return oSum;
    }
    for (int dy = -nHalf; dy <= nHalf; ++dy)
    {
        const int dx = nDirection == COLUMN     ? nShift
                       : nDirection == DIAGONAL ? dy - nShift
                                                : nShift - dy;
        if (dx >= -nHalf && dx <= nHalf)
        {
            oSum = hn::Add(oSum, oPixels.Sample(dy, dx));
        }
    }
    return oSum;
}

/// The mean of the line and of that of its two neighbours that is more like it. Counts for oLanes.
Vector LineEstimate(const Neighbours& oPixels, int nSize, const Detection& oLine, Lanes oLanes)
{
    const int nHalf = (nSize - 1) / 2;
    Vector oFirst = hn::Zero(kTag);
    Vector oSecond = hn::Zero(kTag);
    for (int nDirection = ROW; nDirection <= ANTIDIAGONAL; ++nDirection)
    {
        const Lanes oHere = hn::And(oLanes, oLine.Has(nDirection));
        if (!IsAny(oHere))
        {
            continue;
        }
        // The row above and the column to the left come first, yet the diagonal below.
        const int nShift = nDirection <= COLUMN ? -1 : 1;
        // Meant: the diagonal neighbours are one pixel shorter and divided by the size all the
        // same.
        const auto oParallelMean = [&](int n)
        { return Mean(ParallelSum(oPixels, nHalf, nDirection, n), nSize); };
        oFirst = hn::IfThenElse(oHere, oParallelMean(nShift), oFirst);
        oSecond = hn::IfThenElse(oHere, oParallelMean(-nShift), oSecond);
    }
    const Vector oToFirst = hn::Abs(hn::Sub(oLine.moFirstMean, oFirst));
    const Vector oToSecond = hn::Abs(hn::Sub(oLine.moFirstMean, oSecond));
    const Vector oChosen = hn::IfThenElse(hn::Le(oToFirst, oToSecond), oFirst, oSecond);
    return hn::Mul(hn::Add(oChosen, oLine.moFirstMean), Constant(0.5));
}

/// The lanes that go on with a detector at the next size: no smaller spread, the same direction.
HWY_INLINE Lanes StillGrowing(Lanes oLanes, const Detection& oLast, const Detection& oNext)
{
    const auto oSmaller = hn::Lt(oNext.GetSpread(), oLast.GetSpread());
    return hn::AndNot(oSmaller, hn::And(oLanes, hn::Eq(oNext.moDirection, oLast.moDirection)));
}

Vector GrownLine(const Neighbours& oPixels, Detection oLine, Lanes oLanes)
{
    Vector oResult = LineEstimate(oPixels, 5, oLine, oLanes);
    for (int nSize = 7; nSize <= 2 * kTouziReach + 1; nSize += 2)
    {
        const Detection oNext = DetectLine(oPixels, nSize);
        oLanes = StillGrowing(oLanes, oLine, oNext);
        if (!IsAny(oLanes))
        {
            break;
        }
        oResult = hn::IfThenElse(oLanes, LineEstimate(oPixels, nSize, oNext, oLanes), oResult);
        // Lanes that have stopped may take the new line too: they are not asked again.
        oLine = oNext;
    }
    return oResult;
}

/// The lanes in which the centre is more like the second side of the edge. The centre is the band
/// of three lines along it.
Lanes IsSecondSide(const Neighbours& oPixels, int nSize, int nDirection, const Detection& oEdge)
{
    const int nHalf = (nSize - 1) / 2;
    FloatVector oSum = hn::Zero(kFloatTag);
    for (int dy = -nHalf; dy <= nHalf; ++dy)
    {
        Columns oColumns{-1, 1};
        if (nDirection == ROW)
        {
            oColumns = dy >= -1 && dy <= 1 ? Columns{-nHalf, nHalf} : Columns{0, -1};
        }
        else if (nDirection != COLUMN)
        {
            const int dx = nDirection == DIAGONAL ? dy : -dy;
            oColumns = {std::max(dx - 1, -nHalf), std::min(dx + 1, nHalf)};
        }
        AddRow(oPixels, dy, oColumns, oSum);
    }
    const Vector oBand = Mean(oSum, nDirection <= COLUMN ? 3.0 * nSize : 3.0 * nSize - 2.0);
    return hn::Lt(hn::Abs(hn::Sub(oBand, oEdge.moSecondMean)),
                  hn::Abs(hn::Sub(oBand, oEdge.moFirstMean)));
}

/// Sets the variation of the half window on the centre's side of the edge, for the lanes of oLanes.
void TakeSideOfEdge(const Neighbours& oPixels, int nSize, const Detection& oEdge, Lanes oLanes,
                    Variation& oResult)
{
    // No direction has no pixels.
    const Lanes oNone = hn::And(oLanes, oEdge.Has(0));
    oResult.moMean = hn::IfThenZeroElse(oNone, oResult.moMean);
    oResult.moCv = hn::IfThenZeroElse(oNone, oResult.moCv);
    for (int nDirection = ROW; nDirection <= ANTIDIAGONAL; ++nDirection)
    {
        const Lanes oHere = hn::And(oLanes, oEdge.Has(nDirection));
        if (!IsAny(oHere))
        {
            continue;
        }
        const Lanes oSecond = IsSecondSide(oPixels, nSize, nDirection, oEdge);
        for (const int nSide : {1, 2})
        {
            const Lanes oSide = nSide == 2 ? hn::And(oHere, oSecond) : hn::AndNot(oSecond, oHere);
            if (IsAny(oSide))
            {
                const Variation oHalf = HalfWindowVariation(oPixels, nSize, nDirection, nSide);
                oResult.moMean = hn::IfThenElse(oSide, oHalf.moMean, oResult.moMean);
                oResult.moCv = hn::IfThenElse(oSide, oHalf.moCv, oResult.moCv);
            }
        }
    }
}

/// Lets the edges grow, and sets the variation on the centre's side of the last that held.
void TakeGrownEdge(const Neighbours& oPixels, Detection oEdge, Lanes oLanes, Variation& oResult)
{
    for (int nSize = 5; IsAny(oLanes); nSize += 2)
    {
        Detection oNext;
        Lanes oGrowing = NoLanes();
        if (nSize < 2 * kTouziReach + 1)
        {
            oNext = DetectEdge(oPixels, nSize + 2);
            oGrowing = StillGrowing(oLanes, oEdge, oNext);
        }
        const Lanes oStopped = hn::AndNot(oGrowing, oLanes);
        if (IsAny(oStopped))
        {
            TakeSideOfEdge(oPixels, nSize, oEdge, oStopped, oResult);
        }
        oEdge = oNext;
        oLanes = oGrowing;
    }
}

/// Where nothing is found the window grows as long as it changes little.
Variation GrownWindow(const Neighbours& oPixels, const TouziThresholds& oThresholds,
                      const Variation& oFive, const Detection& oEdgeOfFive, Lanes oLanes)
{
    const int nFirstSize = oThresholds.mnStartSize + 2;
    Variation oResult = nFirstSize == 5 ? oFive : WindowVariation(oPixels, nFirstSize);
    Vector oLast = oEdgeOfFive.GetSpread();
    for (int nSize = nFirstSize + 2; nSize <= 2 * oPixels.GetMargin() + 1; nSize += 2)
    {
        const Vector oSpread = DetectEdge(oPixels, nSize).GetSpread();
        oLanes = hn::AndNot(hn::Gt(oSpread, oLast), oLanes);
        if (!IsAny(oLanes))
        {
            break;
        }
        const Variation oNext = WindowVariation(oPixels, nSize);
        const Vector oChange = hn::Abs(hn::Sub(oNext.moCv, oResult.moCv));
        oLanes = hn::And(oLanes, hn::Gt(Constant(oThresholds.mdfGradiant), oChange));
        oResult.moMean = hn::IfThenElse(oLanes, oNext.moMean, oResult.moMean);
        oResult.moCv = hn::IfThenElse(oLanes, oNext.moCv, oResult.moCv);
        oLast = hn::IfThenElse(oLanes, oSpread, oLast);
    }
    return oResult;
}

/// Sets the mean of the largest flat window, and returns the lanes that have one.
Lanes TakeFlatArea(const Neighbours& oPixels, const TouziThresholds& oThresholds,
                   const Variation& oFive, Lanes oLanes, Vector& oResult)
{
    Lanes oFlat = NoLanes();
    for (int nSize = oThresholds.mnStartSize; nSize <= 2 * oPixels.GetMargin() + 1; nSize += 2)
    {
        const Variation oNext = nSize == 5 ? oFive : WindowVariation(oPixels, nSize);
        oLanes = hn::And(oLanes, hn::Ge(Constant(oThresholds.mdfCu), oNext.moCv));
        if (!IsAny(oLanes))
        {
            break;
        }
        oResult = hn::IfThenElse(oLanes, oNext.moMean, oResult);
        oFlat = hn::Or(oFlat, oLanes);
    }
    return oFlat;
}

/// Mean and centre, weighted by how much the window varies beyond speckle.
HWY_INLINE Vector Blend(double dfCu, const Variation& oVariation, Vector oCentre)
{
    const Vector oOne = Constant(1.0);
    const Vector oCv = oVariation.moCv;
    const Vector k = hn::Sub(oOne, hn::Div(Constant(dfCu * dfCu), hn::Mul(oCv, oCv)));
    const Vector oBlend =
        hn::Add(hn::Mul(hn::Sub(oOne, k), oVariation.moMean), hn::Mul(k, oCentre));
    return hn::IfThenElse(hn::Ge(Constant(dfCu), oCv), oVariation.moMean, oBlend);
}

/// The results of the lanes of oWanted, and which of them are strong scatterers.
Vector FilterPixels(const Neighbours& oPixels, const TouziThresholds& oThresholds, Vector oCentre,
                    Lanes oWanted, Lanes& oScatterers)
{
    const Variation oFive = WindowVariation(oPixels, 5);
    oScatterers = hn::And(oWanted, hn::Ge(oFive.moCv, Constant(oThresholds.mdfCmax)));
    Vector oResult = Blend(oThresholds.mdfCu, oFive, oCentre);
    Lanes oOpen = hn::AndNot(oScatterers, oWanted);
    const Vector oContour = Constant(oThresholds.mdfContour);
    if (IsAny(oOpen))
    {
        const Detection oLine = DetectLine(oPixels, 5);
        const Lanes oVaries = hn::Gt(oFive.moCv, Constant(oThresholds.mdfCuLine));
        const Lanes oLines = hn::And(oOpen, hn::And(hn::Ge(oContour, oLine.moBest), oVaries));
        if (IsAny(oLines))
        {
            oResult = hn::IfThenElse(oLines, GrownLine(oPixels, oLine, oLines), oResult);
        }
        oOpen = hn::AndNot(oLines, oOpen);
        oOpen = hn::AndNot(TakeFlatArea(oPixels, oThresholds, oFive, oOpen, oResult), oOpen);
    }
    if (IsAny(oOpen))
    {
        const Detection oEdge = DetectEdge(oPixels, 5);
        const Lanes oEdges = hn::And(oOpen, hn::Ge(oContour, oEdge.moBest));
        const Lanes oNeutral = hn::AndNot(oEdges, oOpen);
        Variation oVariation = oFive;
        if (IsAny(oNeutral))
        {
            oVariation = GrownWindow(oPixels, oThresholds, oFive, oEdge, oNeutral);
        }
        TakeGrownEdge(oPixels, oEdge, oEdges, oVariation);
        oResult = hn::IfThenElse(oOpen, Blend(oThresholds.mdfCu, oVariation, oCentre), oResult);
    }
    return hn::IfThenElseZero(oWanted, oResult);
}

void FilterTouziRow(const TouziRows& oRows, const TouziThresholds& oThresholds,
                    std::span<unsigned char> oWanted, std::span<double> oResults)
{
    for (std::size_t i = 0; i < oResults.size(); i += kLanes)
    {
        HWY_ALIGN double adfLanes[kLanes];
        std::copy_n(&oWanted[i], kLanes, adfLanes);
        const Lanes oLanes = hn::Ne(hn::Load(kTag, adfLanes), hn::Zero(kTag));
        if (!IsAny(oLanes))
        {
            std::fill_n(&oResults[i], kLanes, 0.0);
            continue;
        }
        Lanes oScatterers = NoLanes();
        hn::StoreU(FilterPixels(Neighbours(oRows, oThresholds, i), oThresholds,
                                hn::LoadU(kTag, oRows.mpCentres + i), oLanes, oScatterers),
                   kTag, &oResults[i]);
        if (IsAny(oScatterers))
        {
            hn::Store(hn::IfThenElseZero(oScatterers, Constant(1.0)), kTag, adfLanes);
            for (std::size_t k = 0; k < kLanes; ++k)
            {
                oWanted[i + k] = adfLanes[k] != 0.0 ? 0 : oWanted[i + k];
            }
        }
    }
}

}  // namespace kor::filters::kernels::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace kor::filters::kernels
{

HWY_EXPORT(FilterTouziRow);

void FilterTouziRow(const TouziRows& oRows, const TouziThresholds& oThresholds,
                    std::span<unsigned char> oWanted, std::span<double> oResults)
{
    HWY_DYNAMIC_DISPATCH(FilterTouziRow)(oRows, oThresholds, oWanted, oResults);
}

}  // namespace kor::filters::kernels
#endif
