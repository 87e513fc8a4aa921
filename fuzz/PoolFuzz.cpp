// The variable-size allocator as an operation program read from the input: allocations of
// every size class (binned, tree, large, cached large) and frees in any order, each block
// filled with its own pattern. After every step the allocator's own invariants hold, and no
// block ever overlaps another or loses its bytes.
#include <cstdlib>
#include <cstring>
#include <vector>

#include "FuzzSupport.h"
#include "zyr/std/memory/ZYRPool.h"

namespace {

struct Block {
    unsigned char* at;
    unsigned int size;
    unsigned char fill;
};

void* supply(unsigned int bytes, void*) {
    return std::malloc(bytes);
}
void giveBack(void* block, void*) {
    std::free(block);
}

bool intact(const Block& b) {
    for (unsigned int i = 0; i < b.size; ++i)
        if (b.at[i] != b.fill)
            return false;
    return true;
}

unsigned int requestSize(zyrfuzz::Input& in, unsigned int pageSize) {
    switch (in.byte() % 4) {
    case 0:
        return in.byte() % 64 + 1; // binned
    case 1:
        return (in.u32() % 4096) + 1; // within a page
    case 2:
        return pageSize + in.u32() % 140000; // large, cached up to a limit
    default:
        return in.u32() % (pageSize * 2); // zero included
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    zyrfuzz::setUpOnce();
    zyrfuzz::Input in(data, size);
    constexpr unsigned int kPageSizes[] = {4096, 8192, 65536};
    const unsigned int pageSize = kPageSizes[in.byte() % 3];
    VariableSizeAllocator pool("PoolFuzz", in.byte() % 3 + 1, 0, pageSize, supply, giveBack,
                               nullptr);
    std::vector<Block> live;
    unsigned char fill = 0;
    for (int steps = 0; !in.empty() && steps < 2000; ++steps) {
        if (live.empty() || in.byte() % 3 != 0) {
            const unsigned int want = requestSize(in, pageSize);
            unsigned int obtained = 0;
            auto* p = static_cast<unsigned char*>(pool.allocate(want, obtained));
            if (!p)
                continue;
            zyrfuzz::require(pool.GetPtrSize(p) >= want && reinterpret_cast<uintptr_t>(p) % 8 == 0);
            std::memset(p, ++fill, want);
            live.push_back({p, want, fill});
        } else {
            const size_t at = in.byte() % live.size();
            zyrfuzz::require(intact(live[at]));
            pool.Free(live[at].at);
            live[at] = live.back();
            live.pop_back();
        }
        zyrfuzz::require(pool.checkInvariants() == nullptr);
    }
    for (const Block& b : live) {
        zyrfuzz::require(intact(b));
        pool.Free(b.at);
    }
    zyrfuzz::require(pool.checkInvariants() == nullptr);
    return 0;
}
