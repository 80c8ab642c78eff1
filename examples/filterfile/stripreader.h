#pragma once

#include "examples/filterfile/terminal.h"
#include "platform/datasources/irasterreader.h"

namespace kor::examples
{

/// Another reader's image, for those who go through all its tiles: these are strips of the full
/// width that fit the memory. Shows how far a passage has come. A read fails when an end is asked
/// for.
class StripReader : public datasources::IRasterReader
{
public:
    /// oReader is borrowed. A strip takes nMaxBytes at most, but for one row.
    StripReader(datasources::IRasterReader& oReader, std::uint64_t nMaxBytes);

    unsigned int GetWidth() const override { return moReader.GetWidth(); }
    unsigned int GetHeight() const override { return moReader.GetHeight(); }
    unsigned int GetChannelCount() const override { return moReader.GetChannelCount(); }
    tessel::DataType GetDataType() const override { return moReader.GetDataType(); }
    void ReadRaster(tessel::Raster* poRaster) override;

private:
    datasources::IRasterReader& moReader;
    TerminalStatus moStatus;
};

}  // namespace kor::examples
