#include <gdal.h>
#include <gtest/gtest.h>

#include "platform/datasources/gdal/gdalfile.h"
#include "platform/datasources/gdal/gdaltypes.h"
#include "platform/datasources/kordsk/writevrt.h"
#include "tests/support/kordskfiles.h"
#include "tests/support/temporarydirectory.h"

// KORDSK files read by GDAL, through the description that is written beside them.
namespace kor::datasources
{
namespace
{

constexpr int kWidth = 37;
constexpr int kHeight = 11;

OwnedGdalDataset OpenVrt(const std::string& oVrt)
{
    GDALAllRegister();
    return OwnedGdalDataset(GDALOpen(oVrt.c_str(), GA_ReadOnly));
}

class KordskVrtTest : public ::testing::Test
{
protected:
    test::TemporaryDirectory moDirectory;
    const std::string moFile = moDirectory.File("im age&.kdk");
};

TEST_F(KordskVrtTest, GdalReadsTheSameSamplesOfAllTypesThatItHas)
{
    std::vector<tessel::DataType> voTypes;
    for (const tessel::DataType& oType : test::kAllTypes)
    {
        if (oType == tessel::eDT_8S || GdalTypeOf(oType) != GDT_Unknown)
        {
            voTypes.push_back(oType);
        }
    }
    ASSERT_GE(voTypes.size(), 12U);
    test::MemoryDataset oMemory(kWidth, kHeight, voTypes);
    test::Random oRandom(1);
    oMemory.FillRandom(oRandom);
    test::CopyChannels(oMemory, *test::NewKordsk(moFile));
    const OwnedGdalDataset poVrt = OpenVrt(WriteVrt(moFile));
    ASSERT_NE(poVrt, nullptr);
    ASSERT_EQ(GDALGetRasterXSize(poVrt.get()), kWidth);
    ASSERT_EQ(GDALGetRasterYSize(poVrt.get()), kHeight);
    ASSERT_EQ(GDALGetRasterCount(poVrt.get()), static_cast<int>(voTypes.size()));
    for (unsigned int nChannel = 1; nChannel <= voTypes.size(); ++nChannel)
    {
        GDALRasterBandH hBand = GDALGetRasterBand(poVrt.get(), static_cast<int>(nChannel));
        const GDALDataType eType = GDALGetRasterDataType(hBand);
        const std::size_t nBytes = voTypes[nChannel - 1].GetSampleBytes() * kWidth * kHeight;
        ASSERT_EQ(static_cast<std::size_t>(GDALGetDataTypeSizeBytes(eType)) * kWidth * kHeight,
                  nBytes);
        std::vector<unsigned char> vnSamples(nBytes);
        ASSERT_EQ(GDALRasterIO(hBand, GF_Read, 0, 0, kWidth, kHeight, vnSamples.data(), kWidth,
                               kHeight, eType, 0, 0),
                  CE_None);
        EXPECT_EQ(std::memcmp(vnSamples.data(), oMemory.At(nChannel, 0, 0), nBytes), 0) << nChannel;
        if (voTypes[nChannel - 1] != tessel::eDT_8S)
        {
            EXPECT_EQ(TypeOfBand(hBand), voTypes[nChannel - 1]);
        }
    }
}

TEST_F(KordskVrtTest, GdalReadsTextsAndPlace)
{
    {
        const auto poKordsk = test::NewKordsk(moFile);
        poKordsk->CreateChannels({kWidth, kHeight, 1, tessel::eDT_32R});
        poKordsk->CreateChannels({kWidth, kHeight, 1, tessel::eDT_64S});
        AuxiliaryData oData;
        oData.SetFileMetadata({{"SENSOR", "<X> & \"Y\""}});
        oData.SetChannel({"Z\xC3\xBCrich > 0", {{"UNIT", "dB"}}, -9999.5}, 1);
        oData.SetChannelNoData(-1048576.0 * 1048576.0, 2);
        poKordsk->SetAuxiliaryData(oData);
        poKordsk->SetGeocodingInfo(
            ogc::cs::GeocodingInfo({500000.123, 10, 0.25, 4600000, 1e-7, -10}));
    }
    const OwnedGdalDataset poVrt = OpenVrt(WriteVrt(moFile));
    ASSERT_NE(poVrt, nullptr);
    EXPECT_STREQ(GDALGetMetadataItem(poVrt.get(), "SENSOR", nullptr), "<X> & \"Y\"");
    GDALRasterBandH hBand = GDALGetRasterBand(poVrt.get(), 1);
    EXPECT_STREQ(GDALGetDescription(hBand), "Z\xC3\xBCrich > 0");
    EXPECT_STREQ(GDALGetMetadataItem(hBand, "UNIT", nullptr), "dB");
    EXPECT_EQ(GDALGetRasterNoDataValue(hBand, nullptr), -9999.5);
    EXPECT_EQ(GDALGetRasterNoDataValueAsInt64(GDALGetRasterBand(poVrt.get(), 2), nullptr),
              -(std::int64_t{1} << 40));
    std::array<double, 6> adfTransform{};
    ASSERT_EQ(GDALGetGeoTransform(poVrt.get(), adfTransform.data()), CE_None);
    EXPECT_EQ(adfTransform, (std::array<double, 6>{500000.123, 10, 0.25, 4600000, 1e-7, -10}));
}

}  // namespace
}  // namespace kor::datasources
