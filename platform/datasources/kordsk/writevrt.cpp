#include "platform/datasources/kordsk/writevrt.h"

#include <fcntl.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <charconv>
#include <cmath>
#include <cstdio>
#include <filesystem>
#include <limits>
#include <system_error>

#include "platform/datasources/datatypename.h"
#include "platform/datasources/guard.h"
#include "platform/datasources/kordsk/escapedtext.h"
#include "platform/datasources/kordsk/kordskfile.h"

namespace kor::datasources
{

namespace
{

constexpr const char* kSource = "platform/datasources/kordsk/writevrt";
constexpr std::uint64_t kLargestSide = std::numeric_limits<int>::max();

struct VrtType
{
    tessel::DataType moType;
    const char* mpszName;
};

constexpr VrtType kVrtTypes[] = {
    {tessel::eDT_8U, "Byte"},       {tessel::eDT_8S, "Byte"},      {tessel::eDT_16U, "UInt16"},
    {tessel::eDT_16S, "Int16"},     {tessel::eDT_32U, "UInt32"},   {tessel::eDT_32S, "Int32"},
    {tessel::eDT_32R, "Float32"},   {tessel::eDT_64U, "UInt64"},   {tessel::eDT_64S, "Int64"},
    {tessel::eDT_64R, "Float64"},   {tessel::eDT_C16S, "CInt16"},  {tessel::eDT_C32S, "CInt32"},
    {tessel::eDT_C32R, "CFloat32"}, {tessel::eDT_C64R, "CFloat64"}};

[[noreturn]] void Refuse(const std::string& oFile, const std::string& oWhat)
{
    throw DataException(oFile + ": a .vrt file cannot describe " + oWhat, kSource,
                        __PRETTY_FUNCTION__, __LINE__);
}

/// Null where there is none.
const char* VrtTypeName(const tessel::DataType& oType)
{
    for (const VrtType& oVrtType : kVrtTypes)
    {
        if (oVrtType.moType == oType)
        {
            return oVrtType.mpszName;
        }
    }
    return nullptr;
}

std::string XmlText(std::string_view oText)
{
    std::string oXml;
    while (!oText.empty())
    {
        const std::size_t nLength = Utf8Length(oText);
        const auto nByte = static_cast<unsigned char>(oText[0]);
        if (nByte == '\t' || nByte == '\n' || nByte == '\r' || nByte == '&' || nByte == '<' ||
            nByte == '>' || nByte == '"')
        {
            oXml += "&#" + std::to_string(nByte) + ";";
        }
        else if (nLength == 0 || nByte < 0x20)
        {
            oXml += '?';
        }
        else
        {
            oXml += oText.substr(0, nLength);
        }
        oText.remove_prefix(nLength == 0 ? 1 : nLength);
    }
    return oXml;
}

/// Whole numbers without an exponent, which GDAL would not understand for 64-bit integers.
std::string NumberText(double dfValue)
{
    const bool bWhole = dfValue == std::floor(dfValue) && std::abs(dfValue) < 1e20;
    std::array<char, 32> anText;
    const auto oResult = bWhole
                             ? std::to_chars(anText.data(), anText.data() + anText.size(), dfValue,
                                             std::chars_format::fixed)
                             : std::to_chars(anText.data(), anText.data() + anText.size(), dfValue);
    return std::string(anText.data(), oResult.ptr);
}

std::string Element(const std::string& oName, const std::string& oContent)
{
    return "<" + oName + ">" + oContent + "</" + oName + ">\n";
}

std::string MetadataText(const AuxiliaryData::Metadata& oMetadata)
{
    std::string oItems;
    for (const auto& [oKey, oValue] : oMetadata)
    {
        oItems += "<MDI key=\"" + XmlText(oKey) + "\">" + XmlText(oValue) + "</MDI>\n";
    }
    return oItems.empty() ? oItems : Element("Metadata", "\n" + oItems);
}

std::string BandText(const std::string& oFile, const KordskPlane& oPlane, std::uint32_t nWidth,
                     const std::string& oChannel)
{
    const char* pszType = VrtTypeName(oPlane.moType);
    if (pszType == nullptr)
    {
        Refuse(oFile, oChannel + ", which has samples of " + DataTypeName(oPlane.moType));
    }
    if (oPlane.mnTileWidth != 0)
    {
        Refuse(oFile, oChannel + ", which is tiled");
    }
    const std::uint64_t nRowBytes = RowBytes(oPlane.moType, nWidth);
    if (nRowBytes > kLargestSide)
    {
        Refuse(oFile, oChannel + ", whose rows have " + std::to_string(nRowBytes) + " bytes");
    }
    std::string oBand;
    if (!oPlane.moData.moDescription.empty())
    {
        oBand += Element("Description", XmlText(oPlane.moData.moDescription));
    }
    oBand += MetadataText(oPlane.moData.moMetadata);
    if (oPlane.moType == tessel::eDT_8S)
    {
        oBand +=
            "<Metadata domain=\"IMAGE_STRUCTURE\">\n"
            "<MDI key=\"PIXELTYPE\">SIGNEDBYTE</MDI>\n</Metadata>\n";
    }
    if (oPlane.moData.mdfNoData)
    {
        oBand += Element("NoDataValue", NumberText(*oPlane.moData.mdfNoData));
    }
    oBand += "<SourceFilename relativeToVRT=\"1\">" +
             XmlText(std::filesystem::path(oFile).filename().string()) + "</SourceFilename>\n";
    oBand += Element("ImageOffset", std::to_string(oPlane.mnOffset));
    oBand += Element("PixelOffset", std::to_string(oPlane.moType.GetSampleBytes()));
    oBand += Element("LineOffset", std::to_string(nRowBytes)) + Element("ByteOrder", "LSB");
    return "<VRTRasterBand dataType=\"" + std::string(pszType) +
           "\" subClass=\"VRTRawRasterBand\">\n" + oBand + "</VRTRasterBand>\n";
}

std::string PlaceText(const ogc::cs::GeocodingInfo& oPlace)
{
    std::string oText;
    if (!oPlace.GetProjection().empty())
    {
        oText += Element("SRS", XmlText(oPlace.GetProjection()));
    }
    if (oPlace.GetTransform() != ogc::cs::GeocodingInfo().GetTransform())
    {
        std::string oTerms;
        for (const double dfTerm : oPlace.GetTransform())
        {
            oTerms += oTerms.empty() ? "" : ", ";
            oTerms += NumberText(dfTerm);
        }
        oText += Element("GeoTransform", oTerms);
    }
    return oText;
}

std::string DatasetText(const std::string& oFile, const KordskDirectory& oDirectory)
{
    if (oDirectory.mvoChannels.empty())
    {
        Refuse(oFile, "a file without channels");
    }
    if (oDirectory.mnWidth > kLargestSide || oDirectory.mnHeight > kLargestSide)
    {
        Refuse(oFile, std::to_string(oDirectory.mnWidth) + " x " +
                          std::to_string(oDirectory.mnHeight) + " pixels");
    }
    std::string oText = "<VRTDataset rasterXSize=\"" + std::to_string(oDirectory.mnWidth) +
                        "\" rasterYSize=\"" + std::to_string(oDirectory.mnHeight) + "\">\n" +
                        PlaceText(*oDirectory.mpoGeocoding) + MetadataText(oDirectory.moMetadata);
    unsigned int nChannel = 0;
    for (const KordskPlane& oPlane : oDirectory.mvoChannels)
    {
        oText +=
            BandText(oFile, oPlane, oDirectory.mnWidth, "channel " + std::to_string(++nChannel));
    }
    return oText + "</VRTDataset>\n";
}

/// Replaces a file by a whole new one.
void ReplaceFile(const std::string& oFile, const std::string& oText)
{
    const std::string oPart = oFile + "." + std::to_string(getpid()) + ".part";
    const FileDescriptor oNew(oPart, O_RDWR | O_CREAT | O_EXCL);
    try
    {
        oNew.WriteAt(0, {reinterpret_cast<const unsigned char*>(oText.data()), oText.size()});
        if (std::rename(oPart.c_str(), oFile.c_str()) != 0)
        {
            throw FileException(
                oFile + ": cannot write the file: " + std::generic_category().message(errno), oFile,
                kSource, __PRETTY_FUNCTION__, __LINE__);
        }
    }
    catch (...)
    {
        unlink(oPart.c_str());
        throw;
    }
}

}  // namespace

std::string WriteVrt(const std::string& oFile)
{
    return Guarded(oFile,
                   [&]
                   {
                       const auto poDirectory = KordskFile::Open(oFile)->GetSnapshot();
                       const std::string oVrt = oFile + ".vrt";
                       ReplaceFile(oVrt, DatasetText(oFile, *poDirectory));
                       return oVrt;
                   });
}

}  // namespace kor::datasources
