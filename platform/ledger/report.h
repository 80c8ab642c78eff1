#pragma once

#include <string>

namespace kor::ledger
{

/// Receives what is reported.
class IReportSink
{
public:
    virtual ~IReportSink() = default;

    /// Opens a section.
    virtual void AddHeader(const std::string& oTitle, const std::string& oText) = 0;
    /// A piece of text. Pieces are joined as they come; line ends are part of them.
    virtual void AddInfo(const std::string& oText) = 0;
};

/// The channel to which the library prints analyses for the user: one for the whole process. With
/// no sink set, a header goes to standard output as lines of its title and its text, each where it
/// is not empty, and a piece of text as it stands.
///
/// Errors   none of its own: what the sink throws is passed on.
/// Threads  the sink may be changed at any time; a report that runs on another thread then goes to
///          it from its next piece on. Reports of several threads at once reach the sink mixed.
class Report
{
public:
    static void AddHeader(const std::string& oTitle, const std::string& oText);
    static void AddInfo(const std::string& oText);

    /// Borrows poSink from now on and returns the sink before; null is standard output.
    static IReportSink* SetSink(IReportSink* poSink);
};

/// Text formatted like that of printf, of any length. Decimal points are those of the C locale that
/// is set. Throws kor::Exception when the format cannot be used.
[[gnu::format(printf, 1, 2)]] std::string FormatString(const char* pszFormat, ...);

}  // namespace kor::ledger
