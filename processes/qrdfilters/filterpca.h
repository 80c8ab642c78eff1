#pragma once

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "basic/tessel/mask/imaskbuilder.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"
#include "processes/qrdfilters/iprocessor.h"
#include "processes/qrdfilters/typedfilter.h"

namespace kor::datasources
{
class IBitmapDataset;
}

/// Principal components of the channels of an image: first the statistics of the image, then the
/// transform of its blocks.
///
///     PCAStatistics oStatistics(oFile, {}, {1, 2, 3}, {4, 5}, {1, 2});
///     oStatistics.GetRasterStats(vfCovariance, vfMeans, vfDeviations);
///     oStatistics.ComputeEigen(3, vfCovariance, vfEigenvalues);  // now the eigenvectors
///     oStatistics.GetEigenStats(vfEigenvalues, vfEigenDeviations, vfVariance);
///     // the caller chooses midpoints and scales; then oStatistics.GetPCAPrint(...)
///     oAlgorithm.SetValues(vfCovariance, vfScale, {1, 2}, vfMidPoint, vfMeans);
namespace kor::filters
{

/// Means, covariances and principal components of channels of a dataset, and the report on them.
///
///     mean[i]           = (sum of x[i]) / n
///     covariance[i][j]  = (sum of x[i] * x[j]) / n - mean[j] * mean[i]
/// over the n pixels of the sample, in double, in one pass, and stored as float. Meant: the divisor
/// is n and not n - 1.
///
/// Input    channels of one real type of a file that kor::datasources::DatasetManager opens. The
///          sample is all pixels, or those inside a sampling window (x offset, y offset, width,
///          height in pixels), or those where a bitmap of the dataset (SetSegMask) is set. The
///          bitmap wins over the window.
/// Output   vectors that the caller sizes: what does not fit is not written, and what is missing
///          where they are read is 0. Matrices lie row by row.
/// Corners  an empty sample: a sample size of 0, means and covariances that are not numbers, and
///          deviations of 0. A constant channel: variance and deviation 0.
/// Errors   kor::DataException, kor::IOException and their kin from opening and reading, such as
///          for channels of different types; kor::Exception "This dataset doesn't support bitmap
///          segment" when a bitmap is asked of a dataset without; "Invalid type requested." for
///          complex channels; kor::ParameterException of FilteringMaskBuilder for a window on
///          channels of 32-bit or 64-bit integers or eDT_8S.
/// Threads  works on the calling thread. One object must not be called by two threads at once.
/// Source   H. Hotelling, "Analysis of a complex of statistical variables into principal
///          components", Journal of Educational Psychology 24, 417-441, 1933.
class PCAStatistics
{
public:
    /// Adds the pixels of a block to sums of their samples and products.
    class IStatsProcessor
    {
    public:
        virtual ~IStatsProcessor() = default;
        /// For the pixels inside the margins whose mask bit is set (all, where poMask is null), in
        /// row order: sums[c] += x[c]; products[k++] += x[i] * x[j] for each i and each j from i;
        /// and count goes up by one. All in double.
        virtual void Process(tessel::Raster* poRaster, tessel::Mask* poMask,
                             std::vector<double>& vdfSums, std::vector<double>& vdfProducts,
                             long& nCount) const = 0;
    };
    template <class T>
    class InnerStatsProcessor;
    /// The processor for blocks of a real type; the caller owns it. Throws kor::Exception "Invalid
    /// type requested." for others.
    static IStatsProcessor* MakeStatsProcessor(const tessel::DataType& oType);

    /// oInputs: channels to analyse, numbered from 1. oOutputs and oEigens: channels that the
    /// transform is to be written to, and the number of the component (from 1) for each; they are
    /// printed only. oWindow has four elements, or it does not count.
    PCAStatistics(std::string& oFile, std::vector<unsigned int> oWindow,
                  std::vector<unsigned int> oInputs, std::vector<unsigned int> oOutputs,
                  std::vector<unsigned int> oEigens);

    /// Numbers of a signature segment, which is printed only, and of the bitmap that selects the
    /// sample; 0, as at first: none. The next GetRasterStats goes by them.
    void SetSegMask(int nSignature, int nBitmap);

    /// Reads the dataset. oCovariance is inputs x inputs, the others have an element an input;
    /// oDeviations are square roots of the variances.
    void GetRasterStats(std::vector<float>& oCovariance, std::vector<float>& oMeans,
                        std::vector<float>& oDeviations);

    /// Eigenvalues and eigenvectors of the symmetric n x n matrix, which is replaced by the
    /// vectors: row k is the one of eigenvalue k. The order is descending by absolute value, of
    /// equal ones the one found later first. See SolveEigensystem. Throws kor::DataException "Too
    /// many iteration in eigen vector calculation.", as for a matrix that is not of numbers.
    void ComputeEigen(int n, std::vector<float>& oMatrix, std::vector<float>& oEigenvalues);

    /// oDeviations[i] = sqrt(|value[i]|), oVariance[i] = 100 * value[i] / (sum of |value|), per
    /// cent.
    void GetEigenStats(std::vector<float> oEigenvalues, std::vector<float>& oDeviations,
                       std::vector<float>& oVariance);

    /// Prints the analysis to kor::ledger::Report. pszMode "LONG", in any case and with anything
    /// behind it, adds the covariances and the eigenvectors; any other, such as "SHORT", does not.
    /// The sample size is that of the last GetRasterStats. Midpoints, scale deviations, scales,
    /// minima and maxima have an element an output channel.
    void GetPCAPrint(const char* pszMode, std::vector<float> oCovariance, std::vector<float> oMeans,
                     std::vector<float> oMidPoints, std::vector<float> oScaleDeviations,
                     std::vector<float> oDeviations, std::vector<float> oEigenvectors,
                     std::vector<float> oEigenvalues, std::vector<float> oVariance,
                     std::vector<float> oEigenDeviations, std::vector<float> oScales,
                     std::vector<float> oMins, std::vector<float> oMaxs) const;

    /// Prints a matrix, rows x columns by the numbers of labels: nMode 1 with labels, 0 bare, any
    /// other nothing. Meant: for each five columns there is a page, but the first one carries all
    /// columns, and those behind it only their line ends and, with labels, the start of the head.
    void matprt(int nMode, std::vector<float> oMatrix, std::vector<unsigned int> oColumns,
                std::vector<unsigned int> oRows) const;

private:
    std::unique_ptr<tessel::IMaskBuilder> MakeSelector(
        datasources::IBitmapDataset* poBitmaps) const;
    void PrintSample() const;

    std::string moFileName;
    std::vector<unsigned int> mvnWindow;
    std::vector<unsigned int> mvnInputs;
    std::vector<unsigned int> mvnOutputs;
    std::vector<unsigned int> mvnEigens;
    int mnInputs;
    int mnOutputs;
    int mnSignature = 0;
    int mnBitmap = 0;
    long mnSampleSize = 0;
};

namespace details
{

/// Parameters of FilterPCA. They count for processors made later, see there.
class PCAParams
{
public:
    virtual ~PCAParams() = default;

    /// Per output channel the number of its component, from 1.
    void SetEigen(std::vector<unsigned int> vnEigen) { mvnEigen = std::move(vnEigen); }
    /// The eigenvectors by rows, inputs x inputs.
    void SetCovMat(std::vector<float> vfCovMat) { mvfCovMat = std::move(vfCovMat); }
    /// Per output channel the factor of the component.
    void SetScale(std::vector<float> vfScale) { mvfScale = std::move(vfScale); }
    /// Per output channel the value added after scaling, in output values.
    void SetMidPoint(std::vector<float> vfMidPoint) { mvfMidPoint = std::move(vfMidPoint); }
    /// Per input channel the mean that is taken off.
    void SetMeans(std::vector<float> vfMeans) { mvfMeans = std::move(vfMeans); }
    /// Kept and not used.
    void SetMins(std::vector<float> vfMins) { mvfMins = std::move(vfMins); }
    /// Kept and not used.
    void SetMaxs(std::vector<float> vfMaxs) { mvfMaxs = std::move(vfMaxs); }

protected:
    std::vector<unsigned int> mvnEigen;
    std::vector<float> mvfCovMat;
    std::vector<float> mvfScale;
    std::vector<float> mvfMidPoint;
    std::vector<float> mvfMeans;
    std::vector<float> mvfMins;
    std::vector<float> mvfMaxs;
};

}  // namespace details

/// Principal component transform: projects each pixel on chosen eigenvectors.
///
///     v = sum over c of (x[c] - Means[c]) * CovMat[(Eigen[k] - 1) * C + c],   c from 0, in float
///     out[k] = v * Scale[k] + MidPoint[k]
/// C is the number of input channels and k the output channel.
///
/// Input    any of the ten real types; samples are converted to float.
/// Output   any of the ten real types, same width and height, as many channels as components are
///          wanted; float values are stored by the library's conversion rules. Margins are not
///          written.
/// Masks    poMaskIn is not looked at: every pixel is transformed.
/// Corners  scale 0 gives the midpoint everywhere. A vector without an element that is needed
///          counts as 0 there, and so does a component whose number is outside CovMat.
/// Errors   kor::Exception "poRasterIn is invalid pointer", "poRasterOut is invalid pointer",
///          "Invalid type requested." (complex types, eDT_BIT), all before anything is written; in
///          hardened builds also for blocks of different sizes.
/// Threads  works on the calling thread. Two threads may call one object at once after it has
///          worked on the same pair of types.
/// State    the processor of the last pair of types is kept; setters count when one is made. Copies
///          of the filter start without one. The least and greatest v of each output channel, see
///          PCAAlgorithm, are common to all filters of the process.
class FilterPCA : public details::PCAParams, private ProcessorCache<IProcessor>
{
public:
    template <class TIn, class TOut>
    class InnerProcessor;

    FilterPCA() = default;
    FilterPCA(const FilterPCA& oOther);
    FilterPCA& operator=(const FilterPCA& oOther);

    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                 tessel::Raster* poRasterOut) const;
};

/// FilterPCA as an algorithm for the block loop of a caller.
///
/// Errors   kor::Exception "You have to Set the values before calling Process."; those of
///          FilterPCA.
/// Threads  as of FilterPCA. Copies share the filter.
class PCAAlgorithm
{
public:
    /// Starts anew with these parameters, see FilterPCA.
    void SetValues(std::vector<float> oCovMat, std::vector<float> oScale,
                   std::vector<unsigned int> oEigen, std::vector<float> oMidPoint,
                   std::vector<float> oMeans);
    void ProcessBlock(tessel::Raster* poRasterIn, tessel::Raster* poRasterOut) const;

    /// The least and the greatest v that any filter of this process has met, by output channel.
    /// Meant: they start at 0, so that the least is never above and the greatest never below 0;
    /// they are never reset, and each processor that is made appends an entry for each of its
    /// output channels at the end, while all of them count in the entries at the front. A v that is
    /// not a number does not count. Blocks of several threads count exactly.
    std::vector<float> GetMinVal() const;
    std::vector<float> GetMaxVal() const;

private:
    std::shared_ptr<FilterPCA> mpoFilter;
};

}  // namespace kor::filters
