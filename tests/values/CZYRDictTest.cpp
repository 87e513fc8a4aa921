// Dictionaries and arrays: typed values, a random run against a model, finalize and clone.
#include <gtest/gtest.h>

#include <algorithm>
#include <functional>
#include <map>
#include <random>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/values/CZYRDict.h"
#include "zyr/std/values/CZYRString.h"

using namespace ZYRStd;
using namespace ZYRPublic;

namespace {

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
    bool enumProc(const CZYRUniString& k, const CZYRDataBuffer&) override { return seen(k, 0); }
    bool enumProc(const CZYRUniString& k, const CZYRArray&) override { return seen(k, 0); }
    bool enumProc(const CZYRUniString& k, const CZYRDict&) override { return seen(k, 0); }
    bool enumProc(const CZYRUniString& k, const CZYRUniString&) override { return seen(k, 0); }
    bool enumProc(const CZYRUniString& k, bool v) override { return seen(k, v); }
    bool enumProc(const CZYRUniString& k, double v) override { return seen(k, v); }
    bool enumProc(const CZYRUniString& k, unsigned int v) override { return seen(k, v); }
    bool enumProc(const CZYRUniString& k, int32_t v) override { return seen(k, v); }

    std::vector<CZYRUniString> keys;
    std::vector<double> values;
    bool goOn = true;

private:
    bool seen(const CZYRUniString& key, double value) {
        keys.push_back(key);
        values.push_back(value);
        return goOn;
    }
};

// A key string of its own, not the interned one, so look-ups compare texts.
CZYRUniString fresh(const std::string& text) {
    C_Error err;
    return CZYRUniString(createUniString(text.c_str(), err), false);
}

} // namespace

TEST(CZYRDictTest, TypedValuesTypeChecksAndBadArguments) {
    CZYRDict dict, inner, gotDict;
    CZYRArray arr;
    const CZYRUniString k("k");
    unsigned int u = 42;
    EXPECT_FALSE(dict.get(k, &u));
    EXPECT_EQ(u, 42u) << "a missing scalar leaves the output alone";
    dict.set(CZYRUniString("b"), true);
    dict.set(CZYRUniString("i"), int32_t{-7});
    dict.set(CZYRUniString("u"), 7u);
    dict.set(CZYRUniString("d"), 2.25);
    dict.set(CZYRUniString("s"), CZYRUniString("text"));
    dict.set(CZYRUniString("dict"), inner);
    dict.set(CZYRUniString("arr"), arr);
    dict.set(CZYRUniString("buf"), CZYRDataBuffer("abc", 3));
    CZYRUniString s;
    CZYRDataBuffer buf;
    bool b = false;
    int32_t i = 0;
    double d = 0;
    using Get = std::function<bool(const CZYRUniString&)>;
    const struct {
        const char* key;
        Get get;
        const char* refusal;
    } getters[] = {
        {"b", [&](auto& key) { return dict.get(key, &b); }, "Value is not a bool"},
        {"i", [&](auto& key) { return dict.get(key, &i); }, "Value is not a int"},
        {"u", [&](auto& key) { return dict.get(key, &u); }, "Value is not an unsigned int"},
        {"d", [&](auto& key) { return dict.get(key, &d); }, "Value is not a double"},
        {"s", [&](auto& key) { return dict.get(key, s); }, "Value is not a string"},
        {"dict", [&](auto& key) { return dict.get(key, gotDict); }, "Value is not a dict"},
        {"arr", [&](auto& key) { return dict.get(key, arr); }, "Value is not a array"},
        {"buf", [&](auto& key) { return dict.get(key, buf); }, "Value is not a data buffer"},
    };
    for (const auto& getter : getters) {
        for (const auto& other : getters)
            if (&other != &getter)
                expectThrow([&] { getter.get(CZYRUniString(other.key)); }, kZYRErrorTypeCheck,
                            getter.refusal);
        EXPECT_TRUE(getter.get(CZYRUniString(getter.key))) << getter.key;
    }
    EXPECT_TRUE(b && i == -7 && u == 7 && d == 2.25 && s == CZYRUniString("text"));
    EXPECT_EQ(gotDict.getImpl(), inner.getImpl());
    EXPECT_EQ(std::string(buf.getBuffer(), buf.getLength()), "abc");
    CZYRDict missing = inner;
    EXPECT_FALSE(dict.get(CZYRUniString("nope"), missing) || missing.isValid());
    expectThrow([&] { dict.get(CZYRUniString("nope"), &u, true); }, kZYRErrorKeyNotFound,
                "Key not found");
    const CZYRDict invalid(static_cast<I_Dict*>(nullptr), false);
    expectThrow([&] { invalid.getType(k); }, kZYRErrorInvalidObject, "Null object");
    C_Error err;
    I_Dict* raw = createDict(err);
    const CZYRUniString key("key");
    for (const auto& [call, message] :
         std::initializer_list<std::pair<std::function<void()>, const char*>>{
             {[&] { raw->set(nullptr, 1u, err); }, "set"},
             {[&] { raw->get(key.getImpl(), static_cast<unsigned int*>(nullptr), err); }, "get"},
             {[&] { raw->remove(nullptr, err); }, "remove"},
             {[&] { raw->enumerate(nullptr, err); }, "enumerate"}}) {
        err.reset();
        call();
        expectError(err, kZYRErrorBadParam,
                    ("Bad argument to IImp_ZYRDict::" + std::string(message)).c_str());
    }
    raw->set(key.getImpl(), 3u, err); // with an error already recorded, nothing changes
    EXPECT_TRUE(raw->getType(key.getImpl()) == kZYRValTypeNone && !createDict(err));
    err.reset();
    raw->set(key.getImpl(), static_cast<I_Dict*>(nullptr), err);
    EXPECT_EQ(raw->getType(key.getImpl()), kZYRValTypeDict) << "a null object is a value";
    raw->release();
    CZYRArray array;
    array.getImpl()->get(0, static_cast<bool*>(nullptr), err);
    EXPECT_STREQ(err.getMessage(), "Bad argument to IImp_ZYRArray::get");
    err.reset();
    array.getImpl()->set(0xFFFFFFFFu, true, err); // cannot grow that far: refused, no crash
    EXPECT_TRUE(err.errorOccurred() && array.getLength() == 0);
}

// Array slots of the model hold a value, -1 for a hole, -2 for the zero an insert puts in.
TEST(CZYRDictTest, RandomRunMatchesAModel) {
    std::mt19937 random(5);
    CZYRDict dict;
    std::map<std::string, unsigned int> dictModel;
    CZYRArray array;
    std::vector<int64_t> arrayModel;
    for (int step = 0; step < 30000; ++step) {
        const unsigned int action = random() % 10, value = random() % 100000;
        const std::string text = "key " + std::to_string(random() % (step < 15000 ? 900 : 300));
        const CZYRUniString key = fresh(text);
        unsigned int got = 0;
        if (action < 4) {
            dict.set(key, value);
            dictModel[text] = value;
        } else if (action < 5) {
            dict.remove(key);
            dictModel.erase(text);
        } else if (action < 7) {
            const bool present = dictModel.count(text) != 0;
            ASSERT_EQ(dict.getType(key), present ? kZYRValTypeUInt : kZYRValTypeNone);
            ASSERT_EQ(dict.get(key, &got), present);
            ASSERT_EQ(got, present ? dictModel[text] : 0u) << text;
        } else {
            const auto length = static_cast<unsigned int>(arrayModel.size());
            const unsigned int index = random() % (length + 3);
            if (action == 7) {
                array.set(index, value);
                arrayModel.resize(std::max(length, index + 1), -1);
                arrayModel[index] = value;
            } else if (index >= length) {
                expectThrow([&] { action == 8 ? array.insert(index) : array.remove(index); },
                            kZYRErrorLimitCheck, "Index is out of range");
            } else if (action == 8) {
                array.insert(index);
                arrayModel.insert(arrayModel.begin() + index, -2);
            } else {
                array.remove(index);
                arrayModel.erase(arrayModel.begin() + index);
            }
            ASSERT_EQ(array.getLength(), arrayModel.size());
            const unsigned int probe = random() % (arrayModel.size() + 2);
            const int64_t want = probe < arrayModel.size() ? arrayModel[probe] : -1;
            ASSERT_EQ(array.getType(probe), want == -1   ? kZYRValTypeNone
                                            : want == -2 ? kZYRValTypeInt
                                                         : kZYRValTypeUInt);
            int32_t zero = 1;
            ASSERT_EQ(want == -2 ? array.get(probe, &zero) : array.get(probe, &got), want != -1);
            ASSERT_EQ(want == -2 ? zero : int64_t{got}, std::max<int64_t>(want, 0)) << probe;
        }
        ASSERT_EQ(dict.getSize(), dictModel.size()) << "step " << step;
        if (step % 1000 == 999) {
            CountingProcs all, once;
            dict.enumerate(&all);
            std::map<std::string, unsigned int> listed;
            for (size_t n = 0; n < all.keys.size(); ++n)
                listed[UniStringToString(all.keys[n]).c_str()] =
                    static_cast<unsigned int>(all.values[n]);
            ASSERT_EQ(listed, dictModel);
            once.goOn = false;
            dict.enumerate(&once);
            ASSERT_EQ(once.keys.size(), 1u) << "enumeration stops when asked";
        }
    }
}

TEST(CZYRDictTest, FinalizeCloneBucketsCyclesAndNesting) {
    CZYRDict outer, inner, inList;
    CZYRArray list;
    list.set(0, inList);
    inner.set(CZYRUniString("v"), 1u);
    outer.set(CZYRUniString("inner"), inner);
    outer.set(CZYRUniString("list"), list);
    outer.set(CZYRUniString("s"), CZYRUniString("shared"));
    outer.finalize();
    outer.finalize();
    EXPECT_TRUE(outer.isFinalized() && inner.isFinalized() && inList.isFinalized());
    for (const std::function<void()>& change : std::initializer_list<std::function<void()>>{
             [&] { outer.set(CZYRUniString("x"), 1u); }, [&] { outer.remove(CZYRUniString("s")); },
             [&] { list.insert(0); }, [&] { list.remove(0); }, [&] { list.set(3, 1u); }})
        expectThrow(change, kZYRErrorFinalized, "Finalized objects can't be modified");
    EXPECT_EQ(outer.getSize(), 3u) << "refused changes change nothing";
    // Two threads read the finalized tree and intern texts at once.
    auto read = [&] {
        for (int n = 0; n < 500; ++n) {
            CZYRDict got;
            unsigned int v = 0;
            EXPECT_TRUE(outer.get(CZYRUniString("inner"), got) && got.get(CZYRUniString("v"), &v));
            EXPECT_EQ(v + list.getLength(), 2u);
        }
    };
    std::thread first(read), second(read);
    first.join();
    second.join();

    CZYRDict copy = outer.clone(), copiedInner;
    CZYRUniString s1, s2;
    copy.set(CZYRUniString("x"), 2u);
    EXPECT_TRUE(copy.get(CZYRUniString("inner"), copiedInner) && copy.get(CZYRUniString("s"), s1) &&
                outer.get(CZYRUniString("s"), s2));
    EXPECT_TRUE(copiedInner.getImpl() != inner.getImpl() && s1.getImpl() == s2.getImpl())
        << "containers are copied, strings are shared";

    CZYRArray holes;
    holes.set(1, 1u);
    holes.set(3, 3u);
    holes.set(6, CZYRDict());
    holes.remove(6);
    holes.set(6, 6u);
    C_Error err;
    holes.getImpl()->set(9, static_cast<I_Dict*>(nullptr), err);
    holes.getImpl()->set(8, static_cast<I_Array*>(nullptr), err);
    const CZYRArray holesCopy = holes.clone();
    EXPECT_TRUE(holesCopy.getLength() == 10 && holesCopy.getType(2) == kZYRValTypeNone &&
                holesCopy.getType(3) == kZYRValTypeUInt && holesCopy.getType(8) == kZYRValTypeArray)
        << "a null object is not a hole";
    CZYRArray trailing;
    trailing.set(0, 1u);
    trailing.set(4, 1u);
    trailing.remove(4);
    trailing.set(3, CZYRUniString("x"));
    trailing.getImpl()->insert(3, err);
    EXPECT_EQ(trailing.clone().getLength(), 5u);
    std::vector<CZYRUniString> keys;
    std::set<uint32_t> small, large;
    for (unsigned int n = 0; keys.size() < 194; ++n) {
        const CZYRUniString key(("key" + std::to_string(n)).c_str());
        const uint32_t h = key.hashCode();
        if ((keys.size() == 193 || !small.contains(h % 193)) && large.insert(h % 389).second)
            small.insert(h % 193), keys.push_back(key);
    }
    auto inBucketOrder = [](const CZYRDict& dict, std::vector<CZYRUniString> expected,
                            uint32_t buckets) {
        std::sort(expected.begin(), expected.end(), [buckets](const auto& a, const auto& b) {
            return a.hashCode() % buckets < b.hashCode() % buckets;
        });
        CountingProcs procs;
        dict.enumerate(&procs);
        return procs.keys == expected;
    };
    CZYRDict dict;
    for (size_t n = 0; n < 193; ++n)
        dict.set(keys[n], static_cast<unsigned int>(n));
    EXPECT_TRUE(inBucketOrder(dict, {keys.begin(), keys.begin() + 193}, 193));
    dict.set(keys[193], 193u);
    EXPECT_TRUE(inBucketOrder(dict, keys, 389));
    // The string cache keeps the first object of each key text: make them before counting.
    const CZYRUniString interned[] = {"me", "ring", "a", "b"};
    const unsigned long long before = GetMemUsage();
    {
        CZYRDict self, inRing, shared, twice;
        self.set(CZYRUniString("me"), self);
        CZYRArray ring;
        ring.set(0, inRing);
        inRing.set(CZYRUniString("ring"), ring);
        for (I_Dict* dict : {self.getImpl(), inRing.getImpl()}) {
            C_Error cloneErr, finalizeErr;
            EXPECT_EQ(dict->clone(cloneErr), nullptr);
            dict->finalize(finalizeErr);
            expectError(cloneErr, kZYRErrorInvalidData, "Cyclic container");
            expectError(finalizeErr, kZYRErrorInvalidData, "Cyclic container");
        }
        C_Error arrayErr;
        EXPECT_TRUE(!ring.getImpl()->clone(arrayErr) && arrayErr.errorOccurred());
        EXPECT_FALSE(self.isFinalized()) << "a failed walk freezes nothing";
        self.remove(CZYRUniString("me")); // so the cycles can still be broken, and nothing leaks
        inRing.remove(CZYRUniString("ring"));
        twice.set(CZYRUniString("a"), shared); // reached twice without a cycle is no cycle
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
    const CZYRArray deepest = chain(256), tooDeep = chain(257);
    EXPECT_NO_THROW(deepest.clone());
    C_Error cloneErr, finalizeErr;
    EXPECT_EQ(tooDeep.getImpl()->clone(cloneErr), nullptr);
    tooDeep.getImpl()->finalize(finalizeErr);
    CZYRArray(deepest).finalize();
    expectError(cloneErr, kZYRErrorInvalidData, "Container nesting too deep");
    EXPECT_STREQ(finalizeErr.getMessage(), "Container nesting too deep");
    EXPECT_TRUE(!tooDeep.isFinalized() && deepest.isFinalized());
    { // 200,000 levels go without a stack frame per level
        const CZYRUniString in("in");
        CZYRDict at;
        const CZYRDict top = at;
        for (int i = 0; i < 100000; ++i) {
            CZYRArray list;
            CZYRDict next;
            list.set(0, next);
            at.set(in, list);
            at = next;
        }
    }
}
