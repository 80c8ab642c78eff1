#pragma once

namespace kor::filters
{

/// True in builds that check what callers promise about the blocks that they hand over.
inline constexpr bool kHardened = KOR_HARDENED != 0;

}  // namespace kor::filters
