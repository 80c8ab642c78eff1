#include <strings.h>

#include <algorithm>
#include <string>
#include <vector>

#include "platform/ledger/report.h"
#include "processes/qrdfilters/filterpca.h"
#include "processes/qrdfilters/statistics/checkedvector.h"

namespace kor::filters
{

using ledger::FormatString;
using ledger::Report;

namespace
{

void EndLine()
{
    Report::AddInfo("\n");
}

/// Sixteen numbers a line; later lines start with nIndent blanks.
void PrintNumbers(const char* pszTitle, const std::vector<unsigned int>& vnNumbers,
                  std::size_t nIndent)
{
    constexpr std::size_t kNumbersPerLine = 16;
    Report::AddInfo(pszTitle);
    for (std::size_t i = 0; i < vnNumbers.size(); ++i)
    {
        if (i > 0 && i % kNumbersPerLine == 0)
        {
            EndLine();
            Report::AddInfo(std::string(nIndent, ' '));
        }
        Report::AddInfo(FormatString("%4d", static_cast<int>(vnNumbers[i])));
    }
    EndLine();
}

/// A title and an empty line.
void PrintTitle(const char* pszTitle)
{
    Report::AddInfo(pszTitle);
    EndLine();
    EndLine();
}

/// One output channel with the scaling that takes its component there.
struct OutputScaling
{
    int nEigen;
    int nOutput;
    double dfMin;
    double dfMax;
    double dfDeviation;
    double dfMidPoint;
    double dfScale;
};

void PrintScaling(const OutputScaling& o)
{
    if (o.dfDeviation != 0.0)
    {
        Report::AddInfo(FormatString(" %5d %5d %12.4g %12.4g  %7.2f %12.3f%12.4g", o.nEigen,
                                     o.nOutput, o.dfMin, o.dfMax, o.dfDeviation, o.dfMidPoint,
                                     o.dfScale));
    }
    else
    {
        Report::AddInfo(FormatString(" %5d %5d %12.4g%12.4g all %12.3g%12.3g", o.nEigen, o.nOutput,
                                     o.dfMin, o.dfMax, o.dfMidPoint, o.dfScale));
    }
    EndLine();
}

void PrintMatrixHead(const std::vector<unsigned int>& vnColumns, std::size_t nShown)
{
    Report::AddInfo(FormatString("%5s", "    "));
    for (std::size_t c = 0; c < nShown; ++c)
    {
        Report::AddInfo(FormatString("%14d", static_cast<int>(vnColumns[c])));
    }
    EndLine();
    Report::AddInfo("   ");
    for (std::size_t c = 0; c < nShown; ++c)
    {
        Report::AddInfo(FormatString("%14s", c == 0 ? "+----------------" : "----------------"));
    }
    EndLine();
}

}  // namespace

void PCAStatistics::GetPCAPrint(const char* pszMode, std::vector<float> oCovariance,
                                std::vector<float> oMeans, std::vector<float> oMidPoints,
                                std::vector<float> oScaleDeviations, std::vector<float> oDeviations,
                                std::vector<float> oEigenvectors, std::vector<float> oEigenvalues,
                                std::vector<float> oVariance, std::vector<float> oEigenDeviations,
                                std::vector<float> oScales, std::vector<float> oMins,
                                std::vector<float> oMaxs) const
{
    const bool bLong = pszMode != nullptr && strncasecmp(pszMode, "LONG", 4) == 0;
    Report::AddHeader("PCA", "");
    EndLine();
    Report::AddInfo(FormatString("%s", moFileName.c_str()));
    EndLine();
    PrintNumbers(" Input  Channels:", mvnInputs, 17);
    if (mnOutputs > 0)
    {
        PrintNumbers(" Output Channels:", mvnOutputs, 18);
        PrintNumbers(" Eigenchannels  :", mvnEigens, 18);
    }
    PrintSample();

    PrintTitle("  Channel               Mean        Deviation ");
    for (std::size_t i = 0; i < mvnInputs.size(); ++i)
    {
        Report::AddInfo(FormatString("  %5d      %14.6g  %14.6g", static_cast<int>(mvnInputs[i]),
                                     double{ElementOf(oMeans, i)},
                                     double{ElementOf(oDeviations, i)}));
        EndLine();
    }
    if (bLong)
    {
        EndLine();
        PrintTitle(" Covariance Matrix for input channels: ");
        matprt(1, std::move(oCovariance), mvnInputs, mvnInputs);
    }
    // Meant: both percent signs are printed.
    EndLine();
    PrintTitle(" Eigenchannel     Eigenvalue       Deviation       %%Variance");
    for (std::size_t i = 0; i < mvnInputs.size(); ++i)
    {
        Report::AddInfo(FormatString("  %5d       %14.4g %14.4g       %6.2g%%",
                                     static_cast<int>(i + 1), double{ElementOf(oEigenvalues, i)},
                                     double{ElementOf(oEigenDeviations, i)},
                                     double{ElementOf(oVariance, i)}));
        EndLine();
    }
    if (bLong)
    {
        EndLine();
        PrintTitle(" Eigenvectors of covariance matrix (arranged by rows): ");
        matprt(0, std::move(oEigenvectors), mvnInputs, mvnInputs);
    }
    if (mnOutputs > 0)
    {
        EndLine();
        Report::AddInfo("Scaling Information:\n\n");
        Report::AddInfo(" Eigen Output        ----Unscaled----     Deviation    Midpoint   Scale");
        EndLine();
        Report::AddInfo(
            " Channl Chnnl        Min          Max        Range                Factor ");
        Report::AddInfo("\n\n");
        for (std::size_t i = 0; i < mvnOutputs.size(); ++i)
        {
            PrintScaling({static_cast<int>(ElementOf(mvnEigens, i)),
                          static_cast<int>(mvnOutputs[i]), ElementOf(oMins, i), ElementOf(oMaxs, i),
                          ElementOf(oScaleDeviations, i), ElementOf(oMidPoints, i),
                          ElementOf(oScales, i)});
        }
    }
}

void PCAStatistics::PrintSample() const
{
    if (mnBitmap == 0 && mnSignature == 0 && mvnWindow.size() == 4)
    {
        EndLine();
        Report::AddInfo(FormatString(" Sampling Window  : %4d %4d% 4d %4d",
                                     static_cast<int>(mvnWindow[0]), static_cast<int>(mvnWindow[1]),
                                     static_cast<int>(mvnWindow[2]),
                                     static_cast<int>(mvnWindow[3])));
    }
    if (mnBitmap > 0)
    {
        EndLine();
        Report::AddInfo(FormatString(" Sampling Bitmap  : %7d", mnBitmap));
    }
    if (mnSignature != 0)
    {
        EndLine();
        Report::AddInfo(FormatString(" Sampling Signature  : %7d", mnSignature));
    }
    EndLine();
    Report::AddInfo(FormatString(" Sample Size      : %16ld", mnSampleSize));
    EndLine();
    EndLine();
}

void PCAStatistics::matprt(int nMode, std::vector<float> oMatrix,
                           std::vector<unsigned int> oColumns,
                           std::vector<unsigned int> oRows) const
{
    constexpr int kColumnsPerPage = 5;
    if (nMode != 0 && nMode != 1)
    {
        return;
    }
    const int nColumns = static_cast<int>(oColumns.size());
    const int nPages = (nColumns - 1) / kColumnsPerPage + 1;
    std::size_t nPrinted = 0;
    for (int nPage = 0; nPage < nPages; ++nPage)
    {
        // Meant: see the header. The values of the first page leave no columns to the others.
        const std::size_t nShown = oColumns.size() - std::min(nPrinted, oColumns.size());
        if (nMode == 1)
        {
            PrintMatrixHead(oColumns, nShown);
        }
        for (std::size_t r = 0; r < oRows.size(); ++r)
        {
            if (nMode == 1 && nShown > 0)
            {
                Report::AddInfo(FormatString("%3d|", static_cast<int>(oRows[r])));
            }
            for (std::size_t c = 0; c < nShown; ++c)
            {
                Report::AddInfo(FormatString("%14.4g", double{ElementOf(oMatrix, nPrinted++)}));
            }
            EndLine();
        }
        Report::AddInfo("\n\n\n");
    }
}

}  // namespace kor::filters
