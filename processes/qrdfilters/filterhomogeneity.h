#pragma once

#include <memory>
#include <vector>

#include "basic/tessel/mask/imaskbuilder.h"
#include "processes/qrdfilters/iprocessor.h"
#include "processes/qrdfilters/typedfilter.h"

namespace kor::datasources
{
class IRasterReader;
class IRasterWriter;
}  // namespace kor::datasources

namespace kor::filters
{

namespace details
{

/// Parameters of FilterHomogeneity: the table from sample values to grey levels, and what it is
/// made of. Everything is empty and 0 at first.
class HomogeneityParams
{
public:
    virtual ~HomogeneityParams() = default;

    /// Forgets count, range, histogram and table: the latter two get 65536 zeros, the range becomes
    /// that of no value at all.
    void Reset();
    /// Number of grey levels, 0 to 255; kor::Exception for others. Takes effect at the next
    /// preparation. 0, as at first: there is none, and the table has to be set.
    void SetGrey(int nGrey);
    /// Range of the sample values that have a grey level, in sample values. Takes effect with the
    /// next block.
    void SetMinMax(double dfMin, double dfMax);
    /// The grey level of each of 65536 bins, the first of which begins at the minimum. A bin that
    /// is not there has level 0. Takes effect with the next block.
    void SetHist2Glev(const std::vector<int>& vnHist2Glev) { mvnHist2Glev = vnHist2Glev; }

    double GetMin() const { return mdfMin; }
    double GetMax() const { return mdfMax; }
    /// Valid pixels that were counted.
    int GetCount() const { return mnCount; }
    const std::vector<int>& Get16Histogram() const { return mvnHistogram; }
    const std::vector<int>& GetHist2Glev() const { return mvnHist2Glev; }

protected:
    int mnGrey = 0;
    int mnCount = 0;
    double mdfMin = 0.0;
    double mdfMax = 0.0;
    std::vector<int> mvnHistogram;
    std::vector<int> mvnHist2Glev;
};

/// The passes over an image that make the table: the door from untyped to typed code. The masks may
/// be null; margins do not count.
class IPreparationHomogeneity
{
public:
    virtual ~IPreparationHomogeneity() = default;
    /// Widens the range by the valid pixels of a block.
    virtual void ProcessMinMax(tessel::Raster* poRaster, tessel::Mask* poMask) = 0;
    /// Counts the valid pixels of a block in the bins of the range.
    virtual void Process16Histogram(tessel::Raster* poRaster, tessel::Mask* poMask) = 0;
    /// Writes the grey level of each pixel to an eDT_32R block, 0 where it is masked.
    virtual void DumpGrey(tessel::Raster* poRaster, tessel::Mask* poMask,
                          tessel::Raster* poGrey) = 0;
};

}  // namespace details

/// Local homogeneity: the mean similarity of neighbouring pixels in a window.
///
///     out = mean of 1 / (1 + (g(p) - g(q))^2)   over the pairs (p, q) of the window
/// p is a valid pixel of the window and q its valid neighbour to the east, south-east, south or
/// south-west, which may lie one pixel outside the window. g is the grey level: the image's values
/// are divided into equally populated levels by PrepareForGivenGreyLevel, which reads the whole
/// image, or by a table of the caller's. 1 is a uniform window.
///
/// Levels   the range of the valid pixels is cut into 65536 bins; within a range below 1e-9 the
///          value itself is the bin. Level by level takes bins until it has its share of the
///          pixels. A bin passes on to the next level at most once however heavy it is, which is
///          meant: a few heavy bins leave fewer levels in use. With fewer pixels than levels each
///          bin gets a level of its own. Pixels outside the range have level 0.
/// Input    one channel of any of the ten real types. The window is 2 * margin + 1 pixels; margins
///          in x and y have to be equal, as the first windows are made of twice the margin in x of
///          rows. Blocks have to come from the image that was prepared.
/// Output   one channel of any of the ten real types, same width and height. Floating point takes
///          the value, integers value + 0.5 cut towards zero, which is 0 or 1. Margins are not
///          written.
/// Mask     may be null. It has the geometry of the input. A cleared bit takes the pixel out of all
///          pairs, and gives 0.
/// Numbers  single precision, in sums that slide over the block: their rounding stays in them. The
///          similarity of a pair is divided in double and narrowed.
/// Corners  a valid pixel without a pair in its window is not a number, 0 in integers. Pixels of
///          the last column of the block, margins included, are never p.
/// Errors   kor::Exception, translated: see the operations; "Invalid type requested." (complex
///          types, eDT_BIT); in hardened builds also for blocks whose geometries do not match.
/// Threads  works on the calling thread. One object must not be called by two threads at once.
/// State    processor and preparator of the last types are kept, and copies share them. Levels,
///          range and table are taken anew for each block.
/// Source   R. M. Haralick, K. Shanmugam, I. Dinstein, "Textural features for image
///          classification", IEEE Trans. SMC 3(6), 610-621, 1973: the inverse difference moment at
///          distance 1, the four directions together; levels by equal-probability quantizing.
class FilterHomogeneity : public details::HomogeneityParams, private ProcessorCache<IProcessor>
{
public:
    template <class TIn, class TOut>
    class InnerProcessor;
    template <class T>
    class InnerPreparator;

    /// Makes the table from an image, in two passes, and in a third one writes the grey level of
    /// each pixel if there is a writer of one channel (others are ignored). The builder says which
    /// pixels are valid. Both may be null; all are borrowed. Does nothing at all with 0 levels.
    /// Throws "Invalid input reader" (null), "Input for homogeneity filter supports only 1
    /// channel", "Invalid grey level writer" (not eDT_32R; the table is made by then), "Invalid
    /// type requested.", and what reader, builder and writer throw.
    void PrepareForGivenGreyLevel(datasources::IRasterReader* poReader,
                                  tessel::IMaskBuilder* poMaskBuilder,
                                  datasources::IRasterWriter* poWriter);

    /// Throws "Invalid input Raster", "Invalid output raster", "Input for homogeneity filter
    /// supports only 1 channel", "Input and output must have the same number of channels", in this
    /// order and before anything is written.
    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMask,
                 tessel::Raster* poRasterOut) const;

private:
    details::HomogeneityParams& SelectPreparator(const tessel::DataType& oType);
    void WriteGrey(datasources::IRasterReader& oReader, const tessel::IMaskBuilder* poMaskBuilder,
                   datasources::IRasterWriter& oWriter) const;

    std::shared_ptr<details::IPreparationHomogeneity> mpoPreparator;
    tessel::DataType moPreparedType;
};

}  // namespace kor::filters
