#include "examples/filterfile/arguments.h"

#include <charconv>
#include <cmath>
#include <limits>
#include <sstream>

namespace kor::examples
{

namespace
{

/// The number as it would be written by hand.
std::string Shown(double dfNumber)
{
    std::ostringstream oText;
    oText << dfNumber;
    return oText.str();
}

std::vector<std::string> SplitAt(char nSeparator, const std::string& oText)
{
    std::vector<std::string> voPieces;
    std::size_t nFirst = 0;
    for (std::size_t nEnd = 0; nEnd != std::string::npos; nFirst = nEnd + 1)
    {
        nEnd = oText.find(nSeparator, nFirst);
        voPieces.push_back(oText.substr(nFirst, nEnd - nFirst));
    }
    return voPieces;
}

}  // namespace

Arguments::Arguments(std::span<char* const> oWords)
{
    for (const std::string oWord : oWords)
    {
        const std::size_t nEqual = oWord.find('=');
        if (nEqual == 0 || nEqual == std::string::npos)
        {
            throw UsageError("\"" + oWord + "\" is not of the form key=value");
        }
        if (!moValues.emplace(oWord.substr(0, nEqual), oWord.substr(nEqual + 1)).second)
        {
            throw UsageError("\"" + oWord.substr(0, nEqual) + "\" is given twice");
        }
    }
}

std::string Arguments::TakeText(const std::string& oKey, const std::string& oDefault)
{
    moKnown.insert(oKey);
    const auto oFound = moValues.find(oKey);
    return oFound == moValues.end() ? oDefault : oFound->second;
}

double Arguments::TakeNumber(const std::string& oKey, double dfDefault, double dfLow, double dfHigh)
{
    const std::string oText = TakeText(oKey, "");
    return Has(oKey) ? Number(oKey, oText, dfLow, dfHigh) : dfDefault;
}

int Arguments::TakeInteger(const std::string& oKey, int nDefault, int nLow, int nHigh)
{
    const double dfNumber = TakeNumber(oKey, nDefault, nLow, nHigh);
    if (dfNumber != std::floor(dfNumber))
    {
        throw Refusal(oKey, TakeText(oKey, ""), "a whole number");
    }
    return static_cast<int>(dfNumber);
}

bool Arguments::TakeFlag(const std::string& oKey, bool bDefault)
{
    static constexpr std::pair<std::string_view, bool> kChoices[] = {{"yes", true}, {"no", false}};
    return TakeChoice<bool>(oKey, bDefault ? "yes" : "no", kChoices);
}

std::vector<double> Arguments::TakeNumbers(const std::string& oKey)
{
    constexpr double kAnything = std::numeric_limits<double>::infinity();
    const std::string oText = TakeText(oKey, "");
    std::vector<double> vdfNumbers;
    if (Has(oKey))
    {
        for (const std::string& oPiece : SplitAt(',', oText))
        {
            vdfNumbers.push_back(Number(oKey, oPiece, -kAnything, kAnything));
        }
    }
    return vdfNumbers;
}

std::vector<unsigned int> Arguments::TakeRanges(const std::string& oKey, unsigned int nHighest)
{
    const std::string oText = TakeText(oKey, "");
    std::vector<unsigned int> vnNumbers;
    if (!Has(oKey))
    {
        return vnNumbers;
    }
    const auto oParse = [&](const std::string& oPiece)
    {
        unsigned int nNumber = 0;
        const auto oResult = std::from_chars(oPiece.data(), oPiece.data() + oPiece.size(), nNumber);
        if (oResult.ec != std::errc() || oResult.ptr != oPiece.data() + oPiece.size() ||
            nNumber < 1 || nNumber > nHighest)
        {
            throw Refusal(oKey, oText,
                          "numbers from 1 to " + std::to_string(nHighest) + ", such as 1,3-5");
        }
        return nNumber;
    };
    for (const std::string& oPiece : SplitAt(',', oText))
    {
        const std::size_t nDash = oPiece.find('-');
        const unsigned int nFirst = oParse(oPiece.substr(0, nDash));
        const unsigned int nLast =
            nDash == std::string::npos ? nFirst : oParse(oPiece.substr(nDash + 1));
        for (unsigned int n = nFirst; n <= nLast; ++n)
        {
            vnNumbers.push_back(n);
        }
        if (nLast < nFirst)
        {
            throw Refusal(oKey, oText, "ranges that run upwards");
        }
    }
    return vnNumbers;
}

std::pair<std::uint32_t, std::uint32_t> Arguments::TakeWindow(const std::string& oKey,
                                                              std::uint32_t nDefault)
{
    constexpr std::uint32_t kHighest = 65535;
    const std::string oText = TakeText(oKey, std::to_string(nDefault));
    const auto oParse = [&](const std::string& oPiece)
    {
        std::uint32_t nSize = 0;
        const auto oResult = std::from_chars(oPiece.data(), oPiece.data() + oPiece.size(), nSize);
        if (oResult.ec != std::errc() || oResult.ptr != oPiece.data() + oPiece.size() ||
            nSize % 2 == 0 || nSize > kHighest)
        {
            throw Refusal(oKey, oText, "odd numbers of pixels, such as 7 or 7x5");
        }
        return nSize;
    };
    const std::vector<std::string> voSizes = SplitAt('x', oText);
    if (voSizes.size() > 2)
    {
        throw Refusal(oKey, oText, "one or two numbers, such as 7 or 7x5");
    }
    return {oParse(voSizes.front()), oParse(voSizes.back())};
}

void Arguments::RequireNothingLeft() const
{
    for (const auto& [oKey, oValue] : moValues)
    {
        if (!moKnown.contains(oKey))
        {
            std::string oNames;
            for (const std::string& oName : moKnown)
            {
                oNames.append(" ").append(oName);
            }
            throw UsageError("\"" + oKey + "\" means nothing here; there are" + oNames);
        }
    }
}

UsageError Arguments::Refusal(const std::string& oKey, const std::string& oValue,
                              const std::string& oAllowed)
{
    return UsageError(oKey + "=" + oValue + " cannot be used; it takes " + oAllowed);
}

double Arguments::Number(const std::string& oKey, const std::string& oText, double dfLow,
                         double dfHigh) const
{
    double dfNumber = 0.0;
    const auto oResult = std::from_chars(oText.data(), oText.data() + oText.size(), dfNumber);
    if (oResult.ec != std::errc() || oResult.ptr != oText.data() + oText.size())
    {
        throw Refusal(oKey, moValues.at(oKey), "numbers");
    }
    if (dfNumber < dfLow || dfNumber > dfHigh)
    {
        throw Refusal(oKey, moValues.at(oKey),
                      "numbers from " + Shown(dfLow) + " to " + Shown(dfHigh));
    }
    return dfNumber;
}

}  // namespace kor::examples
