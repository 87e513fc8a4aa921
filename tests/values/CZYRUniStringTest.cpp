// Unicode and narrow strings, data buffers, the common strings table and the string cache.
#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <sstream>
#include <string>
#include <tuple>
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

static bool icuHeapFails = false;

TEST(CZYRUniStringTest, ConstructionAndIcuAllocationFailure) {
    const CZYRUniString empty("");
    unsigned int bytes = 99;
    empty.getUTF16LEBuffer(&bytes);
    EXPECT_TRUE(empty.isValid() && empty.isEmpty() && bytes == 0);
    EXPECT_FALSE(CZYRUniString(static_cast<const char*>(nullptr)).isValid());
    expectError([] { CZYRUniString(static_cast<const char*>(nullptr), "UTF-8"); },
                kZYRErrorBadParam, "Cannot create a NULL IImp_ZYRUniString");
    const CZYRUniString withZero("a\0b", 3, "UTF-8");
    EXPECT_STREQ(UniStringToString(withZero).c_str(), "a") << "conversion ends at the zero";
    EXPECT_EQ(std::vector<std::u16string>({units(CZYRUniString("abc", 2, "UTF-8")), units(withZero),
                                           units(CZYRUniString("caf\xc3\xa9", "UTF-8")),
                                           units(CZYRUniString("caf\xe9", "ISO-8859-1")),
                                           units(CZYRUniString(u"\U0001F600x")),
                                           units(CZYRUniString("a\xff")).substr(0, 1)}),
              std::vector<std::u16string>({u"ab", std::u16string(u"a\0b", 3), u"caf\u00e9",
                                           u"caf\u00e9", u"\U0001F600x", u"a"}));
    EXPECT_EQ(units(CZYRUniString("a\xff")).size(), 2u) << "ICU substitutes ASCII above 127";
    C_Error err; // an unknown converter gives an empty text that compares as one
    const CZYRUniString odd(createUniString("abc", "no-such-converter", err), false),
        a = fresh("a");
    EXPECT_NE(odd.getUTF16LEBuffer(&(bytes = 99)), nullptr) << "every text has code units to read";
    EXPECT_TRUE(odd.isValid() && odd.isEmpty() && bytes == 0 &&
                odd.getImpl()->equals(fresh("").getImpl()) &&
                odd.getImpl()->lessThan(a.getImpl()) && !a.getImpl()->lessThan(odd.getImpl()));
    UErrorCode status = U_ZERO_ERROR;
    u_setMemoryFunctions(
        nullptr, [](const void*, size_t n) { return icuHeapFails ? nullptr : std::malloc(n); },
        [](const void*, void* p, size_t n) { return icuHeapFails ? nullptr : std::realloc(p, n); },
        [](const void*, void* p) { std::free(p); }, &status);
    ASSERT_TRUE(U_SUCCESS(status));
    // Longer than the text ICU keeps inside the object, so the buffer comes from its heap.
    const std::string longAscii(200, 'x');
    const std::u16string longWide(200, u'y');
    const CZYRUniString base = fresh("base");
    C_Error asciiErr, wideErr, concatErr;
    icuHeapFails = true;
    I_UniString* ascii = createUniString(longAscii.c_str(), "ASCII", asciiErr);
    I_UniString* wide = createUniString(longWide.c_str(), wideErr);
    I_UniString* joined = base.getImpl()->concat(ascii, concatErr);
    icuHeapFails = false;
    ASSERT_NE(ascii, nullptr);
    EXPECT_TRUE(ascii->getUTF16LEBuffer(&(bytes = 99)) && bytes == 0 &&
                !ascii->equals(base.getImpl()));
    EXPECT_EQ(std::tuple(asciiErr.getError(), wideErr.getError(), concatErr.getError()),
              std::tuple(ZYRPublic::kZYRErrorOutOfMemory, ZYRPublic::kZYRErrorOutOfMemory,
                         ZYRPublic::kZYRErrorNoError))
        << "an empty text appended needs no memory";
    for (I_UniString* made : {joined, ascii, wide})
        if (made)
            made->release();
    C_Error growErr;
    const CZYRUniString big = fresh(longAscii.c_str());
    icuHeapFails = true;
    I_UniString* grown = big.getImpl()->concat(big.getImpl(), growErr);
    icuHeapFails = false;
    EXPECT_TRUE(!grown && growErr.getError() == ZYRPublic::kZYRErrorOutOfMemory);
}

TEST(CZYRUniStringTest, ConversionsOrderConcatInterningAndPathForms) {
    const CZYRUniString abc = fresh("abc"), invalid;
    char buffer[10];
    // The full length even when it does not fit, and up to four zeros within the capacity.
    for (const auto& [capacity, text] :
         {std::pair{2u, std::string("abxx")}, {10u, std::string("abc\0\0\0\0x", 8)}}) {
        std::memset(buffer, 'x', sizeof buffer);
        unsigned int size = capacity;
        abc.convert(buffer, &size, "UTF-8");
        EXPECT_EQ(std::string(buffer, text.size()) + std::to_string(size), text + "3");
    }
    char16_t wide[8];
    unsigned int size = sizeof wide;
    abc.convert(wide, &size);
    EXPECT_EQ(std::u16string(wide) + char16_t(size), u"abc" + std::u16string(1, 6));
    expectError([&] { abc.convert(buffer, &size, "no-such-converter-anywhere"); },
                kZYRErrorBadParam,
                "IImp_ZYRUniString::convert couldn't open converter for codePage");
    C_Error err;
    abc.getImpl()->convert(buffer, nullptr, "UTF-8", err);
    EXPECT_STREQ(err.getMessage(), "Bad argument to IImp_ZYRUniString::convert");
    std::memset(buffer, 'x', sizeof buffer);
    abc.getImpl()->convert(buffer, &(size = 10), "UTF-8", err); // an error held: a no-op
    unsigned int invalidSize = 3;
    invalid.convert(buffer, &invalidSize, "UTF-8");
    EXPECT_EQ(std::string(buffer, 4) + std::to_string(size) + std::to_string(invalidSize),
              std::string("\0\0\0x100", 7));
    CZYRMemBuffer<char> narrow;
    CZYRMemBuffer<char16_t> wideBuffer;
    EXPECT_EQ(UniStringToUTF8(CZYRUniString(""), narrow) + narrow.count(), 0u) << "left alone";
    EXPECT_EQ(UniStringToUTF8(CZYRUniString(u"\u00e9t\u00e9"), narrow), 5u);
    EXPECT_STREQ(narrow.data(), "\xc3\xa9t\xc3\xa9");
    EXPECT_EQ(UniStringToChar(CZYRUniString(u"\u00e9"), narrow), 1u);
    EXPECT_EQ(std::string(narrow.data(), narrow.count()), std::string("\x1a\0\0\0\0\0", 6))
        << "substituted outside ASCII; the buffer never shrinks";
    EXPECT_EQ(UniStringToWChar_t(CZYRUniString(u"\U0001F600"), wideBuffer), 2u);
    EXPECT_EQ(std::u16string(wideBuffer.data()), u"\U0001F600");
    EXPECT_EQ(UniStringToWString(CZYRUniString(u"x\u00e9")).str(), u"x\u00e9");
    const CZYRUniString a = fresh("a"), ab = fresh("ab"), ab2 = fresh("ab");
    EXPECT_TRUE(a < ab && a < ab.getImpl() && ab == ab2 && ab == ab2.getImpl() &&
                invalid < invalid && ab.hashCode() == ab2.hashCode() && invalid.hashCode() == 0);
    EXPECT_FALSE(ab < a || ab < a.getImpl() || a == ab || a == ab.getImpl() || ab < ab2 ||
                 invalid == invalid || invalid == ab.getImpl() || ab == invalid || ab < invalid);
    EXPECT_TRUE(CZYRUniString(u"\u0100") < CZYRUniString(u"\u00ff")) << "by little-endian bytes";
    EXPECT_NE(ab.getUniqueID(), ab2.getUniqueID()) << "the factory does not intern";
    EXPECT_THROW(invalid.getUniqueID(), CZYRError);

    const CZYRUniString left = fresh("left"), right = fresh("right");
    const CZYRUniString joined = left.concat(right);
    EXPECT_TRUE(units(joined) == u"leftright" && joined.getUniqueID() != left.getUniqueID());
    CZYRUniString grown = left, none;
    grown.append(right);
    grown.append(CZYRUniString());
    EXPECT_EQ(units(grown) + units(left), u"leftrightleft") << "the shared object is unchanged";
    none.append(right);
    EXPECT_TRUE(none.getImpl() == right.getImpl() && right.debugRefCount() == 2);

    const CZYRUniString one("some key"), two("some key");
    EXPECT_TRUE(one.getUniqueID() == two.getUniqueID() &&
                CZYRUniString(u"some key").getImpl() == one.getImpl());
    EXPECT_EQ(CZYRUniString("MediaBox").getImpl(), GetCommonUniStrings()->str_MediaBox().get())
        << "rows of the table are shared with it";
    err.reset();
    EXPECT_TRUE(!UniStringToUTF16Path(CZYRUniString(""), err) && !err.errorOccurred());
    for (unsigned short* path :
         {UniStringToUTF16Path(CZYRUniString("/a/b"), err), ASCII2UTF16Path("/a/b", err)}) {
        EXPECT_EQ(std::u16string(reinterpret_cast<char16_t*>(path)), u"/a/b");
        ZYRFree(path);
    }
    EXPECT_TRUE(!ASCII2UTF16Path("", err) && !ASCII2UTF16Path("/caf\xc3\xa9", err));
    EXPECT_EQ(err.getError(), ZYRPublic::kZYRErrorInvalidFileName);
    EXPECT_STREQ(err.getMessage(), "ASCII2UTF16Path cannot handle non ASCII character");
    for (const auto& [url, path] : {std::pair{u"file:///tmp/a%20b", u"/tmp/a b"},
                                    {u"file:///C:/dir/f%41", u"C:/dir/fA"},
                                    {u"file:///c|/x", u"c:/x"},
                                    {u"file://host/share", u"host/share"},
                                    {u"File:///tmp", u"File:///tmp"},
                                    {u"file:///%4", u"/%4"},
                                    {u"/plain/path", u"/plain/path"}}) {
        C_Error status;
        unsigned short* decoded = UniURL2UTF16Path(CZYRUniString(url), status);
        EXPECT_EQ(std::u16string(reinterpret_cast<char16_t*>(decoded)), path);
        ZYRFree(decoded);
    }
}

TEST(CZYRStringTest, HexDecodingHashStreamsAndDataBuffers) {
    const auto hex = [](const char* text) {
        const CZYRString bytes = CZYRStringFromHexASCIIString(text);
        return std::string(bytes.c_str(), bytes.length());
    };
    // A non-digit repeats the nibble of the previous pair: "4g" after "41" is 0x41 again.
    EXPECT_EQ(std::vector<std::string>({hex("00ff"), hex("48692"), hex("4A6a9Ff0"), hex("7"),
                                        hex(""), hex(nullptr), hex("41g1"), hex("G@`g")}),
              std::vector<std::string>({std::string("\0\xff", 2), "Hi", "Jj\x9f\xf0", "", "", "",
                                        "AA", std::string(2, '\0')}));
    // 127 bytes fit the stack buffer with their terminator, 128 do not.
    for (size_t n : {127u, 128u, 300u})
        EXPECT_EQ(hex(std::string(2 * n, 'a').c_str()), std::string(n, '\xaa'));
    EXPECT_EQ(std::tuple(CZYRString("ab").hashCode(), CZYRString("a\0b", 3).hashCode(),
                         CZYRString("hello").find("xyz")),
              std::tuple(3105u, 97u, 4294967295u))
        << "the hash stops at a zero";
    EXPECT_EQ(CZYRString(CZYRString("hello world"), 6, 100).c_str(), std::string("world"));
    EXPECT_EQ(CZYRWString{CZYRUniString(u"w\u00e9")}.str(), u"w\u00e9");
    std::istringstream in("first second\nthird;fourth");
    std::ostringstream out;
    CZYRString word, line, part;
    in >> word;
    getline(getline(in, line), part, ';');
    out << word + CZYRString("|") << line << "|" << part;
    EXPECT_EQ(out.str(), "first| second|third");
    char bytes[] = "payload";
    const CZYRDataBuffer buffer(bytes, 7), copy = buffer, invalid;
    bytes[0] = 'X';
    EXPECT_EQ(std::string(buffer.getBuffer(), buffer.getLength()), "payload");
    EXPECT_TRUE(copy.getUniqueID() == buffer.getUniqueID() &&
                CZYRDataBuffer(bytes, 7).getUniqueID() != buffer.getUniqueID());
    C_Error err;
    for (const auto& [data, length] :
         {std::pair<const char*, unsigned int>{nullptr, 10}, {"x", 0}}) {
        const CZYRDataBuffer empty(createDataBuffer(data, length, err), false);
        EXPECT_TRUE(empty.isValid() && !empty.getBuffer() && empty.getLength() == 0);
    }
    EXPECT_TRUE(!err.errorOccurred() && invalid.getLength() == 0);
    expectError([&] { invalid.getUniqueID(); }, ZYRPublic::kZYRErrorInvalidObject,
                "CZYRDataBuffer::getUniqueID invalid object");
    err.setError(ZYRPublic::kZYRErrorBadParam, "earlier", nullptr, 1);
    EXPECT_EQ(createDataBuffer("x", 1, err), nullptr);
    zyrtest::FailingHost host; // a buffer without its bytes is an error, not an empty buffer
    host.failAll = true;
    tZYRMemMgr record = host.record();
    zyrtest::installFront(0, &record);
    EXPECT_THROW(CZYRDataBuffer("x", 1), CZYRError);
    zyrtest::installFront(0);
}

TEST(CZYRCommonUniStringsTest, RowsTextsAndTheBoundedCache) {
    IZYRCommonUniStrings* table = GetCommonUniStrings();
    unsigned int row = 0;
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
    EXPECT_TRUE(row == kCommonUniStringAccessors &&
                table->str_ALL().get() != table->str_All().get());
    expectError([&] { table->GetCachedCommonUniString(626); }, kZYRErrorBadParam,
                "String constant invalid in GetCachedCommonUniString");
    // The last rows have no accessor and are found only by text.
    EXPECT_EQ(std::string(CommonUniStringText(641)) + CommonUniStringText(693), "ZYRTemp\\trap*");
    EXPECT_TRUE(!CommonUniStringText(kCommonUniStringRows) && !CommonUniStringText(100000));
    const C_SmartPtr<I_UniString> slash = freshPtr(u"/"), other = freshPtr(u"not in the table");
    EXPECT_TRUE(table->findCommonUniString(slash).get() != slash.get() &&
                table->findCommonUniString(other).get() == other.get());
    ReleaseCommonUniStrings();
    expectError([] { CZYRUniString("anything"); }, ZYRPublic::kZYRErrorInvalidFuncCall,
                "CommonUniString singleton not initialized");
    InitCommonUniStrings();
    EXPECT_NO_THROW(CZYRUniString("anything"));
    ReleaseDynamicUniStringCache();
    InitDynamicUniStringCache();
    std::vector<C_SmartPtr<I_UniString>> first;
    for (int i = 0; i < 101; ++i) {
        first.push_back(freshPtr(u"entry " + std::u16string(1, char16_t(u'A' + i))));
        EXPECT_EQ(GetUniStringFromDynamicCache(first.back()).get(), first.back().get());
    }
    // Touch entry 0, so that entry 1 is now the least recently used.
    GetUniStringFromDynamicCache(freshPtr(textOf(first[0])));
    GetUniStringFromDynamicCache(freshPtr(u"the 102nd text"));
    EXPECT_EQ(GetUniStringFromDynamicCache(freshPtr(textOf(first[0]))).get(), first[0].get());
    const C_SmartPtr<I_UniString> again = freshPtr(textOf(first[1]));
    EXPECT_EQ(GetUniStringFromDynamicCache(again).get(), again.get()) << "entry 1 was dropped";

    // Too long, or a temporary file's name, is not cached.
    for (const auto& [text, cached] : {std::pair{std::u16string(261, u'x'), false},
                                       {u"x.tmp", false},
                                       {std::u16string(260, u'x'), true},
                                       {u".tmp", true}}) {
        const C_SmartPtr<I_UniString> s = freshPtr(text);
        GetUniStringFromDynamicCache(s);
        EXPECT_EQ(GetUniStringFromDynamicCache(freshPtr(text)).get() == s.get(), cached);
    }
    ReleaseDynamicUniStringCache();
    const C_SmartPtr<I_UniString> uncached = freshPtr(u".tmp");
    EXPECT_EQ(GetUniStringFromDynamicCache(uncached).get(), uncached.get());
    InitDynamicUniStringCache();
}
