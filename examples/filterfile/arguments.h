#pragma once

#include <cstdint>
#include <map>
#include <set>
#include <span>
#include <stdexcept>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace kor::examples
{

/// Words of the command line that cannot be used. The text says which, and what would do.
class UsageError : public std::runtime_error
{
public:
    using std::runtime_error::runtime_error;
};

/// The "key=value" words of a command line. Whoever wants a value takes it, and gives with it what
/// is allowed; at the end nothing may be left over.
class Arguments
{
public:
    /// Throws UsageError for a word without "=" and for a key that comes twice.
    explicit Arguments(std::span<char* const> oWords);

    bool Has(const std::string& oKey) const { return moValues.contains(oKey); }
    std::string TakeText(const std::string& oKey, const std::string& oDefault);
    double TakeNumber(const std::string& oKey, double dfDefault, double dfLow, double dfHigh);
    int TakeInteger(const std::string& oKey, int nDefault, int nLow, int nHigh);
    /// "yes" or "no".
    bool TakeFlag(const std::string& oKey, bool bDefault);
    /// Numbers separated by commas; empty without the key.
    std::vector<double> TakeNumbers(const std::string& oKey);
    /// Whole numbers and ranges: "1,3-5" is 1, 3, 4, 5. Empty without the key.
    std::vector<unsigned int> TakeRanges(const std::string& oKey, unsigned int nHighest);
    /// "7" or "7x5", width before height: odd numbers of pixels.
    std::pair<std::uint32_t, std::uint32_t> TakeWindow(const std::string& oKey,
                                                       std::uint32_t nDefault);
    /// One of some names.
    template <class Value>
    Value TakeChoice(const std::string& oKey, std::string_view oDefault,
                     std::span<const std::pair<std::string_view, Value>> oChoices)
    {
        const std::string oName = TakeText(oKey, std::string(oDefault));
        std::string oNames;
        for (const auto& [oChoice, eValue] : oChoices)
        {
            if (oChoice == oName)
            {
                return eValue;
            }
            oNames.append(oNames.empty() ? "" : ", ").append(oChoice);
        }
        throw Refusal(oKey, oName, "one of " + oNames);
    }

    /// Throws UsageError when a key was given that nobody took.
    void RequireNothingLeft() const;

    static UsageError Refusal(const std::string& oKey, const std::string& oValue,
                              const std::string& oAllowed);

private:
    double Number(const std::string& oKey, const std::string& oText, double dfLow,
                  double dfHigh) const;

    std::map<std::string, std::string> moValues;
    std::set<std::string> moKnown;
};

}  // namespace kor::examples
