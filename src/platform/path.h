// Path separator of this platform.
#pragma once

namespace platform {

inline constexpr char kPathSeparator = '/';

}  // namespace platform
