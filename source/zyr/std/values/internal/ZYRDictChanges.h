// How many times a dictionary of this library has been changed, for readers that remember
// answers drawn from it.
#pragma once

#include <atomic>
#include <cstdint>

#include "I_Dict.h"

namespace ZYRStd {

// The change count of `dict` (every set and remove adds one), living as long as the
// dictionary; null for a dictionary of another implementation, whose changes cannot be seen.
const std::atomic<uint32_t>* dictChangeCount(ZYRPublic::I_Dict* dict);

} // namespace ZYRStd
