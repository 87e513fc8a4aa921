// Strings: Unicode strings (construction, conversion, ordering, interning, path forms, ICU
// failures), narrow strings and hex decoding, data buffers, and the common strings table with
// the dynamic string cache.
#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <set>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

#include <unicode/uclean.h>

#include "TestSupport.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/values/CZYRCommonUniStrings.h"
#include "zyr/std/values/CZYRDataBuffer.h"
#include "zyr/std/values/CZYRString.h"
#include "zyr/std/values/CZYRUniString.h"

using namespace ZYRStd;
using ZYRPublic::kZYRErrorBadParam;

namespace {

std::u16string units(const CZYRUniString& s) {
    unsigned int bytes = 0;
    const char* data = s.getUTF16LEBuffer(&bytes);
    return std::u16string(reinterpret_cast<const char16_t*>(data), bytes / 2);
}

CZYRUniString fresh(const char* text) {
    C_Error err;
    return CZYRUniString(createUniString(text, "UTF-8", err), false);
}

C_SmartPtr<I_UniString> freshPtr(const std::u16string& text) {
    C_Error err;
    return C_SmartPtr<I_UniString>(createUniString(text.c_str(), err), false);
}

std::u16string textOf(const C_SmartPtr<I_UniString>& s) {
    return units(CZYRUniString(s.get(), true));
}

template <class Call>
void expectError(Call call, ZYRPublic::eZYRErrorType type, const char* message) {
    try {
        call();
        ADD_FAILURE() << "expected " << message;
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), type);
        EXPECT_STREQ(e.getMessage(), message);
    }
}

} // namespace

TEST(CZYRUniStringTest, ConstructionFromEveryEncoding) {
    const CZYRUniString empty("");
    EXPECT_TRUE(empty.isValid());
    EXPECT_TRUE(empty.isEmpty());
    unsigned int bytes = 99;
    empty.getUTF16LEBuffer(&bytes);
    EXPECT_EQ(bytes, 0u);

    EXPECT_FALSE(CZYRUniString(static_cast<const char*>(nullptr)).isValid());
    expectError([] { CZYRUniString(static_cast<const char*>(nullptr), "UTF-8"); },
                kZYRErrorBadParam, "Cannot create a NULL IImp_ZYRUniString");

    EXPECT_EQ(units(CZYRUniString("abc", 2, "UTF-8")), u"ab");
    const CZYRUniString withZero("a\0b", 3, "UTF-8");
    EXPECT_EQ(units(withZero), std::u16string(u"a\0b", 3));
    EXPECT_STREQ(UniStringToString(withZero).c_str(), "a") << "conversion ends at the zero";

    EXPECT_EQ(units(CZYRUniString("caf\xc3\xa9", "UTF-8")), u"caf\u00e9");
    EXPECT_EQ(units(CZYRUniString("caf\xe9", "ISO-8859-1")), u"caf\u00e9");
    EXPECT_EQ(units(CZYRUniString(u"\U0001F600x")), u"\U0001F600x");
    // Bytes above 127 in "ASCII" go through ICU's converter, which substitutes them.
    EXPECT_EQ(units(CZYRUniString("a\xff")).size(), 2u);
}

TEST(CZYRUniStringTest, ConvertReportsNeededLengthAndTerminates) {
    const CZYRUniString abc = fresh("abc");
    char buffer[10];
    std::memset(buffer, 'x', sizeof buffer);
    unsigned int size = 2;
    abc.convert(buffer, &size, "UTF-8");
    EXPECT_EQ(size, 3u) << "the full length, even when it did not fit";
    EXPECT_EQ(std::string(buffer, 2), "ab");
    EXPECT_EQ(buffer[2], 'x') << "nothing beyond the capacity";

    std::memset(buffer, 'x', sizeof buffer);
    size = 10;
    abc.convert(buffer, &size, "UTF-8");
    EXPECT_EQ(size, 3u);
    EXPECT_EQ(std::string(buffer, 8), std::string("abc\0\0\0\0x", 8));

    char16_t wide[8];
    size = sizeof wide;
    abc.convert(wide, &size);
    EXPECT_EQ(size, 6u);
    EXPECT_EQ(std::u16string(wide), u"abc");

    expectError([&] { abc.convert(buffer, &size, "no-such-converter-anywhere"); },
                kZYRErrorBadParam,
                "IImp_ZYRUniString::convert couldn't open converter for codePage");
    C_Error err;
    abc.getImpl()->convert(buffer, nullptr, "UTF-8", err);
    EXPECT_STREQ(err.getMessage(), "Bad argument to IImp_ZYRUniString::convert");
    // A status that holds an error makes the call a no-op.
    size = 10;
    abc.getImpl()->convert(buffer, &size, "UTF-8", err);
    EXPECT_EQ(size, 10u);

    const CZYRUniString invalid;
    std::memset(buffer, 'x', sizeof buffer);
    size = 3;
    invalid.convert(buffer, &size, "UTF-8");
    EXPECT_EQ(size, 0u);
    EXPECT_EQ(std::string(buffer, 4), std::string("\0\0\0x", 4));
}

TEST(CZYRUniStringTest, BufferConversionsMeasureThenFill) {
    CZYRMemBuffer<char> narrow;
    EXPECT_EQ(UniStringToUTF8(CZYRUniString(""), narrow), 0u);
    EXPECT_EQ(narrow.count(), 0u) << "an empty string leaves the buffer alone";

    EXPECT_EQ(UniStringToUTF8(CZYRUniString(u"\u00e9t\u00e9"), narrow), 5u);
    EXPECT_STREQ(narrow.data(), "\xc3\xa9t\xc3\xa9");
    const unsigned int grown = narrow.count();
    EXPECT_EQ(UniStringToChar(CZYRUniString("hi"), narrow), 2u);
    EXPECT_EQ(narrow.count(), grown) << "the buffer never shrinks";

    // Outside ASCII, the converter's substitution byte stands in.
    EXPECT_EQ(UniStringToChar(CZYRUniString(u"\u00e9"), narrow), 1u);
    EXPECT_EQ(narrow[0], '\x1a');
    EXPECT_THROW(narrow[narrow.count()], CZYRError);

    CZYRMemBuffer<char16_t> wide;
    EXPECT_EQ(UniStringToWChar_t(CZYRUniString(u"\U0001F600"), wide), 2u);
    EXPECT_EQ(std::u16string(wide.data()), u"\U0001F600");

    EXPECT_EQ(UniStringToString(CZYRUniString()).length(), 0u);
    EXPECT_EQ(UniStringToUTF8String(CZYRUniString(u"\u00e9")).length(), 2u);
    EXPECT_EQ(UniStringToWString(CZYRUniString(u"x\u00e9")).str(), u"x\u00e9");
}

TEST(CZYRUniStringTest, OrderIsByLittleEndianBytes) {
    const CZYRUniString a = fresh("a"), ab = fresh("ab"), ab2 = fresh("ab");
    EXPECT_TRUE(a < ab && a < ab.getImpl());
    EXPECT_FALSE(ab < a || ab < a.getImpl());
    EXPECT_TRUE(ab == ab2 && ab == ab2.getImpl());
    EXPECT_FALSE(a == ab || a == ab.getImpl());
    EXPECT_NE(ab.getUniqueID(), ab2.getUniqueID()) << "the factory does not intern";
    EXPECT_FALSE(ab < ab2);
    EXPECT_TRUE(CZYRUniString(u"\u0100") < CZYRUniString(u"\u00ff"));

    const CZYRUniString invalid;
    EXPECT_FALSE(invalid == invalid || invalid == ab.getImpl());
    EXPECT_FALSE(ab == invalid);
    EXPECT_TRUE(invalid < invalid);
    EXPECT_FALSE(ab < invalid);
    EXPECT_EQ(invalid.hashCode(), 0u);
    EXPECT_THROW(invalid.getUniqueID(), CZYRError);
    EXPECT_EQ(ab.hashCode(), ab2.hashCode());
}

TEST(CZYRUniStringTest, ConcatAndAppendBuildNewObjects) {
    const CZYRUniString left = fresh("left"), right = fresh("right");
    const CZYRUniString joined = left.concat(right);
    EXPECT_EQ(units(joined), u"leftright");
    EXPECT_NE(joined.getUniqueID(), left.getUniqueID());

    CZYRUniString grown = left;
    grown.append(right);
    EXPECT_EQ(units(grown), u"leftright");
    EXPECT_EQ(units(left), u"left") << "the shared object is not changed";
    grown.append(CZYRUniString());
    EXPECT_EQ(units(grown), u"leftright");

    CZYRUniString none;
    none.append(right);
    EXPECT_EQ(none.getImpl(), right.getImpl());
    EXPECT_EQ(right.debugRefCount(), 2u);
}

TEST(CZYRUniStringTest, TextConstructorsIntern) {
    const CZYRUniString one("some key"), two("some key");
    EXPECT_EQ(one.getUniqueID(), two.getUniqueID());
    EXPECT_EQ(CZYRUniString(u"some key").getImpl(), one.getImpl());
    // Rows of the table are shared with it.
    EXPECT_EQ(CZYRUniString("MediaBox").getImpl(), GetCommonUniStrings()->str_MediaBox().get());

    // Strings are read and interned from several threads at once.
    std::vector<std::thread> threads;
    std::vector<std::set<uint64_t>> seen(2);
    for (int t = 0; t < 2; ++t)
        threads.emplace_back([&seen, t] {
            for (int i = 0; i < 2000; ++i) {
                const CZYRUniString s(i % 2 ? "shared text" : "DeviceCMYK");
                seen[t].insert(s.getUniqueID());
                CZYRMemBuffer<char> out;
                EXPECT_GT(UniStringToUTF8(s, out), 0u);
            }
        });
    for (auto& t : threads)
        t.join();
    EXPECT_EQ(seen[0], seen[1]);
    EXPECT_EQ(seen[0].size(), 2u);
}

TEST(CZYRUniStringTest, PathForms) {
    C_Error err;
    EXPECT_EQ(UniStringToUTF16Path(CZYRUniString(""), err), nullptr);
    EXPECT_FALSE(err.errorOccurred());
    unsigned short* path = UniStringToUTF16Path(CZYRUniString("/tmp/x"), err);
    ASSERT_NE(path, nullptr);
    EXPECT_EQ(std::u16string(reinterpret_cast<char16_t*>(path)), u"/tmp/x");
    ZYRFree(path);

    path = ASCII2UTF16Path("/a/b", err);
    ASSERT_NE(path, nullptr);
    EXPECT_EQ(std::u16string(reinterpret_cast<char16_t*>(path)), u"/a/b");
    ZYRFree(path);
    EXPECT_EQ(ASCII2UTF16Path("", err), nullptr);
    EXPECT_EQ(ASCII2UTF16Path("/caf\xc3\xa9", err), nullptr);
    EXPECT_EQ(err.getError(), ZYRPublic::kZYRErrorInvalidFileName);
    EXPECT_STREQ(err.getMessage(), "ASCII2UTF16Path cannot handle non ASCII character");

    const struct {
        const char16_t* url;
        const char16_t* path;
    } urls[] = {
        {u"file:///tmp/a%20b", u"/tmp/a b"}, {u"file:///C:/dir/f%41", u"C:/dir/fA"},
        {u"file:///c|/x", u"c:/x"},          {u"file://host/share", u"host/share"},
        {u"File:///tmp", u"File:///tmp"},    {u"file:///%4", u"/%4"},
        {u"/plain/path", u"/plain/path"},
    };
    for (const auto& c : urls) {
        C_Error status;
        unsigned short* decoded = UniURL2UTF16Path(CZYRUniString(c.url), status);
        ASSERT_NE(decoded, nullptr);
        EXPECT_EQ(std::u16string(reinterpret_cast<char16_t*>(decoded)), c.path);
        ZYRFree(decoded);
    }
}

TEST(CZYRUniStringTest, UnknownConverterGivesAnEmptyComparableText) {
    C_Error err;
    const CZYRUniString odd(createUniString("abc", "no-such-converter", err), false);
    ASSERT_TRUE(odd.isValid());
    EXPECT_TRUE(odd.isEmpty());
    unsigned int bytes = 99;
    EXPECT_NE(odd.getUTF16LEBuffer(&bytes), nullptr) << "every text has code units to read";
    EXPECT_EQ(bytes, 0u);
    const CZYRUniString empty = fresh("");
    const CZYRUniString text = fresh("a");
    EXPECT_TRUE(odd.getImpl()->equals(empty.getImpl()));
    EXPECT_TRUE(odd.getImpl()->lessThan(text.getImpl()));
    EXPECT_FALSE(text.getImpl()->lessThan(odd.getImpl()));
}

namespace {

// ICU's heap, made to fail on demand.
bool icuHeapFails = false;
void* icuAlloc(const void*, size_t n) {
    return icuHeapFails ? nullptr : std::malloc(n);
}
void* icuRealloc(const void*, void* p, size_t n) {
    return icuHeapFails ? nullptr : std::realloc(p, n);
}
void icuFree(const void*, void* p) {
    std::free(p);
}

} // namespace

TEST(CZYRUniStringTest, IcuAllocationFailureIsAnErrorNotACrash) {
    UErrorCode status = U_ZERO_ERROR;
    u_setMemoryFunctions(nullptr, icuAlloc, icuRealloc, icuFree, &status);
    ASSERT_TRUE(U_SUCCESS(status));
    // Longer than the text ICU keeps inside the object, so the buffer comes from its heap.
    const std::string longAscii(200, 'x');
    const std::u16string longWide(200, u'y');
    const CZYRUniString base = fresh("base");
    icuHeapFails = true;
    C_Error asciiErr;
    I_UniString* ascii = createUniString(longAscii.c_str(), "ASCII", asciiErr);
    C_Error wideErr;
    I_UniString* wide = createUniString(longWide.c_str(), wideErr);
    C_Error concatErr;
    I_UniString* joined = base.getImpl()->concat(ascii, concatErr);
    icuHeapFails = false;

    EXPECT_EQ(asciiErr.getError(), ZYRPublic::kZYRErrorOutOfMemory);
    EXPECT_EQ(wideErr.getError(), ZYRPublic::kZYRErrorOutOfMemory);
    unsigned int bytes = 99;
    ASSERT_NE(ascii, nullptr);
    EXPECT_NE(ascii->getUTF16LEBuffer(&bytes), nullptr);
    EXPECT_EQ(bytes, 0u);
    EXPECT_FALSE(ascii->equals(base.getImpl()));
    EXPECT_EQ(concatErr.getError(), ZYRPublic::kZYRErrorNoError)
        << "an empty text appended needs no memory";
    if (joined)
        joined->release();
    ascii->release();
    if (wide)
        wide->release();

    C_Error bigErr;
    const CZYRUniString big(createUniString(longAscii.c_str(), "UTF-8", bigErr), false);
    icuHeapFails = true;
    C_Error growErr;
    I_UniString* grown = big.getImpl()->concat(big.getImpl(), growErr);
    icuHeapFails = false;
    EXPECT_EQ(grown, nullptr);
    EXPECT_EQ(growErr.getError(), ZYRPublic::kZYRErrorOutOfMemory);
}

TEST(CZYRStringTest, HashConversionsAndStreams) {
    EXPECT_EQ(CZYRString("ab").hashCode(), 3105u);
    const CZYRString withZero("a\0b", 3);
    EXPECT_EQ(withZero.length(), 3u);
    EXPECT_EQ(withZero.hashCode(), 97u) << "the hash stops at a zero";
    EXPECT_EQ(CZYRString("").hashCode(), 0u);
    const CZYRString accented{CZYRUniString(u"\u00e9")};
    EXPECT_EQ(accented.length(), 1u);
    EXPECT_EQ(accented[0], '\x1a') << "outside ASCII the substitution byte stands in";
    EXPECT_TRUE(CZYRString{CZYRUniString()}.empty());
    EXPECT_EQ(CZYRWString{CZYRUniString(u"w\u00e9")}.str(), u"w\u00e9");
    EXPECT_EQ(CZYRString("hello").find("xyz"), 4294967295u);
    EXPECT_EQ(CZYRString(CZYRString("hello world"), 6, 100).c_str(), std::string("world"));
    EXPECT_EQ((CZYRString("a") + CZYRString("b")).c_str(), std::string("ab"));

    std::istringstream in("first second\nthird;fourth");
    CZYRString word;
    in >> word;
    EXPECT_EQ(word.c_str(), std::string("first"));
    getline(in, word);
    EXPECT_EQ(word.c_str(), std::string(" second"));
    getline(in, word, ';');
    EXPECT_EQ(word.c_str(), std::string("third"));
    std::ostringstream out;
    out << word;
    EXPECT_EQ(out.str(), "third");
}

TEST(CZYRStringTest, HexDecoding) {
    const CZYRString bytes = CZYRStringFromHexASCIIString("00ff");
    ASSERT_EQ(bytes.length(), 2u);
    EXPECT_EQ(static_cast<unsigned char>(bytes[0]), 0);
    EXPECT_EQ(static_cast<unsigned char>(bytes[1]), 255);
    EXPECT_EQ(CZYRStringFromHexASCIIString("48692").c_str(), std::string("Hi"));
    EXPECT_EQ(CZYRStringFromHexASCIIString("4A6a9Ff0").c_str(), std::string("Jj\x9f\xf0"));
    EXPECT_TRUE(CZYRStringFromHexASCIIString("7").empty());
    EXPECT_TRUE(CZYRStringFromHexASCIIString("").empty());
    EXPECT_TRUE(CZYRStringFromHexASCIIString(nullptr).empty());
    // A non-digit repeats the nibble of the previous pair: "4g" after "41" is 0x41 again.
    EXPECT_EQ(CZYRStringFromHexASCIIString("41g1").c_str(), std::string("AA"));
    const CZYRString none = CZYRStringFromHexASCIIString("G@`g");
    EXPECT_EQ(std::string(none.c_str(), none.length()), std::string(2, '\0'));
    // 127 bytes fit the stack buffer with their terminator, 128 do not.
    for (size_t n : {127u, 128u, 300u}) {
        const CZYRString decoded = CZYRStringFromHexASCIIString(std::string(2 * n, 'a').c_str());
        ASSERT_EQ(decoded.length(), n);
        EXPECT_EQ(static_cast<unsigned char>(decoded[n - 1]), 0xAA);
    }
}

TEST(CZYRStringTest, DataBuffersKeepTheirOwnCopy) {
    char bytes[] = "payload";
    const CZYRDataBuffer buffer(bytes, 7);
    bytes[0] = 'X';
    EXPECT_EQ(std::string(buffer.getBuffer(), buffer.getLength()), "payload");
    const CZYRDataBuffer copy = buffer;
    EXPECT_EQ(copy.getImpl(), buffer.getImpl());
    EXPECT_EQ(copy.getUniqueID(), buffer.getUniqueID());
    EXPECT_NE(CZYRDataBuffer(bytes, 7).getUniqueID(), buffer.getUniqueID());
    C_Error err;
    for (const auto& [data, length] : {std::pair<const char*, unsigned int>{nullptr, 10},
                                       std::pair<const char*, unsigned int>{"x", 0}}) {
        const CZYRDataBuffer empty(createDataBuffer(data, length, err), false);
        EXPECT_TRUE(empty.isValid());
        EXPECT_EQ(empty.getBuffer(), nullptr);
        EXPECT_EQ(empty.getLength(), 0u);
    }
    EXPECT_FALSE(err.errorOccurred());
    const CZYRDataBuffer invalid;
    EXPECT_EQ(invalid.getLength(), 0u);
    expectError([&] { invalid.getUniqueID(); }, ZYRPublic::kZYRErrorInvalidObject,
                "CZYRDataBuffer::getUniqueID invalid object");
    err.setError(ZYRPublic::kZYRErrorBadParam, "earlier", nullptr, 1);
    EXPECT_EQ(createDataBuffer("x", 1, err), nullptr);
    // A buffer that cannot get its bytes is an error, not an empty buffer.
    zyrtest::FailingHost host;
    host.failAll = true;
    tZYRMemMgr record = host.record();
    zyrtest::installFront(0, &record);
    EXPECT_THROW(CZYRDataBuffer("x", 1), CZYRError);
    zyrtest::installFront(0);
}

TEST(CZYRCommonUniStringsTest, EveryAccessorAnswersItsOwnRowAndText) {
    IZYRCommonUniStrings* table = GetCommonUniStrings();
    unsigned int row = 0;
    // Each row is found by its own text, and the accessors follow the rows.
    auto check = [&](C_SmartPtr<I_UniString> s, const char* name) {
        ASSERT_EQ(s.get(), table->GetCachedCommonUniString(row).get()) << name << " at " << row;
        ASSERT_STREQ(CommonUniStringText(row), name);
        const std::string text(name);
        ASSERT_EQ(textOf(s), std::u16string(text.begin(), text.end())) << row;
        ASSERT_EQ(table->findCommonUniString(freshPtr(textOf(s))).get(), s.get()) << row;
        ++row;
    };
#define ZYR_COMMON_STRING(Name) check(table->str_##Name(), #Name);
#include "zyr/std/values/CZYRCommonUniStrings.def"
    EXPECT_EQ(row, kCommonUniStringAccessors);
    EXPECT_NE(table->str_ALL().get(), table->str_All().get());
    expectError([&] { table->GetCachedCommonUniString(626); }, kZYRErrorBadParam,
                "String constant invalid in GetCachedCommonUniString");
    // The last rows have no accessor and are found only by text.
    EXPECT_STREQ(CommonUniStringText(641), "ZYRTemp\\trap");
    EXPECT_STREQ(CommonUniStringText(693), "*");
    EXPECT_EQ(CommonUniStringText(100000), nullptr);
    const C_SmartPtr<I_UniString> slash = freshPtr(u"/");
    EXPECT_NE(table->findCommonUniString(slash).get(), slash.get());
    const C_SmartPtr<I_UniString> other = freshPtr(u"not in the table");
    EXPECT_EQ(table->findCommonUniString(other).get(), other.get());
}

TEST(CZYRCommonUniStringsTest, CacheIsBoundedAndLeastRecentlyUsedGoesFirst) {
    ReleaseDynamicUniStringCache();
    InitDynamicUniStringCache();
    std::vector<C_SmartPtr<I_UniString>> first;
    for (int i = 0; i < 101; ++i) {
        first.push_back(freshPtr(u"entry " + std::u16string(1, char16_t(u'A' + i))));
        EXPECT_EQ(GetUniStringFromDynamicCache(first.back()).get(), first.back().get());
    }
    // Touch entry 0, so that entry 1 is now the least recently used.
    EXPECT_EQ(GetUniStringFromDynamicCache(freshPtr(textOf(first[0]))).get(), first[0].get());
    GetUniStringFromDynamicCache(freshPtr(u"the 102nd text"));
    EXPECT_EQ(GetUniStringFromDynamicCache(freshPtr(textOf(first[0]))).get(), first[0].get());
    const C_SmartPtr<I_UniString> again = freshPtr(textOf(first[1]));
    EXPECT_EQ(GetUniStringFromDynamicCache(again).get(), again.get()) << "entry 1 was dropped";

    // Too long, or a temporary file's name, is not cached.
    for (const std::u16string& text : {std::u16string(261, u'x'), std::u16string(u"x.tmp")}) {
        const C_SmartPtr<I_UniString> s = freshPtr(text);
        GetUniStringFromDynamicCache(s);
        EXPECT_NE(GetUniStringFromDynamicCache(freshPtr(text)).get(), s.get());
    }
    for (const std::u16string& text : {std::u16string(260, u'x'), std::u16string(u".tmp")}) {
        const C_SmartPtr<I_UniString> s = freshPtr(text);
        GetUniStringFromDynamicCache(s);
        EXPECT_EQ(GetUniStringFromDynamicCache(freshPtr(text)).get(), s.get());
    }
    ReleaseDynamicUniStringCache();
    const C_SmartPtr<I_UniString> uncached = freshPtr(u".tmp");
    EXPECT_EQ(GetUniStringFromDynamicCache(uncached).get(), uncached.get());
    InitDynamicUniStringCache();
}

TEST(CZYRCommonUniStringsTest, TextConstructorsNeedTheTable) {
    ReleaseCommonUniStrings();
    expectError([] { CZYRUniString("anything"); }, ZYRPublic::kZYRErrorInvalidFuncCall,
                "CommonUniString singleton not initialized");
    InitCommonUniStrings();
    EXPECT_NO_THROW(CZYRUniString("anything"));
}
