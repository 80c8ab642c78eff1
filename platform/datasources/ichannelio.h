#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

namespace kor::datasources
{

/// A rectangle of an image, in pixels; never empty and never reaching outside the image.
struct PixelWindow
{
    std::uint32_t mnX = 0;
    std::uint32_t mnY = 0;
    std::uint32_t mnWidth = 0;
    std::uint32_t mnHeight = 0;
};

/// Where the samples of a window lie in memory, in bytes from one to the next.
struct SampleStrides
{
    std::size_t mnChannel = 0;
    std::size_t mnPixel = 0;
    std::size_t mnLine = 0;
};

/// Moves samples between the channels of one dataset and memory: all that readers and writers need
/// of a dataset, and what a dataset driver implements.
///
/// Each reader and each writer has one of its own and uses it from one thread at a time. Samples
/// have the channel's own type, both parts of a complex one side by side; a sample of eDT_BIT is a
/// byte, 0 or 1 (written: 0 or not 0). The channels of one call are numbered from 1, exist and have
/// one type; a number may occur twice.
///
/// Errors   kor::IOException with the file's name and the reason. What a failed Read leaves in
///          memory is not told; a failed Write may have written a part.
class IChannelIO
{
public:
    virtual ~IChannelIO() = default;

    /// Sample (x, y) of channel oChannels[c] goes to pSamples + c * mnChannel + x * mnPixel +
    /// y * mnLine, x and y counted from the window's corner. Samples never written read as 0.
    virtual void Read(std::span<const unsigned int> oChannels, const PixelWindow& oWindow,
                      unsigned char* pSamples, const SampleStrides& oStrides) = 0;
    /// The same the other way. Called only on an object that was opened for writing.
    virtual void Write(std::span<const unsigned int> oChannels, const PixelWindow& oWindow,
                       const unsigned char* pSamples, const SampleStrides& oStrides) = 0;
};

}  // namespace kor::datasources
