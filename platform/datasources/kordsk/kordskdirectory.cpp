#include "platform/datasources/kordsk/kordskdirectory.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <set>

#include "platform/datasources/kordsk/escapedtext.h"
#include "platform/datasources/kordsk/kordskslot.h"
#include "platform/exception/exception.h"

namespace kor::datasources
{

namespace
{

constexpr const char* kSource = "platform/datasources/kordsk/kordskdirectory";
constexpr std::string_view kMetadataKey = "metadata.";
constexpr std::string_view kTile = "tile ";  ///< and two numbers: width and height in pixels

[[noreturn]] void Refuse(const std::string& oFile, const std::string& oWhat)
{
    throw FileException(oFile + ": the file is damaged: " + oWhat, oFile, kSource,
                        __PRETTY_FUNCTION__, __LINE__);
}

template <class T>
std::string TextOf(T nValue)
{
    std::array<char, 32> anText;
    const auto oResult = std::to_chars(anText.data(), anText.data() + anText.size(), nValue);
    return std::string(anText.data(), oResult.ptr);
}

/// Numbers parted by single blanks.
template <class T, std::size_t N>
std::string TextOf(const std::array<T, N>& anValues)
{
    std::string oText;
    for (const T nValue : anValues)
    {
        oText += oText.empty() ? "" : " ";
        oText += TextOf(nValue);
    }
    return oText;
}

void PrintLine(std::string_view oKey, std::string_view oValue, std::string& oText)
{
    oText += oKey;
    oText += '=';
    oText += oValue;
    oText += '\n';
}

void PrintMetadata(const AuxiliaryData::Metadata& oMetadata, std::string& oText)
{
    for (const auto& [oKey, oValue] : oMetadata)
    {
        oText += kMetadataKey;
        PrintLine(Escape(oKey), Escape(oValue), oText);
    }
}

void PrintPlane(const KordskPlane& oPlane, std::string& oText)
{
    const tessel::DataType& oType = oPlane.moType;
    const std::array<std::uint32_t, 6> anFields = {oType.mnBits,         oType.mbSigned,
                                                   oType.mbFloat,        oType.mnMantissaBits,
                                                   oType.mnExponentBits, oType.mbComplex};
    PrintLine("type", TextOf(anFields), oText);
    PrintLine("offset", TextOf(oPlane.mnOffset), oText);
    PrintLine("length", TextOf(oPlane.mnLength), oText);
    std::string oLayout = "band";
    if (oPlane.mnTileWidth != 0)
    {
        oLayout = kTile;
        oLayout += TextOf(std::array{oPlane.mnTileWidth, oPlane.mnTileHeight});
    }
    PrintLine("layout", oLayout, oText);
    if (!oPlane.moData.moDescription.empty())
    {
        PrintLine("description", Escape(oPlane.moData.moDescription), oText);
    }
    if (oPlane.moData.mdfNoData)
    {
        PrintLine("nodata", TextOf(*oPlane.moData.mdfNoData), oText);
    }
    PrintMetadata(oPlane.moData.moMetadata, oText);
}

void PrintPlanes(const std::vector<KordskPlane>& voPlanes, const char* pszKind, std::string& oText)
{
    std::size_t nNumber = 0;
    for (const KordskPlane& oPlane : voPlanes)
    {
        PrintLine(pszKind, TextOf(++nNumber), oText);
        PrintPlane(oPlane, oText);
    }
}

/// Reads the lines one by one into a directory.
class DirectoryParser
{
public:
    explicit DirectoryParser(const std::string& oFile) : moFile(oFile) {}

    KordskDirectory Parse(std::string_view oText)
    {
        while (!oText.empty())
        {
            ++mnLine;
            const std::size_t nEnd = oText.find('\n');
            if (nEnd == std::string_view::npos)
            {
                RefuseLine("it has no end");
            }
            TakeLine(oText.substr(0, nEnd));
            oText.remove_prefix(nEnd + 1);
        }
        RequireKeys();
        ogc::cs::GeocodingInfo oGeocoding(moTransform);
        oGeocoding.SetProjection(moProjection);
        moDirectory.mpoGeocoding = std::make_shared<ogc::cs::GeocodingInfo>(oGeocoding);
        return std::move(moDirectory);
    }

private:
    [[noreturn]] void RefuseLine(const std::string& oWhat) const
    {
        Refuse(moFile, "line " + std::to_string(mnLine) + " of its directory: " + oWhat);
    }

    void TakeLine(std::string_view oLine)
    {
        const std::size_t nEqual = oLine.find('=');
        if (nEqual == std::string_view::npos)
        {
            RefuseLine("it has no =");
        }
        const std::string_view oKey = oLine.substr(0, nEqual);
        const std::string_view oValue = oLine.substr(nEqual + 1);
        if (oKey == "channel" || oKey == "bitmap")
        {
            RequireKeys();
            moKeys.clear();
            BeginPlane(oKey == "channel" ? moDirectory.mvoChannels : moDirectory.mvoBitmaps,
                       oValue);
            return;
        }
        if (!moKeys.insert(oKey).second)
        {
            RefuseLine(std::string(oKey) + " is told twice");
        }
        const bool bKnown =
            mpoPlane == nullptr ? TakeOfFile(oKey, oValue) : TakeOfPlane(oKey, oValue, *mpoPlane);
        if (!bKnown)
        {
            RefuseLine("there is no such key here: " + Escape(oKey));
        }
    }

    void BeginPlane(std::vector<KordskPlane>& voPlanes, std::string_view oValue)
    {
        if (Number<std::size_t>(oValue) != voPlanes.size() + 1 || voPlanes.size() == kMostPlanes)
        {
            RefuseLine("number " + Escape(oValue) + " after " + std::to_string(voPlanes.size()) +
                       "; numbers go up to " + std::to_string(kMostPlanes));
        }
        mpoPlane = &voPlanes.emplace_back();
    }

    bool TakeOfFile(std::string_view oKey, std::string_view oValue)
    {
        if (oKey == "width")
        {
            moDirectory.mnWidth = Number<std::uint32_t>(oValue);
        }
        else if (oKey == "height")
        {
            moDirectory.mnHeight = Number<std::uint32_t>(oValue);
        }
        else if (oKey == "layout")
        {
            moDirectory.mbTiled = oValue == "tile";
            if (oValue != "tile" && oValue != "band")
            {
                RefuseLine("no layout is called " + Escape(oValue));
            }
        }
        else if (oKey == "transform")
        {
            moTransform = Numbers<double, 6>(oValue);
        }
        else if (oKey == "projection")
        {
            moProjection = Text(oValue);
        }
        else
        {
            return TakeMetadata(oKey, oValue, moDirectory.moMetadata);
        }
        return true;
    }

    bool TakeOfPlane(std::string_view oKey, std::string_view oValue, KordskPlane& oPlane)
    {
        if (oKey == "type")
        {
            TakeType(oValue, oPlane.moType);
        }
        else if (oKey == "offset")
        {
            oPlane.mnOffset = Number<std::uint64_t>(oValue);
        }
        else if (oKey == "length")
        {
            oPlane.mnLength = Number<std::uint64_t>(oValue);
        }
        else if (oKey == "layout")
        {
            TakeLayout(oValue, oPlane);
        }
        else if (oKey == "description")
        {
            oPlane.moData.moDescription = Text(oValue);
        }
        else if (oKey == "nodata")
        {
            oPlane.moData.mdfNoData = Number<double>(oValue);
        }
        else
        {
            return TakeMetadata(oKey, oValue, oPlane.moData.moMetadata);
        }
        return true;
    }

    bool TakeMetadata(std::string_view oKey, std::string_view oValue,
                      AuxiliaryData::Metadata& oMetadata)
    {
        if (!oKey.starts_with(kMetadataKey))
        {
            return false;
        }
        oMetadata[Text(oKey.substr(kMetadataKey.size()))] = Text(oValue);
        return true;
    }

    void TakeType(std::string_view oValue, tessel::DataType& oType)
    {
        const auto anFields = Numbers<std::uint32_t, 6>(oValue);
        oType = tessel::DataType(anFields[0], anFields[1] != 0, anFields[2] != 0, anFields[3],
                                 anFields[4], anFields[5] != 0);
        const bool bFlags = anFields[1] <= 1 && anFields[2] <= 1 && anFields[5] <= 1;
        const bool bBitmap = !moDirectory.mvoBitmaps.empty() && IsOf(moDirectory.mvoBitmaps);
        if (!bFlags || !IsSampleType(oType) || (bBitmap && oType != tessel::eDT_BIT))
        {
            RefuseLine("there is no such type of samples here: " + Escape(oValue));
        }
    }

    void TakeLayout(std::string_view oValue, KordskPlane& oPlane)
    {
        if (oValue == "band")
        {
            return;
        }
        if (!oValue.starts_with(kTile))
        {
            RefuseLine("no layout is called " + Escape(oValue));
        }
        const auto anSides = Numbers<std::uint32_t, 2>(oValue.substr(kTile.size()));
        if (anSides[0] == 0 || anSides[0] % 8 != 0 || anSides[1] == 0)
        {
            RefuseLine("there are no tiles of " + Escape(oValue.substr(kTile.size())) + " pixels");
        }
        oPlane.mnTileWidth = anSides[0];
        oPlane.mnTileHeight = anSides[1];
    }

    bool IsOf(const std::vector<KordskPlane>& voPlanes) const
    {
        return mpoPlane == &voPlanes.back();
    }

    void RequireKeys() const
    {
        static const std::set<std::string_view> kOfFile = {"width", "height", "layout",
                                                           "transform"};
        static const std::set<std::string_view> kOfPlane = {"type", "offset", "length", "layout"};
        for (const std::string_view oKey : mpoPlane == nullptr ? kOfFile : kOfPlane)
        {
            if (!moKeys.contains(oKey))
            {
                RefuseLine("before it, " + std::string(oKey) + " is missing");
            }
        }
    }

    std::string Text(std::string_view oValue) const
    {
        const auto oText = Unescape(oValue);
        if (!oText)
        {
            RefuseLine("a backslash without \\xHH");
        }
        return *oText;
    }

    template <class T>
    T Number(std::string_view oValue) const
    {
        T nNumber{};
        const char* pEnd = oValue.data() + oValue.size();
        const auto oResult = std::from_chars(oValue.data(), pEnd, nNumber);
        if (oResult.ec != std::errc() || oResult.ptr != pEnd)
        {
            RefuseLine("not a number in range: " + Escape(oValue));
        }
        return nNumber;
    }

    template <class T, std::size_t N>
    std::array<T, N> Numbers(std::string_view oValue) const
    {
        std::array<T, N> anNumbers{};
        for (std::size_t i = 0; i < N; ++i)
        {
            const std::size_t nEnd = i + 1 == N ? oValue.size() : oValue.find(' ');
            if (nEnd == std::string_view::npos)
            {
                RefuseLine("not " + std::to_string(N) + " numbers");
            }
            anNumbers[i] = Number<T>(oValue.substr(0, nEnd));
            oValue.remove_prefix(std::min(nEnd + 1, oValue.size()));
        }
        return anNumbers;
    }

    const std::string& moFile;
    std::size_t mnLine = 0;
    std::set<std::string_view> moKeys;  ///< told so far, of the file or of the plane at hand
    KordskPlane* mpoPlane = nullptr;    ///< null as long as the lines are about the file
    ogc::cs::GeocodingInfo::Transform moTransform{};
    std::string moProjection;
    KordskDirectory moDirectory;
};

/// A plane's place, with its name for messages.
struct NamedExtent
{
    FileExtent moExtent;
    std::string moName;
};

void RequireSoundPlane(const std::string& oFile, const KordskDirectory& oDirectory,
                       const KordskPlane& oPlane, const std::string& oName,
                       std::uint64_t nFileBytes)
{
    if (PlaneBytes(oPlane.moType, oDirectory.mnWidth, oDirectory.mnHeight) != oPlane.mnLength ||
        oPlane.mnLength == 0)
    {
        Refuse(oFile, oName + " has " + std::to_string(oPlane.mnLength) +
                          " bytes, which does not fit " + std::to_string(oDirectory.mnWidth) +
                          " x " + std::to_string(oDirectory.mnHeight) + " pixels");
    }
    if (oPlane.mnOffset < kBlockBytes || oPlane.mnOffset % kBlockBytes != 0)
    {
        Refuse(oFile, oName + " begins at byte " + std::to_string(oPlane.mnOffset) +
                          ", where no plane can begin");
    }
    if (oPlane.mnOffset > nFileBytes || oPlane.mnLength > nFileBytes - oPlane.mnOffset)
    {
        Refuse(oFile, oName + ", " + std::to_string(oPlane.mnLength) + " bytes from byte " +
                          std::to_string(oPlane.mnOffset) + ", lies outside the file of " +
                          std::to_string(nFileBytes) + " bytes");
    }
}

}  // namespace

std::string PrintDirectory(const KordskDirectory& oDirectory)
{
    const ogc::cs::GeocodingInfo& oGeocoding = *oDirectory.mpoGeocoding;
    std::string oText;
    PrintLine("width", TextOf(oDirectory.mnWidth), oText);
    PrintLine("height", TextOf(oDirectory.mnHeight), oText);
    PrintLine("layout", oDirectory.mbTiled ? "tile" : "band", oText);
    PrintLine("transform", TextOf(oGeocoding.GetTransform()), oText);
    if (!oGeocoding.GetProjection().empty())
    {
        PrintLine("projection", Escape(oGeocoding.GetProjection()), oText);
    }
    PrintMetadata(oDirectory.moMetadata, oText);
    PrintPlanes(oDirectory.mvoChannels, "channel", oText);
    PrintPlanes(oDirectory.mvoBitmaps, "bitmap", oText);
    return oText;
}

KordskDirectory ParseDirectory(const std::string& oFile, std::string_view oText)
{
    return DirectoryParser(oFile).Parse(oText);
}

void RequireSoundPlanes(const std::string& oFile, const KordskDirectory& oDirectory,
                        const FileExtent& oOwnPlace, std::uint64_t nFileBytes)
{
    std::vector<NamedExtent> voExtents = {{oOwnPlace, "the directory"}};
    const auto oTake = [&](const std::vector<KordskPlane>& voPlanes, const std::string& oKind)
    {
        for (std::size_t i = 0; i < voPlanes.size(); ++i)
        {
            const std::string oName = oKind + " " + std::to_string(i + 1);
            RequireSoundPlane(oFile, oDirectory, voPlanes[i], oName, nFileBytes);
            voExtents.push_back({{voPlanes[i].mnOffset, voPlanes[i].mnLength}, oName});
        }
    };
    oTake(oDirectory.mvoChannels, "channel");
    oTake(oDirectory.mvoBitmaps, "bitmap");
    std::sort(voExtents.begin(), voExtents.end(),
              [](const NamedExtent& oOne, const NamedExtent& oOther)
              { return oOne.moExtent.mnOffset < oOther.moExtent.mnOffset; });
    for (std::size_t i = 1; i < voExtents.size(); ++i)
    {
        const FileExtent& oBefore = voExtents[i - 1].moExtent;
        if (voExtents[i].moExtent.mnOffset - oBefore.mnOffset < oBefore.mnLength)
        {
            Refuse(oFile, voExtents[i - 1].moName + " and " + voExtents[i].moName +
                              " lie over one another");
        }
    }
}

}  // namespace kor::datasources
