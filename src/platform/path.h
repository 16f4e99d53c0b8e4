// Path separator of this platform.
#pragma once

namespace platform {

inline constexpr char kPathSeparator = '/';
inline constexpr const char* kPathSeparatorText = "/";

}  // namespace platform
