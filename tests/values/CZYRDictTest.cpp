// Dictionaries and arrays: typed values, errors, rehashing, finalize, clone, enumeration.
#include <gtest/gtest.h>

#include <algorithm>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/values/CZYRDict.h"

using namespace ZYRStd;
using namespace ZYRPublic;

namespace {

// Checks a status-recording call: the error's type and message.
void expectError(const C_Error& err, eZYRErrorType type, const char* message) {
    EXPECT_EQ(err.getError(), type);
    EXPECT_STREQ(err.getMessage(), message);
    EXPECT_STREQ(err.getSrcFileName(), "source/zyr/std/CZYRDict");
}

template <class Call> void expectThrow(Call call, eZYRErrorType type, const char* message) {
    try {
        call();
        ADD_FAILURE() << "expected " << message;
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), type);
        EXPECT_STREQ(e.getMessage(), message);
    }
}

class CountingProcs : public CZYRDictEnumProcs {
public:
    bool enumProc(const CZYRUniString& key, const CZYRDataBuffer&) override { return seen(key); }
    bool enumProc(const CZYRUniString& key, const CZYRArray&) override { return seen(key); }
    bool enumProc(const CZYRUniString& key, const CZYRDict&) override { return seen(key); }
    bool enumProc(const CZYRUniString& key, const CZYRUniString&) override { return seen(key); }
    bool enumProc(const CZYRUniString& key, bool) override { return seen(key); }
    bool enumProc(const CZYRUniString& key, double) override { return seen(key); }
    bool enumProc(const CZYRUniString& key, unsigned int) override { return seen(key); }
    bool enumProc(const CZYRUniString& key, int32_t) override { return seen(key); }

    std::vector<CZYRUniString> keys;
    bool goOn = true;

private:
    bool seen(const CZYRUniString& key) {
        keys.push_back(key);
        return goOn;
    }
};

} // namespace

TEST(CZYRDictTest, TypedValuesAndTypeChecks) {
    CZYRDict dict;
    const CZYRUniString k("k");
    EXPECT_EQ(dict.getSize(), 0u);
    EXPECT_EQ(dict.getType(k), kZYRValTypeNone);
    unsigned int u = 42;
    EXPECT_FALSE(dict.get(k, &u));
    EXPECT_EQ(u, 42u) << "a missing scalar leaves the output alone";

    dict.set(k, 5u);
    int32_t i = 0;
    expectThrow([&] { dict.get(k, &i); }, kZYRErrorTypeCheck, "Value is not a int");
    double d = 0;
    expectThrow([&] { dict.get(k, &d); }, kZYRErrorTypeCheck, "Value is not a double");
    EXPECT_TRUE(dict.get(k, &u));
    EXPECT_EQ(u, 5u);

    dict.set(k, 1.5);
    dict.set(k, CZYRUniString("x"));
    EXPECT_EQ(dict.getType(k), kZYRValTypeString);
    EXPECT_EQ(dict.getSize(), 1u);

    const CZYRUniString keys[] = {"b", "i", "u", "d", "s", "dict", "arr", "buf"};
    dict.set(keys[0], true);
    dict.set(keys[1], int32_t{-7});
    dict.set(keys[2], 7u);
    dict.set(keys[3], 2.25);
    dict.set(keys[4], CZYRUniString("text"));
    CZYRDict inner;
    dict.set(keys[5], inner);
    CZYRArray arr;
    dict.set(keys[6], arr);
    dict.set(keys[7], CZYRDataBuffer("abc", 3));
    bool b = false;
    EXPECT_TRUE(dict.get(keys[0], &b) && b);
    EXPECT_TRUE(dict.get(keys[1], &i) && i == -7);
    CZYRUniString s;
    EXPECT_TRUE(dict.get(keys[4], s));
    EXPECT_TRUE(s == CZYRUniString("text"));
    CZYRDict gotDict;
    EXPECT_TRUE(dict.get(keys[5], gotDict));
    EXPECT_EQ(gotDict.getImpl(), inner.getImpl());
    expectThrow([&] { dict.get(keys[6], gotDict); }, kZYRErrorTypeCheck, "Value is not a dict");
    expectThrow([&] { dict.get(keys[5], arr); }, kZYRErrorTypeCheck, "Value is not a array");
    expectThrow([&] { dict.get(keys[5], s); }, kZYRErrorTypeCheck, "Value is not a string");
    CZYRDataBuffer buf;
    expectThrow([&] { dict.get(keys[5], buf); }, kZYRErrorTypeCheck, "Value is not a data buffer");
    expectThrow([&] { dict.get(keys[3], &b); }, kZYRErrorTypeCheck, "Value is not a bool");
    expectThrow([&] { dict.get(keys[3], &u); }, kZYRErrorTypeCheck, "Value is not an unsigned int");

    CZYRDict missing = inner;
    EXPECT_FALSE(dict.get(CZYRUniString("nope"), missing));
    EXPECT_FALSE(missing.isValid()) << "a missing object leaves the output invalid";
    expectThrow([&] { dict.get(CZYRUniString("nope"), &u, true); }, kZYRErrorKeyNotFound,
                "Key not found");

    dict.remove(keys[0]);
    dict.remove(CZYRUniString("not there"));
    EXPECT_EQ(dict.getType(keys[0]), kZYRValTypeNone);
    EXPECT_EQ(dict.getSize(), 8u);

    const CZYRDict invalid(static_cast<I_Dict*>(nullptr), false);
    expectThrow([&] { invalid.getSize(); }, kZYRErrorInvalidObject, "Null object");
    expectThrow([&] { invalid.getType(k); }, kZYRErrorInvalidObject, "Null object");
}

TEST(CZYRDictTest, InterfaceRecordsBadArgumentsAndKeepsEarlierErrors) {
    C_Error err;
    I_Dict* dict = createDict(err);
    ASSERT_NE(dict, nullptr);
    dict->set(nullptr, 1u, err);
    expectError(err, kZYRErrorBadParam, "Bad argument to IImp_ZYRDict::set");
    err.reset();
    const CZYRUniString key("key");
    dict->get(key.getImpl(), static_cast<unsigned int*>(nullptr), err);
    expectError(err, kZYRErrorBadParam, "Bad argument to IImp_ZYRDict::get");
    // With an error already recorded, nothing changes.
    dict->set(key.getImpl(), 3u, err);
    EXPECT_EQ(dict->getType(key.getImpl()), kZYRValTypeNone);
    EXPECT_EQ(createDict(err), nullptr);
    err.reset();
    dict->remove(nullptr, err);
    expectError(err, kZYRErrorBadParam, "Bad argument to IImp_ZYRDict::remove");
    err.reset();
    dict->enumerate(nullptr, err);
    expectError(err, kZYRErrorBadParam, "Bad argument to IImp_ZYRDict::enumerate");
    err.reset();
    dict->set(key.getImpl(), static_cast<I_Dict*>(nullptr), err);
    EXPECT_EQ(dict->getType(key.getImpl()), kZYRValTypeDict) << "a null object is a value";
    dict->release();
}

TEST(CZYRDictTest, RehashKeepsEveryKeyAndEnumerationStopsWhenAsked) {
    CZYRDict dict;
    std::vector<CZYRUniString> keys;
    for (unsigned int n = 0; n < 2000; ++n) {
        C_Error err;
        keys.emplace_back(createUniString(("key " + std::to_string(n)).c_str(), err), false);
        dict.set(keys.back(), n);
    }
    EXPECT_EQ(dict.getSize(), 2000u);
    for (unsigned int n = 0; n < keys.size(); ++n) {
        unsigned int value = 0;
        ASSERT_TRUE(dict.get(keys[n], &value)) << n;
        EXPECT_EQ(value, n);
        // A separately built string with the same text finds the same entry.
        C_Error err;
        const CZYRUniString same(createUniString(("key " + std::to_string(n)).c_str(), err), false);
        ASSERT_EQ(dict.getType(same), kZYRValTypeUInt);
    }
    CountingProcs all;
    dict.enumerate(&all);
    EXPECT_EQ(all.keys.size(), 2000u);
    CountingProcs once;
    once.goOn = false;
    dict.enumerate(&once);
    EXPECT_EQ(once.keys.size(), 1u) << "enumeration stops when asked";
    EXPECT_THROW(CZYRDict(static_cast<I_Dict*>(nullptr), false).enumerate(&once), CZYRError);
}

TEST(CZYRDictTest, ArraysGrowWithHolesAndCheckIndexes) {
    CZYRArray array;
    array.set(5, true);
    EXPECT_EQ(array.getLength(), 6u);
    for (unsigned int i = 0; i < 5; ++i)
        EXPECT_EQ(array.getType(i), kZYRValTypeNone);
    bool b = false;
    EXPECT_FALSE(array.get(2, &b));
    EXPECT_TRUE(array.get(5, &b) && b);
    EXPECT_EQ(array.getType(99), kZYRValTypeNone);

    CZYRArray small;
    expectThrow([&] { small.insert(0); }, kZYRErrorLimitCheck, "Index is out of range");
    small.set(0, CZYRUniString("x"));
    small.insert(0);
    EXPECT_EQ(small.getLength(), 2u);
    int32_t zero = -1;
    EXPECT_TRUE(small.get(0, &zero));
    EXPECT_EQ(zero, 0);
    EXPECT_EQ(small.getType(1), kZYRValTypeString);
    small.remove(0);
    EXPECT_EQ(small.getType(0), kZYRValTypeString);
    expectThrow([&] { small.remove(1); }, kZYRErrorLimitCheck, "Index is out of range");

    C_Error err;
    small.getImpl()->get(0, static_cast<bool*>(nullptr), err);
    EXPECT_STREQ(err.getMessage(), "Bad argument to IImp_ZYRArray::get");
    err.reset();
    // An index so large that the array cannot grow to it is refused, not a crash.
    small.getImpl()->set(0xFFFFFFFFu, true, err);
    EXPECT_TRUE(err.errorOccurred());
    EXPECT_EQ(small.getLength(), 1u);
}

TEST(CZYRDictTest, FinalizeIsDeepAndCloneIsNot) {
    CZYRDict outer, inner;
    CZYRArray list;
    CZYRDict inList;
    list.set(0, inList);
    inner.set(CZYRUniString("v"), 1u);
    outer.set(CZYRUniString("inner"), inner);
    outer.set(CZYRUniString("list"), list);
    outer.set(CZYRUniString("s"), CZYRUniString("shared"));
    outer.finalize();
    outer.finalize();
    EXPECT_TRUE(outer.isFinalized());
    EXPECT_TRUE(inner.isFinalized());
    EXPECT_TRUE(list.isFinalized());
    EXPECT_TRUE(inList.isFinalized());
    const char* refused = "Finalized objects can't be modified";
    expectThrow([&] { outer.set(CZYRUniString("x"), 1u); }, kZYRErrorFinalized, refused);
    expectThrow([&] { outer.remove(CZYRUniString("s")); }, kZYRErrorFinalized, refused);
    expectThrow([&] { list.insert(0); }, kZYRErrorFinalized, refused);
    expectThrow([&] { list.remove(0); }, kZYRErrorFinalized, refused);
    expectThrow([&] { list.set(3, 1u); }, kZYRErrorFinalized, refused);
    EXPECT_EQ(outer.getSize(), 3u) << "refused changes change nothing";

    CZYRDict copy = outer.clone();
    EXPECT_FALSE(copy.isFinalized());
    EXPECT_NE(copy.getUniqueID(), outer.getUniqueID());
    copy.set(CZYRUniString("x"), 2u);
    CZYRDict copiedInner;
    ASSERT_TRUE(copy.get(CZYRUniString("inner"), copiedInner));
    EXPECT_NE(copiedInner.getImpl(), inner.getImpl());
    copiedInner.set(CZYRUniString("v"), 9u);
    unsigned int v = 0;
    inner.get(CZYRUniString("v"), &v);
    EXPECT_EQ(v, 1u);
    CZYRUniString s1, s2;
    copy.get(CZYRUniString("s"), s1);
    outer.get(CZYRUniString("s"), s2);
    EXPECT_EQ(s1.getImpl(), s2.getImpl()) << "strings are shared";

    CZYRArray holes;
    holes.set(1, 1u);
    holes.set(3, 3u);
    holes.set(6, CZYRDict());
    holes.remove(6);
    holes.set(6, 6u);
    C_Error err;
    holes.getImpl()->set(9, static_cast<I_Dict*>(nullptr), err);
    const CZYRArray holesCopy = holes.clone();
    EXPECT_EQ(holesCopy.getLength(), 10u) << "a null object is not a hole";
    EXPECT_EQ(holesCopy.getType(2), kZYRValTypeNone);
    EXPECT_EQ(holesCopy.getType(3), kZYRValTypeUInt);
    CZYRArray trailing;
    trailing.set(0, 1u);
    trailing.set(4, 1u);
    trailing.remove(4);
    trailing.set(3, CZYRUniString("x"));
    trailing.getImpl()->insert(3, err);
    EXPECT_EQ(trailing.clone().getLength(), 5u);
}

TEST(CZYRDictTest, TableGrowsFrom193To389Buckets) {
    // Keys that each have a bucket of their own at both sizes enumerate in bucket order,
    // which shows how many buckets the table has.
    std::vector<CZYRUniString> keys;
    std::set<uint32_t> small, large;
    for (unsigned int n = 0; keys.size() < 194; ++n) {
        const CZYRUniString key(("key" + std::to_string(n)).c_str());
        const uint32_t h = key.hashCode();
        const bool fresh193 = keys.size() == 193 || !small.contains(h % 193);
        if (fresh193 && !large.contains(h % 389)) {
            small.insert(h % 193);
            large.insert(h % 389);
            keys.push_back(key);
        }
    }
    auto bucketOrder = [](std::vector<CZYRUniString> expected, uint32_t buckets) {
        std::sort(expected.begin(), expected.end(), [buckets](const auto& a, const auto& b) {
            return a.hashCode() % buckets < b.hashCode() % buckets;
        });
        return expected;
    };
    auto enumerated = [](const CZYRDict& dict) {
        CountingProcs procs;
        dict.enumerate(&procs);
        return procs.keys;
    };
    CZYRDict dict;
    for (size_t n = 0; n < 193; ++n)
        dict.set(keys[n], static_cast<unsigned int>(n));
    const std::vector<CZYRUniString> first(keys.begin(), keys.begin() + 193);
    EXPECT_TRUE(enumerated(dict) == bucketOrder(first, 193));
    dict.set(keys[193], 193u);
    EXPECT_TRUE(enumerated(dict) == bucketOrder(keys, 389));
    EXPECT_EQ(dict.getSize(), 194u);
}

TEST(CZYRDictTest, FinalizedContainersAreReadFromSeveralThreads) {
    CZYRDict dict;
    for (unsigned int n = 0; n < 300; ++n)
        dict.set(CZYRUniString(("k" + std::to_string(n)).c_str()), n);
    dict.finalize();
    std::vector<std::thread> readers;
    std::vector<unsigned int> sums(2, 0);
    for (int t = 0; t < 2; ++t)
        readers.emplace_back([&dict, &sums, t] {
            for (unsigned int n = 0; n < 300; ++n) {
                unsigned int v = 0;
                dict.get(CZYRUniString(("k" + std::to_string(n)).c_str()), &v);
                sums[t] += v;
            }
        });
    for (auto& r : readers)
        r.join();
    EXPECT_EQ(sums[0], 299u * 300 / 2);
    EXPECT_EQ(sums[1], sums[0]);
}

TEST(CZYRDictTest, CyclesAndDeepNestingAreRefusedByFinalizeAndClone) {
    // The string cache keeps the first object of each key text: make them before counting.
    const CZYRUniString keys[] = {"me", "ring", "a", "b"};
    const unsigned long long before = GetMemUsage();
    {
        CZYRDict self;
        self.set(CZYRUniString("me"), self);
        CZYRArray ring;
        CZYRDict inRing;
        ring.set(0, inRing);
        inRing.set(CZYRUniString("ring"), ring);
        for (I_Dict* dict : {self.getImpl(), inRing.getImpl()}) {
            C_Error cloneErr;
            EXPECT_EQ(dict->clone(cloneErr), nullptr);
            expectError(cloneErr, kZYRErrorInvalidData, "Cyclic container");
            C_Error finalizeErr;
            dict->finalize(finalizeErr);
            expectError(finalizeErr, kZYRErrorInvalidData, "Cyclic container");
        }
        C_Error arrayErr;
        EXPECT_EQ(ring.getImpl()->clone(arrayErr), nullptr);
        EXPECT_STREQ(arrayErr.getMessage(), "Cyclic container");
        EXPECT_FALSE(self.isFinalized()) << "a failed walk freezes nothing";
        // So the cycles can still be broken, and nothing leaks.
        self.remove(CZYRUniString("me"));
        inRing.remove(CZYRUniString("ring"));

        // A container reached twice without a cycle is no cycle.
        CZYRDict shared;
        CZYRDict twice;
        twice.set(CZYRUniString("a"), shared);
        twice.set(CZYRUniString("b"), shared);
        EXPECT_NO_THROW(twice.clone());
        EXPECT_NO_THROW(twice.finalize());
    }
    EXPECT_EQ(GetMemUsage(), before);

    // 256 levels below the top are walked, one more is refused.
    auto chain = [](unsigned int levels) {
        CZYRArray top;
        CZYRArray at = top;
        for (unsigned int i = 0; i < levels; ++i) {
            CZYRArray next;
            at.set(0, next);
            at = next;
        }
        return top;
    };
    const CZYRArray deepest = chain(256);
    EXPECT_NO_THROW(deepest.clone());
    const CZYRArray tooDeep = chain(257);
    C_Error cloneErr;
    EXPECT_EQ(tooDeep.getImpl()->clone(cloneErr), nullptr);
    expectError(cloneErr, kZYRErrorInvalidData, "Container nesting too deep");
    C_Error finalizeErr;
    tooDeep.getImpl()->finalize(finalizeErr);
    EXPECT_STREQ(finalizeErr.getMessage(), "Container nesting too deep");
    EXPECT_FALSE(tooDeep.isFinalized());
    CZYRArray(deepest).finalize();
    EXPECT_TRUE(deepest.isFinalized());
}
