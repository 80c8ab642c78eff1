#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "platform/datasources/irasterreader.h"
#include "platform/exception/exception.h"
#include "processes/qrdfilters/simulation/projection.h"

/// How a DEM window lies under the track, and in which order the simulators walk it.
namespace kor::filters::simulation
{

/// Throws kor::ParameterException when a list holds fewer values than are read of it. pszSource is
/// the source path of the simulator.
template <class T>
void RequireValues(const std::vector<T>& oList, std::size_t nNeeded, const char* pszName,
                   const char* pszSource)
{
    if (oList.size() < nNeeded)
    {
        const std::string oHeld = std::to_string(oList.size());
        throw ParameterException(pszName, ParameterException::Type::eInvalidValue, oHeld,
                                 std::to_string(nNeeded),
                                 std::string(pszName) + " holds " + oHeld + " of the " +
                                     std::to_string(nNeeded) + " values that are needed",
                                 pszSource, __PRETTY_FUNCTION__, __LINE__);
    }
}

/// Cut to an integer of 32 bits; what cannot be one (not a number too) is the lowest of them, which
/// is no line and no column of any image.
inline std::int64_t Truncated(double dfValue)
{
    return dfValue > -2147483648.0 && dfValue < 2147483648.0 ? static_cast<std::int64_t>(dfValue)
                                                             : std::int64_t{-2147483648};
}

/// A value in single precision. Not inline: where two values side by side are narrowed and widened
/// again, g++ 12 drops both steps at -O2 and keeps the digits.
double RoundedToSingle(double dfValue);

/// The window of the DEM, in pixels of its dataset.
struct DemWindow
{
    std::int64_t mnX = 0;
    std::int64_t mnY = 0;
    std::int64_t mnWidth = 0;
    std::int64_t mnHeight = 0;
};

/// Of a list of four values.
template <class T>
DemWindow WindowOf(const std::vector<T>& vnDbiw)
{
    return {std::int64_t{vnDbiw[0]}, std::int64_t{vnDbiw[1]}, std::int64_t{vnDbiw[2]},
            std::int64_t{vnDbiw[3]}};
}

/// Bits of a sample of the first channel. Throws kor::Exception when there is none.
std::uint32_t ChannelBits(const datasources::IRasterReader& oReader, const char* pszSource);

/// Throws kor::ParameterException when the window is empty or has rows outside the image.
void RequireWindow(const DemWindow& oWindow, const datasources::IRasterReader& oReader,
                   const char* pszSource);

/// Throws kor::Exception when rows as wide as the window, of nBytes a column, and the maxima of its
/// lines take more memory than the machine has: a window may be wider than the image.
void RequireRowMemory(const DemWindow& oWindow, std::size_t nBytes);

/// Rows and columns count from 1: rows in the dataset, columns in the window.
struct ScanOrder
{
    ScanOrder(double dfHeading, const DemWindow& oWindow);

    std::int64_t mnFirstRow;
    std::int64_t mnLastRow;
    std::int64_t mnRowStep;  ///< 1 or -1
    std::int64_t mnFirstCol;
    std::int64_t mnLastCol;
    std::int64_t mnColStep;
};

/// Which corners of the window bound the radar image, x to the right and y downwards in metres.
struct ScanFrame
{
    struct Corner
    {
        double x = 0.0;
        double y = 0.0;
    };

    /// dfRadians is the heading once more; dfXSize and dfYSize are the extents of the window.
    ScanFrame(double dfHeading, double dfRadians, double dfXSize, double dfYSize);

    double mdfSinHead;
    double mdfCosHead;
    double mdfStart;  ///< along the track, metres
    double mdfEnd;
    Corner moNear;
    Corner moFar;
    float mfSideSign;  ///< 1 or -1
    bool mbMirror;     ///< columns count from the far end
};

/// The radar image: where its columns begin, and its size.
struct RadarGrid
{
    double mdfNearRange = 0.0;   ///< metres
    double mdfPerRange = 0.0;    ///< pixels a metre
    double mdfPerAzimuth = 0.0;  ///< lines a metre
    double mdfStart = 0.0;       ///< along the track, metres
    std::int64_t mnPixels = 0;
    std::int64_t mnLines = 0;
    bool mbMirror = false;
};

/// A computed number of lines or pixels; throws kor::Exception when no image can have as many.
std::int64_t ImageSize(double dfSize, const char* pszUnit, const char* pszSource);

/// Lowest and highest elevation, metres.
struct ElevationRange
{
    double mdfLowest = 0.0;
    double mdfHighest = 0.0;
};

}  // namespace kor::filters::simulation
