// What every fuzz target needs first: the front over the C runtime heap and the string
// tables, set up once per process, and a byte reader over the fuzzer's input.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>

#include "ZYRHostKit.h"
#include "ZYRStd.h"

namespace zyrfuzz {

// Once per process: the host's memory procedures and the library's string tables.
inline void setUpOnce() {
    static const bool done = [] {
        ZYRStd::tZYRMemMgr host = ZYRHostKit::crtMemMgr();
        ZYRStd::ZYRStdInit_ZYRMemMgrSet(&host);
        ZYRStd::InitCommonUniStrings();
        ZYRStd::InitDynamicUniStringCache();
        return true;
    }();
    (void)done;
}

// The above, and a file system: the setup-file parser reads through its memory streams.
inline void setUpWithFileSystemOnce() {
    setUpOnce();
    static const ZYRHostKit::HostSession session;
}

// A broken promise of the code under test: stop here, so that the fuzzer keeps the input.
inline void require(bool holds) {
    if (!holds)
        std::abort();
}

// Reads the input front to back; past its end every read answers zero.
class Input {
public:
    Input(const uint8_t* data, size_t size) : data_(data), size_(size) {}

    bool empty() const { return at_ >= size_; }
    uint8_t byte() { return at_ < size_ ? data_[at_++] : 0; }
    uint32_t u32() {
        uint32_t v = 0;
        for (int i = 0; i < 4; ++i)
            v = (v << 8) | byte();
        return v;
    }
    // Up to `most` bytes as text.
    std::string text(size_t most) {
        const size_t n = std::min<size_t>(byte() % (most + 1), size_ - std::min(at_, size_));
        std::string out(reinterpret_cast<const char*>(data_ + at_), n);
        at_ += n;
        return out;
    }
    std::string rest() {
        std::string out(reinterpret_cast<const char*>(data_ + std::min(at_, size_)),
                        size_ - std::min(at_, size_));
        at_ = size_;
        return out;
    }

private:
    const uint8_t* data_;
    size_t size_;
    size_t at_ = 0;
};

} // namespace zyrfuzz
