// Tells what image files hold besides their pixels.
//
//     dataset_info FILE...
//
// prints for each file its size, place on the map, metadata, and channels and bitmaps with their
// types, descriptions and no-data values. Texts from the file stand in quotes, with control
// characters as \x1B. Files are not changed, and nothing is written beside them. A file that cannot
// be read is reported on standard error, the others are told of all the same, and the exit status
// is 1.

#include <algorithm>
#include <cstdio>
#include <exception>
#include <iostream>
#include <memory>
#include <string>

#include "platform/datasources/datasetmanager.h"
#include "platform/datasources/datatypename.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "platform/datasources/ibitmapdataset.h"
#include "platform/datasources/irasterdataset.h"

namespace
{

using namespace kor;
using datasources::AuxiliaryData;

/// Fifteen digits, which every double has, and no zeros behind them.
std::string Number(double dfNumber)
{
    char szDigits[32];
    std::snprintf(szDigits, sizeof(szDigits), "%.15g", dfNumber);
    return szDigits;
}

/// In quotes; what would disturb the terminal or the next line is escaped.
std::string Quoted(const std::string& oText)
{
    std::string oQuoted = "\"";
    for (const char nLetter : oText)
    {
        const auto nCode = static_cast<unsigned char>(nLetter);
        if (nCode < ' ' || nCode == 0x7F)
        {
            char szEscape[8];
            std::snprintf(szEscape, sizeof(szEscape), "\\x%02X", static_cast<unsigned int>(nCode));
            oQuoted += szEscape;
        }
        else
        {
            oQuoted += nLetter == '"' || nLetter == '\\' ? "\\" : "";
            oQuoted += nLetter;
        }
    }
    return oQuoted + "\"";
}

std::string SizeText(unsigned int nWidth, unsigned int nHeight)
{
    return std::to_string(nWidth) + " x " + std::to_string(nHeight) + " pixels";
}

/// One line: what it is about, then what there is to say.
void Line(const std::string& oWhat, const std::string& oText)
{
    std::string oStart = "  " + oWhat;
    oStart.resize(std::max<std::size_t>(oStart.size() + 1, 18), ' ');
    std::cout << oStart << oText << '\n';
}

void TellMetadata(const std::string& oWhat, const AuxiliaryData::Metadata& oMetadata)
{
    for (const auto& [oName, oValue] : oMetadata)
    {
        Line(oWhat, Quoted(oName) + " = " + Quoted(oValue));
    }
}

/// The first name in the text of a coordinate system.
std::string SystemName(const std::string& oWkt)
{
    const std::size_t nOpen = oWkt.find('"');
    const std::size_t nClose = nOpen == std::string::npos ? nOpen : oWkt.find('"', nOpen + 1);
    return nClose == std::string::npos ? (oWkt.empty() ? "none" : "without a name")
                                       : Quoted(oWkt.substr(nOpen + 1, nClose - nOpen - 1));
}

void TellPlace(const ogc::cs::GeocodingInfo& oPlace)
{
    if (oPlace == ogc::cs::GeocodingInfo())
    {
        Line("place", "not told");
        return;
    }
    Line("place", "X = " + Number(oPlace.GetXOffset()) + " + column * " +
                      Number(oPlace.GetXPerCol()) + " + row * " + Number(oPlace.GetXPerRow()));
    Line("", "Y = " + Number(oPlace.GetYOffset()) + " + column * " + Number(oPlace.GetYPerCol()) +
                 " + row * " + Number(oPlace.GetYPerRow()));
    Line("coordinates", SystemName(oPlace.GetProjection()));
}

/// One line for a channel or bitmap, and its metadata.
void TellChannel(const std::string& oName, const std::string& oType, const AuxiliaryData& oData,
                 unsigned int nChannel)
{
    const std::string oDescription = oData.GetChannelDescription(nChannel);
    const auto dfNoData = oData.GetChannelNoData(nChannel);
    Line(oName, oType + (oDescription.empty() ? "" : ", " + Quoted(oDescription)) +
                    (dfNoData ? ", no data " + Number(*dfNoData) : ""));
    TellMetadata("  metadata", oData.GetChanMetadata(nChannel));
}

void TellChannels(const datasources::IRasterDataset& oImage)
{
    const AuxiliaryData oData = oImage.GetAuxiliaryData();
    for (unsigned int nChannel = 1; nChannel <= oImage.GetChannelCount(); ++nChannel)
    {
        TellChannel("channel " + std::to_string(nChannel),
                    datasources::DataTypeName(oImage.GetChannelType(nChannel)), oData, nChannel);
    }
}

void TellBitmaps(const datasources::IBitmapDataset& oBitmaps)
{
    for (unsigned int nBitmap = 1; nBitmap <= oBitmaps.GetBitmapCount(); ++nBitmap)
    {
        TellChannel("bitmap " + std::to_string(nBitmap), "one bit a pixel",
                    oBitmaps.GetBitmapAuxiliaryData(nBitmap), 1);
    }
}

void Tell(const std::string& oFile)
{
    const std::unique_ptr<datasources::IDataset> poDataset(
        datasources::DatasetManager::GetInstance()->Open(oFile, 0));
    const auto* poImage = dynamic_cast<const datasources::IRasterDataset*>(poDataset.get());
    const auto* poBitmaps = dynamic_cast<const datasources::IBitmapDataset*>(poDataset.get());
    std::cout << oFile << '\n';
    if (poImage != nullptr && poImage->GetChannelCount() != 0)
    {
        Line("size", SizeText(poImage->GetWidth(), poImage->GetHeight()));
        Line("tiles", SizeText(poImage->GetTileWidth(), poImage->GetTileHeight()));
    }
    else if (poBitmaps != nullptr)
    {
        Line("size", SizeText(poBitmaps->GetBitmapWidth(), poBitmaps->GetBitmapHeight()));
    }
    TellPlace(poDataset->GetGeocodingInfo());
    TellMetadata("metadata", poDataset->GetAuxiliaryData().GetFileMetadata());
    if (poImage != nullptr)
    {
        TellChannels(*poImage);
    }
    if (poBitmaps != nullptr)
    {
        TellBitmaps(*poBitmaps);
    }
}

}  // namespace

int main(int nArguments, char* apszArguments[])
{
    if (nArguments < 2)
    {
        std::cerr << "Usage: dataset_info FILE...\n";
        return 1;
    }
    int nStatus = 0;
    for (int i = 1; i < nArguments; ++i)
    {
        try
        {
            datasources::RegisterGdalDriver();
            Tell(apszArguments[i]);
        }
        catch (const std::exception& oError)
        {
            std::cerr << "dataset_info: " << oError.what() << '\n';
            nStatus = 1;
        }
    }
    return nStatus;
}
