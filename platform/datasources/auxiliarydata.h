#pragma once

#include <map>
#include <optional>
#include <string>
#include <vector>

namespace kor::datasources
{

/// What a file says about its channels and itself besides the pixels. A plain value that is handed
/// out and taken back whole.
///
/// nChannel counts from 1 in the list of the reader, writer or dataset that the data came from.
/// A channel without an entry reads as empty; setting one of its values makes the entry. Setting
/// for channel 0 throws kor::DataException.
///
/// On its way into a dataset or writer (SetAuxiliaryData), an entry replaces all that is stored for
/// that channel, channels without an entry stay as they are, and the file metadata are replaced.
class AuxiliaryData
{
public:
    using Metadata = std::map<std::string, std::string>;

    struct Channel
    {
        std::string moDescription;
        Metadata moMetadata;
        std::optional<double> mdfNoData;

        bool operator==(const Channel&) const = default;
    };

    std::string GetChannelDescription(unsigned int nChannel) const;
    void SetChannelDescription(const std::string& oText, unsigned int nChannel);
    Metadata GetChanMetadata(unsigned int nChannel) const;
    void SetChanMetadata(const Metadata& oMetadata, unsigned int nChannel);
    /// The sample value that stands for "no data", as the nearest double; none where the channel
    /// has no such value. A 64-bit integer value beyond 2^53 may be rounded on the way.
    std::optional<double> GetChannelNoData(unsigned int nChannel) const;
    void SetChannelNoData(std::optional<double> dfNoData, unsigned int nChannel);
    /// The "no data" values of all channels, each once.
    std::vector<double> GetNoDataValues() const;

    Metadata GetFileMetadata() const { return moFileMetadata; }
    void SetFileMetadata(const Metadata& oMetadata) { moFileMetadata = oMetadata; }

    /// All entries by channel number.
    const std::map<unsigned int, Channel>& GetChannels() const { return moChannels; }
    /// Replaces a whole entry.
    void SetChannel(const Channel& oChannel, unsigned int nChannel);

    bool operator==(const AuxiliaryData&) const = default;

private:
    Channel GetChannel(unsigned int nChannel) const;
    Channel& EntryOf(unsigned int nChannel);

    std::map<unsigned int, Channel> moChannels;
    Metadata moFileMetadata;
};

}  // namespace kor::datasources
