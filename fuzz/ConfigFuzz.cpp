// A setup file from the field: the parser splits it into pairs, the option store takes them
// all, and every option prints. Nothing may crash, hang or leak.
#include <cstring>
#include <string>
#include <vector>

#include "FuzzSupport.h"
#include "zyr/std/config/internal/ZYRStartupOptionKeys.h"

namespace {

class Feed : public ZYRStd::IZYRConfigParserLineCBProc {
public:
    explicit Feed(ZYRStd::CZYRStartupOptionFeeder& feeder) : feeder_(feeder) {}
    void atLine(unsigned int line) override {
        zyrfuzz::require(line >= line_); // lines only move forward
        line_ = line;
    }
    void proc(const char* key, const char* value) override {
        zyrfuzz::require(key && value);
        feeder_.feed(key, value);
    }

private:
    ZYRStd::CZYRStartupOptionFeeder& feeder_;
    unsigned int line_ = 0;
};

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    zyrfuzz::setUpWithFileSystemOnce();
    if (size == 0)
        return 0;
    std::vector<unsigned char> bytes(data, data + size);
    // The defaults ask the system for its memory: read once, copied for each input.
    static const ZYRStd::CZYRStartupOptionFeeder defaults;
    ZYRStd::CZYRStartupOptionFeeder feeder = defaults;
    Feed feed(feeder);
    try {
        ZYRStd::ParseConfigData(bytes.data(), ZYRPublic::kZYRConfigDataBuffer,
                                static_cast<unsigned int>(bytes.size()), feed);
    } catch (const ZYRStd::CZYRError&) {
        // A malformed file is reported; what was read before still goes to the store.
    }
    feeder.store();
    if ((data[0] & 3) != 0)
        return 0; // printing every option costs more than parsing: one input in four prints
    std::size_t printed = 0;
    for (const ZYRStd::sZYRStartupOptionKey& row : ZYRStd::kZYRStartupOptionKeys)
        if (row.show)
            printed += std::strlen(row.show().c_str());
    zyrfuzz::require(printed > 0);
    return 0;
}
