#pragma once

namespace kor::parallelio
{

/// How a run over a whole image talks to its caller: progress outwards, cancellation inwards. Both
/// are called on the thread of the run.
class IUpdateHandler
{
public:
    IUpdateHandler() = default;
    IUpdateHandler(const IUpdateHandler&) = default;
    IUpdateHandler& operator=(const IUpdateHandler&) = default;
    virtual ~IUpdateHandler() = default;

    /// Share of the work that is done, from 0 to 1.
    virtual void Update(float fFraction) = 0;
    /// True asks the run to end early. Asked before each row.
    virtual bool IsCancelled() = 0;
};

}  // namespace kor::parallelio
