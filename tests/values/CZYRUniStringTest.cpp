// Unicode strings: construction, conversion, ordering, interning and path forms.
#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <set>
#include <thread>
#include <vector>

#include <unicode/uclean.h>

#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/values/CZYRCommonUniStrings.h"
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

} // namespace

TEST(CZYRUniStringTest, ConstructionFromEveryEncoding) {
    const CZYRUniString empty("");
    EXPECT_TRUE(empty.isValid());
    EXPECT_TRUE(empty.isEmpty());
    unsigned int bytes = 99;
    empty.getUTF16LEBuffer(&bytes);
    EXPECT_EQ(bytes, 0u);

    EXPECT_FALSE(CZYRUniString(static_cast<const char*>(nullptr)).isValid());
    try {
        CZYRUniString(static_cast<const char*>(nullptr), "UTF-8");
        ADD_FAILURE() << "a null text with an encoding is an error";
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), kZYRErrorBadParam);
        EXPECT_STREQ(e.getMessage(), "Cannot create a NULL IImp_ZYRUniString");
        EXPECT_STREQ(e.getSrcFileName(), "source/zyr/std/CZYRUniString");
    }

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

    try {
        abc.convert(buffer, &size, "no-such-converter-anywhere");
        ADD_FAILURE() << "unknown converters are an error";
    } catch (const CZYRError& e) {
        EXPECT_STREQ(e.getMessage(),
                     "IImp_ZYRUniString::convert couldn't open converter for codePage");
    }
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
    EXPECT_TRUE(a < ab);
    EXPECT_FALSE(ab < a);
    EXPECT_TRUE(ab == ab2);
    EXPECT_NE(ab.getUniqueID(), ab2.getUniqueID()) << "the factory does not intern";
    EXPECT_FALSE(ab < ab2);
    EXPECT_TRUE(CZYRUniString(u"\u0100") < CZYRUniString(u"\u00ff"));

    const CZYRUniString invalid;
    EXPECT_FALSE(invalid == invalid);
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
    EXPECT_EQ(units(left), u"left");
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
