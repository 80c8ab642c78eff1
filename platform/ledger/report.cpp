#include "platform/ledger/report.h"

#include <atomic>
#include <cstdarg>
#include <cstdio>

#include "platform/exception/exception.h"

namespace kor::ledger
{

namespace
{

std::atomic<IReportSink*> gpoSink = nullptr;

void Print(const std::string& oText)
{
    std::fwrite(oText.data(), 1, oText.size(), stdout);
}

}  // namespace

void Report::AddHeader(const std::string& oTitle, const std::string& oText)
{
    IReportSink* const poSink = gpoSink;
    if (poSink != nullptr)
    {
        poSink->AddHeader(oTitle, oText);
        return;
    }
    for (const std::string& oLine : {oTitle, oText})
    {
        if (!oLine.empty())
        {
            Print(oLine + "\n");
        }
    }
}

void Report::AddInfo(const std::string& oText)
{
    IReportSink* const poSink = gpoSink;
    if (poSink != nullptr)
    {
        poSink->AddInfo(oText);
        return;
    }
    Print(oText);
}

IReportSink* Report::SetSink(IReportSink* poSink)
{
    return gpoSink.exchange(poSink);
}

std::string FormatString(const char* pszFormat, ...)
{
    std::va_list vaMeasured;
    va_start(vaMeasured, pszFormat);
    std::va_list vaPrinted;
    va_copy(vaPrinted, vaMeasured);
    const int nLength = std::vsnprintf(nullptr, 0, pszFormat, vaMeasured);
    va_end(vaMeasured);
    std::string oText(nLength < 0 ? 0 : static_cast<std::size_t>(nLength), '\0');
    // The terminating zero takes the place of the string's own.
    const int nPrinted = std::vsnprintf(oText.data(), oText.size() + 1, pszFormat, vaPrinted);
    va_end(vaPrinted);
    if (nLength < 0 || nPrinted != nLength)
    {
        throw Exception("The format \"" + std::string(pszFormat) + "\" cannot be used",
                        "platform/ledger/report", __PRETTY_FUNCTION__, __LINE__);
    }
    return oText;
}

}  // namespace kor::ledger
