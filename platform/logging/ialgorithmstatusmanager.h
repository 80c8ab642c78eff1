#pragma once

#include <string>

namespace kor::logging
{

/// How a long run talks to its caller: progress outwards, cancellation inwards. All operations may
/// be called from the threads of the run.
class IAlgorithmStatusManager
{
public:
    /// True asks the run to end early. Polled often.
    virtual bool IsCancelled() = 0;
    virtual void ReportStage(const std::string& oText) = 0;
    /// Share of the work that is done, from 0 to 1.
    virtual void SetProgress(float fFraction) = 0;
    virtual void ReportMessage(const std::string& oText) = 0;
    virtual void ReportWarning(const std::string& oText) = 0;
    /// The part of a greater progress range that this run fills.
    virtual float GetProgressStart() = 0;
    virtual float GetProgressEnd() = 0;
    virtual ~IAlgorithmStatusManager() = default;
};

}  // namespace kor::logging
