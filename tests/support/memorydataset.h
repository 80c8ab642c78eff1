#pragma once

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <memory>
#include <string>
#include <vector>

#include "platform/datasources/irasterdataset.h"
#include "platform/exception/exception.h"
#include "tests/support/blocks.h"

/// A dataset in memory, for tests of what reads and writes datasets.
namespace kor::test
{

/// Channels of any types in vectors. What a test wants to know or to break is public.
class MemoryDataset : public datasources::IRasterDataset
{
public:
    MemoryDataset() = default;
    MemoryDataset(std::uint32_t nWidth, std::uint32_t nHeight,
                  const std::vector<tessel::DataType>& voTypes)
    {
        for (const tessel::DataType& oType : voTypes)
        {
            MemoryDataset::CreateChannels({nWidth, nHeight, 1, oType});
        }
    }

    std::string GetFileName() const override { return "memory"; }
    datasources::AuxiliaryData GetAuxiliaryData() const override { return moData; }
    void SetAuxiliaryData(const datasources::AuxiliaryData& oData) override
    {
        for (const auto& [nChannel, oChannel] : oData.GetChannels())
        {
            moData.SetChannel(oChannel, nChannel);
        }
        moData.SetFileMetadata(oData.GetFileMetadata());
    }
    const ogc::cs::GeocodingInfo& GetGeocodingInfo() const override { return moGeocoding; }
    void SetGeocodingInfo(const ogc::cs::GeocodingInfo& oInfo) override { moGeocoding = oInfo; }
    void Flush() override { ++mnFlushes; }

    unsigned int GetWidth() const override { return mnWidth; }
    unsigned int GetHeight() const override { return mnHeight; }
    unsigned int GetChannelCount() const override
    {
        return static_cast<unsigned int>(mvoChannels.size());
    }
    tessel::DataType GetChannelType(unsigned int nChannel) const override
    {
        return mvoChannels.at(nChannel - 1).moType;
    }
    unsigned int CreateChannels(const tessel::RasterInfo& oInfo) override
    {
        RequireWritable();
        const unsigned int nFirst = GetChannelCount() + 1;
        mnWidth = oInfo.mnWidth;
        mnHeight = oInfo.mnHeight;
        mvoChannels.resize(mvoChannels.size() + oInfo.mnChannels,
                           Channel{oInfo.moDataType,
                                   std::vector<unsigned char>(std::size_t{mnWidth} * mnHeight *
                                                              oInfo.moDataType.GetSampleBytes())});
        return nFirst;
    }
    unsigned int GetTileWidth() const override { return mnTileWidth == 0 ? mnWidth : mnTileWidth; }
    unsigned int GetTileHeight() const override
    {
        return mnTileHeight == 0 ? mnHeight : mnTileHeight;
    }
    std::unique_ptr<datasources::IChannelIO> OpenChannels(bool bWrite) override
    {
        if (bWrite)
        {
            RequireWritable();
        }
        return std::make_unique<ChannelIO>(*this);
    }

    /// Bytes of pixel (x, y) of a channel, numbered from 1.
    unsigned char* At(unsigned int nChannel, std::size_t x, std::size_t y)
    {
        Channel& oChannel = mvoChannels.at(nChannel - 1);
        return oChannel.mvnSamples.data() + (y * mnWidth + x) * oChannel.moType.GetSampleBytes();
    }
    template <class T>
    T& Sample(unsigned int nChannel, std::size_t x, std::size_t y)
    {
        return *reinterpret_cast<T*>(At(nChannel, x, y));
    }
    /// Fills all channels; bits with bytes 0 or 1.
    void FillRandom(Random& oRandom)
    {
        for (Channel& oChannel : mvoChannels)
        {
            const bool bBits = oChannel.moType == tessel::eDT_BIT;
            tessel::Raster oRaster({mnWidth, mnHeight, 1, bBits ? tessel::eDT_8U : oChannel.moType},
                                   {}, oChannel.mvnSamples.data(), false);
            test::FillRandom(oRaster, Samples::Special, oRandom);
            for (std::size_t i = 0; bBits && i < oChannel.mvnSamples.size(); ++i)
            {
                oChannel.mvnSamples[i] &= 1U;
            }
        }
    }

    bool mbReadOnly = false;
    bool mbBroken = false;         ///< reading and writing pixels fail
    bool mbOutOfMemory = false;    ///< they throw std::bad_alloc
    unsigned int mnTileWidth = 0;  ///< 0: the image's width
    unsigned int mnTileHeight = 0;
    int mnFlushes = 0;
    std::size_t mnPixelsRead = 0;  ///< samples of all channels that were asked for

private:
    struct Channel
    {
        tessel::DataType moType;
        std::vector<unsigned char> mvnSamples;
    };

    class ChannelIO : public datasources::IChannelIO
    {
    public:
        explicit ChannelIO(MemoryDataset& oDataset) : moDataset(oDataset) {}

        void Read(std::span<const unsigned int> oChannels, const datasources::PixelWindow& oWindow,
                  unsigned char* pSamples, const datasources::SampleStrides& oStrides) override
        {
            Transfer(oChannels, oWindow, oStrides,
                     [&](const unsigned char* pStored, std::size_t nPlace, std::size_t nBytes)
                     {
                         std::memcpy(pSamples + nPlace, pStored, nBytes);
                         ++moDataset.mnPixelsRead;
                     });
        }
        void Write(std::span<const unsigned int> oChannels, const datasources::PixelWindow& oWindow,
                   const unsigned char* pSamples,
                   const datasources::SampleStrides& oStrides) override
        {
            Transfer(oChannels, oWindow, oStrides,
                     [&](unsigned char* pStored, std::size_t nPlace, std::size_t nBytes)
                     { std::memcpy(pStored, pSamples + nPlace, nBytes); });
        }

    private:
        template <class Move>
        void Transfer(std::span<const unsigned int> oChannels,
                      const datasources::PixelWindow& oWindow,
                      const datasources::SampleStrides& oStrides, const Move& oMove)
        {
            EXPECT_GT(oWindow.mnWidth, 0U);
            EXPECT_GT(oWindow.mnHeight, 0U);
            EXPECT_LE(std::uint64_t{oWindow.mnX} + oWindow.mnWidth, moDataset.mnWidth);
            EXPECT_LE(std::uint64_t{oWindow.mnY} + oWindow.mnHeight, moDataset.mnHeight);
            if (moDataset.mbOutOfMemory)
            {
                throw std::bad_alloc();
            }
            if (moDataset.mbBroken)
            {
                throw IOException("memory: broken", "", "", 0);
            }
            for (std::size_t c = 0; c < oChannels.size(); ++c)
            {
                const std::size_t nBytes = moDataset.GetChannelType(oChannels[c]).GetSampleBytes();
                for (std::size_t y = 0; y < oWindow.mnHeight; ++y)
                {
                    for (std::size_t x = 0; x < oWindow.mnWidth; ++x)
                    {
                        oMove(moDataset.At(oChannels[c], oWindow.mnX + x, oWindow.mnY + y),
                              c * oStrides.mnChannel + x * oStrides.mnPixel + y * oStrides.mnLine,
                              nBytes);
                    }
                }
            }
        }

        MemoryDataset& moDataset;
    };

    void RequireWritable() const
    {
        if (mbReadOnly)
        {
            throw IOException("memory: opened for reading", "", "", 0);
        }
    }

    std::uint32_t mnWidth = 0;
    std::uint32_t mnHeight = 0;
    std::vector<Channel> mvoChannels;
    datasources::AuxiliaryData moData;
    ogc::cs::GeocodingInfo moGeocoding;
};

}  // namespace kor::test
