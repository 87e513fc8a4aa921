#include <gtest/gtest.h>

#include <algorithm>
#include <memory>
#include <sstream>

#include "zyr/std/values/CZYRDict.h"
#include "zyr/std/values/CZYRInterfaceRegistry.h"
#include "zyr/std/values/ZYRDictEnumProcs.h"

using namespace ZYRStd;

namespace {
std::string print(const CZYRDict& dict, unsigned int depth, unsigned int indent = 0) {
    std::ostringstream out;
    ZYRDictEnumProcs procs(out, depth, indent);
    C_Error err;
    dict.getImpl()->enumerate(&procs, err);
    EXPECT_FALSE(err.errorOccurred());
    return out.str();
}

// Entries come in the dictionary's own enumeration order, so each is printed alone.
CZYRDict one(const char* key, const auto& value) {
    CZYRDict dict;
    dict.set(CZYRUniString(key), value);
    return dict;
}
} // namespace

namespace {
int destroyed = 0;
struct Item : CZYRRegisterItemBase {
    explicit Item(int id) : CZYRRegisterItemBase(id) {}
    ~Item() override { ++destroyed; }
};
Item* owned(int id) {
    return std::make_unique<Item>(id).release();
}
} // namespace

TEST(ZYRDictEnumProcsTest, PrintingTracingAndTheInterfaceRegistry) {
    const CZYRDict n = one("n", 7u), inner = one("flag", true),
                   name = one("name", CZYRUniString("job"));
    EXPECT_EQ(print(n, 1), "") << "depth 1 prints nothing";
    const char twenty[] = "\x00\x01\x02\x03\x04\x05\x06\x07\x08\x09\x0a\x0b\x0c\x0d\x0e\x0f"
                          "\x10\x11\x12\x13";
    CZYRArray list, deeper;
    list.set(0, int32_t{-3});
    list.set(2, CZYRUniString("two"));
    deeper.set(0, 1.5);
    list.set(3, deeper);
    list.set(4, inner);
    list.set(5, CZYRDataBuffer("\xff", 1));
    EXPECT_EQ(print(n, 2) + print(n, 2, 2) + print(name, 2) + print(name, 2, 1) +
                  print(one("buf", CZYRDataBuffer(twenty, 20)), 2) + print(one("inner", inner), 3) +
                  print(one("inner", inner), 2),
              "n  [ZYRUINT]: 7\n\t\tn  [ZYRUINT]: 7\n"
              "name  [ZYRUniString]: job \n\tname  [ZYRUniString]: \tjob \n"
              "buf [ZYRDataBuffer]: <000102030405060708090a0b0c0d0e0f>\n"
              "inner  [ZYRDict]: \n\tflag  [ZYRBool]: 1\n"
              "inner  [ZYRDict]: \n"); // the nested level cut off
    EXPECT_EQ(print(one("list", list), 4), "list  [ZYRArray]: \n"
                                           "\t[0]  [ZYRINT]: -3\n"
                                           "\t[1] ???\n"
                                           "\t[2]  [ZYRUniString]: two \n"
                                           "\t[3] \t\t[0]  [ZYRDouble]: 1.5\n"
                                           "\t[4] [ZYRDict]\n"
                                           "\t\tflag  [ZYRBool]: 1\n"
                                           "\t[5] <ff>\n");
    CZYRDict source, target, nested, shared;
    source.set(CZYRUniString("a"), 1u);
    source.set(CZYRUniString("d"), nested);
    source.set(CZYRUniString("i"), -2);
    source.set(CZYRUniString("f"), 0.5);
    source.set(CZYRUniString("b"), true);
    source.set(CZYRUniString("s"), CZYRUniString("t"));
    TracingEnumProcs copier(target);
    source.enumerate(&copier);
    EXPECT_EQ(print(target, 2), print(source, 2)) << "every kind of value copied";
    EXPECT_TRUE(target.get(CZYRUniString("d"), shared) && shared.getImpl() == nested.getImpl());
    const CZYRUniString k("k");
    EXPECT_TRUE(copier.enumProc(k, CZYRDataBuffer()) && copier.enumProc(k, CZYRArray()) &&
                copier.enumProc(k, nested) && copier.enumProc(k, k) && copier.enumProc(k, true) &&
                copier.enumProc(k, 0.5) && copier.enumProc(k, 1u) && copier.enumProc(k, -1))
        << "a copier never stops the walk";
    CZYRDict self;
    self.set(CZYRUniString("me"), self);
    EXPECT_EQ(print(self, 1000000), "me  [ZYRDict]: \n"
                                    "\tme  [ZYRDict]: <cycle>\n");
    self.remove(CZYRUniString("me"));
    CZYRArray ring, middle, outer;
    ring.set(0, 5u);
    ring.set(1, ring);
    EXPECT_EQ(print(one("ring", ring), 2), "ring  [ZYRArray]: \n"
                                           "\t[0]  [ZYRUINT]: 5\n"
                                           "\t[1] <cycle>\n");
    ring.remove(1);
    // The depth runs out inside nested arrays and stays out.
    middle.set(0, one("k", 1u));
    outer.set(0, middle);
    EXPECT_EQ(print(one("a", outer), 2), "a  [ZYRArray]: \n"
                                         "\t[0] \t\t[0] [ZYRDict]\n");
    // Arrays nested 300 deep: printed down to 256 levels, then "...".
    CZYRArray chain;
    CZYRArray at = chain;
    for (int i = 0; i < 300; ++i) {
        CZYRArray next;
        at.set(0, next);
        at = next;
    }
    const std::string text = print(one("deep", chain), 2);
    EXPECT_EQ(std::count(text.begin(), text.end(), '['), 1 + 256) << "the label and 256 levels";
    EXPECT_EQ(text.substr(text.size() - 4), "...\n");
    destroyed = 0;
    {
        CZYRInterfaceRegistry registry;
        EXPECT_FALSE(registry.queryInterface(5) || registry.hasInterface(5) || registry.isShared());
        registry.registerInterface(owned(5), ZYRRegisterInterfaceDefaultDeleteProc, false);
        Item* second = owned(5);
        for (int twice = 0; twice < 2; ++twice) // the same item again stays alive
            registry.registerInterface(second, ZYRRegisterInterfaceDefaultDeleteProc, true);
        EXPECT_TRUE(destroyed == 1 && registry.getNumInterfaces() == 1 &&
                    registry.queryInterface(5) == second)
            << "the replaced item is deleted";
        EXPECT_THROW(registry.registerInterface(nullptr, nullptr, false), CZYRError);
        CZYRInterfaceRegistry copy = registry;
        copy.registerInterface(owned(2), ZYRRegisterInterfaceDefaultDeleteProc, false);
        EXPECT_TRUE(registry.getNumInterfaces() == 2 && registry.isShared());
        EXPECT_THROW(registry.registerInterface(second, nullptr, false), CZYRError);
        registry.clone().deleteInterface(5);
        EXPECT_TRUE(destroyed == 1 && registry.hasInterface(5)) << "a clone owns nothing";
        registry.deleteInterface(5);
        registry.deleteInterface(5);
        EXPECT_TRUE(destroyed == 2 && copy.getNumInterfaces() == 1);
    }
    EXPECT_EQ(destroyed, 3) << "the table's destruction deletes what it owns";
}
