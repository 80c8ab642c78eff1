#pragma once

#include <limits>
#include <string>
#include <vector>

#include "basic/tessel/mask/imaskbuilder.h"
#include "processes/qrdfilters/iprocessor.h"
#include "processes/qrdfilters/typedfilter.h"

namespace kor::datasources
{
class IRasterDataset;
}

/// Copies of pixels that nothing is filtered in: from block to block, from a block onto a mosaic,
/// and from file to file.
namespace kor::filters
{

/// What ExtendedDataCopy does with a block.
enum ProcessStage : int
{
    ePS_Gather = 0,  ///< collects samples for the colour balance and writes nothing
    ePS_Apply = 1    ///< writes the block; so does every other value
};

namespace details
{

/// Parameters of QRDDataCopy.
class QRDDataCopyParams
{
public:
    virtual ~QRDDataCopyParams() = default;

    /// True: masked pixels keep what the output holds; false, as at first: they become 0. Counts
    /// from the next block on.
    void SetKeepOutput(bool bKeepOutput) { mbKeepOutput = bKeepOutput; }

protected:
    bool mbKeepOutput = false;
};

/// Parameters of ExtendedDataCopy. All but the stage count for processors made later, see there.
class ExtendedDataCopyParams
{
public:
    virtual ~ExtendedDataCopyParams() = default;

    /// Gain and offset in use.
    virtual double GetGain() = 0;
    virtual double GetOffset() = 0;

    /// Width of the feathering band outside the valid area, in pixels; below 1, as at first, there
    /// is none.
    void SetBlendWidth(int nBlendWidth) { mnBlendWidth = nBlendWidth; }
    /// Greatest distance from the valid area, in pixels, at which samples are gathered; 0 at first,
    /// which gathers none.
    void SetSampleBand(int nSampleBand) { mnSampleBand = nSampleBand; }
    /// 1: median of pairwise lines. 2: percentile matching. 3: gain and offset 0. Any other value,
    /// such as 0 at first: gain 1 and offset 0.
    void SetBalanceMode(int nBalanceMode) { mnBalanceMode = nBalanceMode; }
    /// Input value that is not copied, if SetUseInputNoData says so, and never gathered; 0 at
    /// first.
    void SetInputNoData(double dfNoData) { mdfInputNoData = dfNoData; }
    /// Output value that stands for a pixel without data: not blended with and not written, if
    /// SetUseOutputNoData says so, and never gathered; 0 at first.
    void SetOutputNoData(double dfNoData) { mdfOutputNoData = dfNoData; }
    /// False at first.
    void SetUseInputNoData(bool bUse) { mbUseInputNoData = bUse; }
    /// False at first.
    void SetUseOutputNoData(bool bUse) { mbUseOutputNoData = bUse; }
    /// ePS_Gather at first. Takes effect at once.
    virtual void SetProcessStage(ProcessStage eStage) { meProcessStage = eStage; }
    /// Mode 2: share of the samples below the low one of the two that are matched, 0 to 1; 0 at
    /// first.
    void SetLowPercentile(double dfShare) { mdfLowPercentile = dfShare; }
    /// Mode 2: share of the samples above the high one, counted from the top end: 0.02 leaves out
    /// the top 2 per cent. 0 at first.
    void SetHighPercentile(double dfShare) { mdfHighPercentile = dfShare; }
    /// Share of the computed gain that is kept; 1 at first.
    void SetStretchFactor(double dfFactor) { mdfStretchFactor = dfFactor; }
    /// Share of the balanced range of the valid area that is added to the offset; 0 at first.
    void SetOffsetShare(double dfShare) { mdfOffsetShare = dfShare; }
    /// True: SetGain and SetOffset are used as they are and nothing is computed. False at first.
    void SetFixedGain(bool bFixed) { mbFixedGain = bFixed; }
    /// True: values between the knee's start and its high value are bent. False at first.
    void SetUseKnee(bool bUse) { mbUseKnee = bUse; }
    /// Upper end of the knee, in output values.
    void SetKneeHigh(double dfHigh) { mdfKneeHigh = dfHigh; }
    /// Value from which the knee's square is measured.
    void SetKneeLow(double dfLow) { mdfKneeLow = dfLow; }
    /// Lower end of the knee.
    void SetKneeStart(double dfStart) { mdfKneeStart = dfStart; }
    /// Gain for SetFixedGain; 1 at first.
    void SetGain(double dfGain) { mdfGain = dfGain; }
    /// Offset for SetFixedGain, in output values; 0 at first.
    void SetOffset(double dfOffset) { mdfOffset = dfOffset; }

protected:
    int mnBlendWidth = 0;
    int mnSampleBand = 0;
    int mnBalanceMode = 0;
    double mdfInputNoData = 0.0;
    double mdfOutputNoData = 0.0;
    bool mbUseInputNoData = false;
    bool mbUseOutputNoData = false;
    ProcessStage meProcessStage = ePS_Gather;
    double mdfLowPercentile = 0.0;
    double mdfHighPercentile = 0.0;
    double mdfStretchFactor = 1.0;
    double mdfOffsetShare = 0.0;
    bool mbFixedGain = false;
    bool mbUseKnee = false;
    double mdfKneeHigh = std::numeric_limits<double>::lowest();
    double mdfKneeLow = std::numeric_limits<double>::lowest();
    double mdfKneeStart = std::numeric_limits<double>::lowest();
    double mdfGain = 1.0;
    double mdfOffset = 0.0;
};

}  // namespace details

/// Copies a block into another one of any element type, with a mask.
///
///     out = in, converted by the library's rules; complex samples part by part
///
/// Input    any of the ten real types, or a complex one of such parts.
/// Output   the same, complex if and only if the input is; same width, height and channels, margins
///          of its own. Margins are not written.
/// Mask     may be null. It has the geometry of the input. Pixels whose bit is cleared become 0 in
///          all channels, or stay as the output has them with SetKeepOutput(true).
/// Errors   kor::Exception "poRasterIn is invalid pointer", "poRasterOut is invalid pointer",
///          "Cannot copy from/to complex type to/from normal types.", "Invalid type requested."
///          (eDT_BIT), all before anything is written; in hardened builds also for blocks whose
///          geometries do not match.
/// Threads  splits the rows among the threads of OpenMP. One object must not be called by two
///          threads at once.
/// State    the processor of the last pair of types is kept, and copies of the object share it.
class QRDDataCopy : public details::QRDDataCopyParams, private ProcessorCache<IComplexProcessor>
{
public:
    template <class TIn, class TOut>
    class InnerProcessor;

    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                 tessel::Raster* poRasterOut) const;
};

/// QRDDataCopy as an algorithm of the block driver.
///
///     FilterIODriver<QRDDataCopyAlgorithm> oDriver;
///     oDriver.SetMaskBuilder(&oBuilder);
///     oDriver.Run(&oReader, &oWriter);
class QRDDataCopyAlgorithm
{
public:
    virtual ~QRDDataCopyAlgorithm() = default;

    /// Makes the mask of each block; borrowed. Null, as at first: everything is copied.
    void SetMaskBuilder(tessel::IMaskBuilder* poBuilder) { mpoMaskBuilder = poBuilder; }
    tessel::IMaskBuilder* GetMaskBuilder() const { return mpoMaskBuilder; }
    /// As of QRDDataCopy. What the output file holds is kept only where the driver loads it into
    /// the block first, see SetPreloadOutput there.
    void SetKeepOutput(bool bKeepOutput) { moCopy.SetKeepOutput(bKeepOutput); }

    /// The same as QRDDataCopy::Process.
    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                 tessel::Raster* poRasterOut) const;

private:
    tessel::IMaskBuilder* mpoMaskBuilder = nullptr;
    QRDDataCopy moCopy;
};

/// Copies a block onto an output that may hold data already, for mosaics: balances its colours to
/// what is there, and feathers the edge of its valid area.
///
///     t   = gain * in + offset                                              in double
///     t   = (t - low)^2 / (high - low) + low   with UseKnee, for start < t < high
///     out = t                                  inside the valid area
///     out = ((b - d) * t + d * out) / b        at a distance 0 < d < b, in float
/// b is the blend width and d the distance to the nearest valid pixel, in pixels along rows and
/// columns. Farther outside nothing is written.
///
/// Stages   first, while the stage is ePS_Gather, all blocks are shown: nothing is written, and
///          where input and output overlap (0 < d <= SampleBand), means of 2 by 2 pixels of the
///          first channel are gathered. Then, with ePS_Apply, all are shown again and written. Gain
///          and offset are found once, by GetGain, GetOffset or the first block that is written.
/// Balance  SetBalanceMode. 1: over all pairs of samples (of many, about ten thousand pairs) with
///          different inputs, the medians of the slopes and of the intercepts of the lines through
///          them. 2: the line that maps the low and the high percentile of the inputs to those of
///          the outputs. Then, before the first block is written, with (g, o) that line, mid the
///          middle of the gathered inputs and lo, hi the extremes of the input inside the valid
///          area (seen while gathering):
///          gain = Stretch * g,
///          offset = (1 - Stretch) * g * mid + o + ((g * hi + o) - (g * lo + o)) * OffsetShare.
/// Input    any of the ten real types.
/// Output   any of the ten real types; same width, height and channels. t is narrowed to float and
///          stored by the library's conversion rules. Margins are not written.
/// Clip     the builder's mask says which pixels are valid; without one all are, and nothing is
///          gathered.
/// No data  the apply stage compares as float and skips sample by sample: an input sample that is
///          "no data" is not copied, and an output sample that is takes no part in blending. A
///          value that would be stored as the output's "no data" is moved by 1 (up, or down from
///          the greatest float) and stored again, once: where 1 changes nothing, as beyond 2^24 or
///          at the end of an integer type, it stays. The gather stage compares in the type of the
///          sample, whatever the two flags say; a value outside that type matches nothing.
/// Corners  meant: only the left half of a block is gathered from, at every column and every second
///          row; mode 3 gives gain and offset 0. No samples: gain 1 and offset 0 in modes 1 and 2.
///          Samples that are not a number count as greatest. A percentile that points outside the
///          samples reads 0.
/// Errors   kor::Exception "Invalid type requested." for other types; what the clip builder throws;
///          in hardened builds also for null pointers and blocks whose geometries do not match.
///          Otherwise the pointers are not checked.
/// Threads  splits the rows among the threads of OpenMP, with the same results on any number. One
///          object must not be called by two threads at once.
/// State    parameters and gathered samples live in the processor of the last pair of types. It is
///          made by the first block and again when the types change; setters count when it is made,
///          the stage at once. Copies of the object share it.
/// Source   distances: A. Rosenfeld, J. L. Pfaltz, "Sequential operations in digital picture
///          processing", Journal of the ACM 13(4), 471-494, 1966; deviation: pixels outside the
///          block count as W + H + 2 * (mx + my) away, W and H its size, mx and my its margins.
///          Mode 1: P. K. Sen, "Estimates of the regression coefficient based on Kendall's tau",
///          Journal of the American Statistical Association 63(324), 1379-1389, 1968; deviation:
///          pairs are thinned, and the offset is the median of the pairs' intercepts.
class ExtendedDataCopy : public details::ExtendedDataCopyParams, private ProcessorCache<IProcessor>
{
public:
    template <class TIn, class TOut>
    class InnerProcessor;

    void ProcessBlock(tessel::Raster* poRasterIn, tessel::Raster* poRasterOut);

    /// Tells the valid pixels of input blocks; borrowed. Null, as at first: all are.
    void SetClipBuilder(tessel::IMaskBuilder* poClipBuilder) { mpoClipBuilder = poClipBuilder; }
    /// Gain and offset in use: those found from the samples, before the first written block without
    /// Stretch and OffsetShare. 1 and 0 as long as no block was shown.
    double GetGain() override;
    double GetOffset() override;
    void SetProcessStage(ProcessStage eStage) override;

private:
    tessel::IMaskBuilder* mpoClipBuilder = nullptr;
};

/// Copies channels of an image file to a new KORDSK file.
///
/// oChannels   numbers from 1; none means all. The new file has those of one data type behind each
///             other, the types in the order in which they are met: of channels 1 (8U), 2 (16U) and
///             3 (8U) it has 1 and 3, then 2.
///
/// Descriptions, metadata, no-data values and the georeferencing go with them; bitmaps do not.
/// Errors   kor::FileException "File already exists.\n" (translated) when there is an output file,
///          which is not touched; kor::Exception or one of its kin when the input cannot be read, a
///          channel does not exist or has no whole bytes (eDT_BIT), or the output cannot be
///          written. The output file is removed then.
/// Threads  reads, copies and writes on three threads.
void CopyBands(std::string oInputFile, std::string oOutputFile,
               std::vector<unsigned int> oChannels);

/// The same from one open dataset to another one: channels are appended to oOutput, which gets
/// auxiliary data and georeferencing. What was written before an error stays.
void CopyChannels(datasources::IRasterDataset& oInput, datasources::IRasterDataset& oOutput,
                  const std::vector<unsigned int>& oChannels);

}  // namespace kor::filters
