#include "platform/datasources/kordsk/escapedtext.h"

#include <charconv>

namespace kor::datasources
{

namespace
{

/// What the first byte of a UTF-8 character says: how many bytes it has, and in which range its
/// second one lies (The Unicode Standard, table 3-7).
struct Utf8Lead
{
    unsigned char mnFirst;
    unsigned char mnLast;
    unsigned char mnLength;
    unsigned char mnSecondFrom;
    unsigned char mnSecondTo;
};

constexpr Utf8Lead kLeads[] = {
    {0x00, 0x7F, 1, 0, 0},       {0xC2, 0xDF, 2, 0x80, 0xBF}, {0xE0, 0xE0, 3, 0xA0, 0xBF},
    {0xE1, 0xEC, 3, 0x80, 0xBF}, {0xED, 0xED, 3, 0x80, 0x9F}, {0xEE, 0xEF, 3, 0x80, 0xBF},
    {0xF0, 0xF0, 4, 0x90, 0xBF}, {0xF1, 0xF3, 4, 0x80, 0xBF}, {0xF4, 0xF4, 4, 0x80, 0x8F}};

bool FitsLead(const Utf8Lead& oLead, std::string_view oText)
{
    if (oText.size() < oLead.mnLength)
    {
        return false;
    }
    for (std::size_t i = 1; i < oLead.mnLength; ++i)
    {
        const auto nByte = static_cast<unsigned char>(oText[i]);
        if (nByte < (i == 1 ? oLead.mnSecondFrom : 0x80) ||
            nByte > (i == 1 ? oLead.mnSecondTo : 0xBF))
        {
            return false;
        }
    }
    return true;
}

bool NeedsEscape(char nCharacter)
{
    const auto nByte = static_cast<unsigned char>(nCharacter);
    return nByte < 0x20 || nByte == 0x7F || nCharacter == '\\' || nCharacter == '=';
}

}  // namespace

std::size_t Utf8Length(std::string_view oText)
{
    const unsigned char nFirst = oText.empty() ? 0xFF : static_cast<unsigned char>(oText[0]);
    for (const Utf8Lead& oLead : kLeads)
    {
        if (nFirst >= oLead.mnFirst && nFirst <= oLead.mnLast)
        {
            return FitsLead(oLead, oText) ? oLead.mnLength : 0;
        }
    }
    return 0;
}

std::string Escape(std::string_view oText)
{
    constexpr const char* kDigits = "0123456789ABCDEF";
    std::string oEscaped;
    oEscaped.reserve(oText.size());
    while (!oText.empty())
    {
        const std::size_t nLength = Utf8Length(oText);
        const auto nByte = static_cast<unsigned char>(oText[0]);
        if (nLength == 0 || NeedsEscape(oText[0]))
        {
            oEscaped += {'\\', 'x', kDigits[nByte >> 4], kDigits[nByte & 15U]};
            oText.remove_prefix(1);
            continue;
        }
        oEscaped += oText.substr(0, nLength);
        oText.remove_prefix(nLength);
    }
    return oEscaped;
}

std::optional<std::string> Unescape(std::string_view oText)
{
    constexpr std::size_t kEscapeLength = 4;
    std::string oPlain;
    oPlain.reserve(oText.size());
    while (!oText.empty())
    {
        if (oText[0] != '\\')
        {
            oPlain += oText[0];
            oText.remove_prefix(1);
            continue;
        }
        unsigned int nByte = 0;
        const char* pEnd = oText.data() + kEscapeLength;
        if (oText.size() < kEscapeLength || oText[1] != 'x' ||
            std::from_chars(oText.data() + 2, pEnd, nByte, 16).ptr != pEnd)
        {
            return std::nullopt;
        }
        oPlain += static_cast<char>(nByte);
        oText.remove_prefix(kEscapeLength);
    }
    return oPlain;
}

}  // namespace kor::datasources
