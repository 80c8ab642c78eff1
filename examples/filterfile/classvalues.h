#pragma once

#include <string>

#include "examples/filterfile/arguments.h"
#include "processes/qrdfilters/filterhom.h"

namespace kor::examples
{

/// One value for each class of an image: the mean or the mode of another channel in the class.
class ClassValues
{
public:
    /// What the command line says about them, one parameter a line.
    static constexpr const char* kParameters =
        "values=1       number of the channel of IN with the values: 8U, 16U, 16S or 32R\n"
        "find=mean      mean, rounded, or mode, of the values of each class\n"
        "threshold=0    mode: least share of it in its class, 0 to 1\n"
        "default=0      mode: what a class gets whose mode has less\n";

    explicit ClassValues(Arguments& oArguments);

    unsigned int GetValueChannel() const { return mnValueChannel; }
    /// Reads the image. Throws UsageError when there is no such channel, and std::runtime_error for
    /// types of values and classes that are not served together.
    filters::FilterHOM Find(std::string oFile, unsigned int nClassChannel) const;

private:
    unsigned int mnValueChannel;
    unsigned int mnMode;
    float mfThreshold;
    int mnDefault;
};

}  // namespace kor::examples
