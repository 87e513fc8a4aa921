/// \file
/// Process-wide unique identifiers for shared objects.
#pragma once

#include "ZYRStdExport.h"

namespace ZYRStd {

/// 1 first, never reused within a process; safe from any thread.
[[nodiscard]] ZYRSTD_API unsigned long long createUniqueID();

} // namespace ZYRStd
