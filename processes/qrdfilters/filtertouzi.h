#pragma once

#include <array>
#include <boost/optional.hpp>
#include <memory>

#include "processes/qrdfilters/iprocessor.h"
#include "processes/qrdfilters/typedfilter.h"

namespace kor::filters
{

namespace details
{

/// Parameters of FilterTouzi. All count for processors made later, see there; nothing is checked.
class TouziParams
{
public:
    virtual ~TouziParams() = default;

    /// Number of looks of the image, above 0. Sets the variation coefficients that windows are held
    /// against, and the first window of flat areas: 5 pixels from 1 look to below 2, else 3.
    void SetLooks(double dfLooks);
    /// Ratio of two means, 0 to 1, up to which there is a line or an edge between them.
    void SetContour(double dfContour) { mdfContour = dfContour; }
    /// Stored, and read by nothing: lines and edges both take the contour ratio.
    void SetEdge(double dfEdge) { mdfEdge = dfEdge; }
    /// Change of the variation coefficient, from 0 up, below which a neutral window still grows.
    void SetGradiant(double dfGradiant) { mdfGradiant = dfGradiant; }
    /// What the samples are: 1 intensity (power), 2 decibel, any other value amplitude; 0 at first.
    void SetAmplit(int nAmplit) { mnAmplit = nAmplit; }
    /// True: a masked pixel becomes 0; false, as at first: it keeps the input's value.
    void SetBGZero(bool bBGZero) { mbBGZero = bBGZero; }

protected:
    double mdfLooks = 0.0;
    double mdfContour = 0.0;
    double mdfEdge = 0.0;
    double mdfGradiant = 0.0;
    int mnStartSize = 0;
    double mdfCu = 0.0;
    double mdfCmax = 0.0;
    double mdfCuLine = 0.0;
    double mdfCuMinor = 0.0;            ///< stored and not read
    std::array<double, 8> madfCu = {};  ///< stored and not read
    int mnAmplit = 0;
    bool mbBGZero = false;
};

}  // namespace details

/// Touzi speckle filter: looks for structure around each pixel before it smooths, channel by
/// channel, and takes the first of these cases that holds.
///
///     scatterer   cv >= Cmax in 5 x 5:    out = Blend(mean, cv, x); the channels behind become 0
///     line        ratio <= contour and cv > Cu - 0.04 in 5 x 5:   out = the mean of the line and
///                 its nearer neighbour line, grown up to 11 x 11 as long as the line gets clearer
///     flat area   Cu >= cv:   out = mean of the largest window up to the margins that is flat
///     edge        ratio <= contour:   out = Blend(mean, cv, x) of the pixel's side of the edge
///     neutral     out = Blend(mean, cv, x) of a window grown while it changes less than gradiant
///
///     Blend(mean, cv, x) = mean where Cu >= cv, else (1 - k) * mean + k * x;  k = 1 - Cu^2 / cv^2
///     Cu = 0.523 / sqrt(L),   Cmax = 0.523 * sqrt(2 / L + 1),   L the number of looks
/// x is the pixel, cv = sqrt(mean of squares - mean^2) / mean a window's variation coefficient. The
/// ratio of a line is that of its mean and the mean beside it, the ratio of an edge that of the
/// means of its sides, both turned so that they do not exceed 1; the smallest of the directions
/// row, column, diagonal and antidiagonal counts.
///
/// Input    any of the ten real types, or a complex one, which is seen as its magnitude. The filter
///          works on amplitudes: sqrt(x) of intensity, 10^(x / 10) of decibel. The x margin tells
///          how far windows may grow; both margins must be equal and should be 5 or more. What lies
///          outside the margins reads 0.
/// Output   any of the ten real types; same width, height and channels. Intensity is squared again;
///          decibel becomes 10 * log10(x^2) of x > 0, else 0, which is not the inverse of the way
///          in and is meant. Integers take x + 0.5, cut towards zero and clamped to their range.
///          Margins are not written.
/// Mask     may be null. A cleared bit makes a pixel background: 0, or its value on the way in and
///          out again when BGZero is false. Masked pixels still count in the windows of others.
/// Corners  all zeros: 0. An edge against zeros has the ratio 0 and wins. A contour of 0 leaves
///          only lines and edges with a ratio of exactly 0. A window without any ratio, as 0 / 0 in
///          all directions, has no line and its edge gives 0.
/// Errors   kor::Exception "poRasterIn is invalid pointer", "poRasterOut is invalid pointer",
///          "Output cannot be complex", "Invalid type to dispatch." (eDT_BIT), all before anything
///          is written; in hardened builds also for blocks whose geometries do not match.
/// Numbers  the sums of windows run in single precision in row order, all else in double.
/// Threads  works on the calling thread. One object must not be called by two threads at once
///          unless it has worked on the same pair of types before.
/// State    the processor of the last pair of types is kept, and copies of the filter share it. A
///          setter counts when a processor is made: a filter that has processed a block keeps the
///          parameters of then until the types change.
/// Source   R. Touzi, "A review of speckle filtering in the context of estimation theory", IEEE
///          Trans. Geoscience and Remote Sensing 40(11), 2392-2404, 2002; for the detectors A.
///          Lopes, E. Nezry, R. Touzi, H. Laur, "Structure detection and statistical adaptive
///          speckle filtering in SAR images", Int. J. Remote Sensing 14(9), 1735-1758, 1993.
class FilterTouzi : public details::TouziParams, private ProcessorCache<IProcessor>
{
public:
    template <class TIn, class TOut>
    class InnerProcessor;
    struct TouziCreationPolicy;

    explicit FilterTouzi(double dfLooks = 10.0, double dfContour = 0.5, double dfEdge = 0.5,
                         double dfGradiant = 0.1);

    /// Window width and height in pixels, for the caller who provides the margins: filtering reads
    /// the margins alone.
    void SetFilterSize(boost::optional<int> nSizeX, boost::optional<int> nSizeY);
    void SetFilterSize(int nSizeX, int nSizeY);
    const boost::optional<int>& GetFilterSizeX() const { return moFilterSizeX; }
    const boost::optional<int>& GetFilterSizeY() const { return moFilterSizeY; }

    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMask,
                 tessel::Raster* poRasterOut) const;

    /// Filters into a new raster with the type, size, offsets and margins of the input; the margins
    /// are not written. The output mask is not read.
    std::shared_ptr<tessel::Raster> operator()(std::shared_ptr<tessel::Raster> poRasterIn,
                                               std::shared_ptr<tessel::Mask> poMaskIn,
                                               std::shared_ptr<tessel::Mask> poMaskOut) const;

private:
    boost::optional<int> moFilterSizeX;
    boost::optional<int> moFilterSizeY;
};

}  // namespace kor::filters
