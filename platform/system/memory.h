#pragma once

#include <string>

namespace kor
{

/// Bytes of memory that the machine has; those in use count too.
double GetPhysicalMemory();

/// Throws kor::Exception "<oPurpose> needs ... GiB of memory; the machine has ... GiB" when dfBytes
/// is more than that, or not a number. To be called before the memory is taken: the system would
/// grant it and end the program when it is touched.
void RequireMemory(double dfBytes, const std::string& oPurpose);

}  // namespace kor
