// Dictionaries and arrays built by a little program read from the input, then printed,
// cloned and finalized: containers may share, nest deeply and hold themselves.
#include <sstream>
#include <vector>

#include "FuzzSupport.h"

namespace {

using ZYRStd::CZYRArray;
using ZYRStd::CZYRDict;
using ZYRStd::CZYRUniString;

struct Containers {
    std::vector<CZYRDict> dicts;
    std::vector<CZYRArray> arrays;
};

constexpr const char* kKeys[] = {"a", "b", "JPJobID", "Render", "", "x"};

CZYRUniString key(zyrfuzz::Input& in) {
    return CZYRUniString(kKeys[in.byte() % std::size(kKeys)]);
}

void step(zyrfuzz::Input& in, Containers& c) {
    CZYRDict& d = c.dicts[in.byte() % c.dicts.size()];
    CZYRArray& a = c.arrays[in.byte() % c.arrays.size()];
    const unsigned int index = in.byte() % 8;
    switch (in.byte() % 12) {
    case 0:
        d.set(key(in), static_cast<int32_t>(in.u32()));
        break;
    case 1:
        d.set(key(in), CZYRUniString(in.text(16).c_str()));
        break;
    case 2:
        d.set(key(in), c.dicts[in.byte() % c.dicts.size()]);
        break;
    case 3:
        d.set(key(in), c.arrays[in.byte() % c.arrays.size()]);
        break;
    case 4:
        a.set(index, c.dicts[in.byte() % c.dicts.size()]);
        break;
    case 5:
        a.set(index, c.arrays[in.byte() % c.arrays.size()]);
        break;
    case 6:
        a.set(index, static_cast<double>(in.u32()) / 7.0);
        break;
    case 7:
        d.remove(key(in));
        break;
    case 8:
        a.remove(index % std::max(1u, a.getLength()));
        break;
    case 9:
        c.dicts.emplace_back();
        break;
    case 10:
        c.arrays.emplace_back();
        break;
    default:
        a.set(index, in.byte() % 2 == 0);
        break;
    }
}

void exercise(const CZYRDict& d) {
    std::ostringstream out;
    ZYRStd::ZYRDictEnumProcs printer(out, 300, 0);
    ZYRStd::C_Error err;
    d.getImpl()->enumerate(&printer, err);
    try {
        CZYRDict copy = d.clone();
        copy.finalize();
    } catch (const ZYRStd::CZYRError&) {
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    zyrfuzz::setUpOnce();
    zyrfuzz::Input in(data, size);
    Containers c;
    c.dicts.emplace_back();
    c.arrays.emplace_back();
    try {
        for (int steps = 0; !in.empty() && steps < 4096; ++steps)
            step(in, c);
    } catch (const ZYRStd::CZYRError&) {
        // A finalized container refuses changes.
    }
    for (const CZYRDict& d : c.dicts)
        exercise(d);
    // Containers that hold each other would keep each other alive: empty them all.
    for (CZYRDict& d : c.dicts)
        for (const char* k : kKeys)
            d.remove(CZYRUniString(k));
    for (CZYRArray& a : c.arrays)
        while (a.getLength() > 0)
            a.remove(a.getLength() - 1);
    return 0;
}
