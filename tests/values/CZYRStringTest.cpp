// Narrow and 16-bit strings, hex decoding, and data buffers.
#include <gtest/gtest.h>

#include <cstring>
#include <sstream>

#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/values/CZYRDataBuffer.h"
#include "zyr/std/values/CZYRString.h"
#include "zyr/std/values/CZYRUniString.h"

using namespace ZYRStd;

TEST(CZYRStringTest, HashStopsAtZeroAndConversionsSubstitute) {
    EXPECT_EQ(CZYRString("ab").hashCode(), 3105u);
    const CZYRString withZero("a\0b", 3);
    EXPECT_EQ(withZero.length(), 3u);
    EXPECT_EQ(withZero.hashCode(), 97u);
    EXPECT_EQ(CZYRString("").hashCode(), 0u);

    const CZYRString accented{CZYRUniString(u"\u00e9")};
    EXPECT_EQ(accented.length(), 1u);
    EXPECT_EQ(accented[0], '\x1a');
    EXPECT_TRUE(CZYRString{CZYRUniString()}.empty());
    EXPECT_EQ(CZYRWString{CZYRUniString(u"w\u00e9")}.str(), u"w\u00e9");
}

TEST(CZYRStringTest, SearchCompareAndStreams) {
    const CZYRString text("hello world");
    EXPECT_EQ(text.find("xyz"), 4294967295u);
    EXPECT_EQ(text.find("o", 5), 7u);
    EXPECT_EQ(text.find_first_of("ow"), 4u);
    EXPECT_EQ(text.find_last_of("o"), 7u);
    EXPECT_EQ(CZYRString(text, 6, 100).c_str(), std::string("world"));
    EXPECT_THROW(CZYRString(text, 12, 1), std::out_of_range);
    EXPECT_TRUE(CZYRString("ab") < CZYRString("abc"));
    EXPECT_TRUE(CZYRString("b") >= CZYRString("abc"));
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
    EXPECT_TRUE(CZYRStringFromHexASCIIString("7").empty());
    EXPECT_TRUE(CZYRStringFromHexASCIIString(nullptr).empty());
    // A non-digit repeats the nibble of the previous pair: "4g" after "41" is 0x41 again.
    EXPECT_EQ(CZYRStringFromHexASCIIString("41g1").c_str(), std::string("AA"));
    const std::string longHex(600, 'a');
    const CZYRString decoded = CZYRStringFromHexASCIIString(longHex.c_str());
    ASSERT_EQ(decoded.length(), 300u);
    EXPECT_EQ(static_cast<unsigned char>(decoded[299]), 0xAA);
}

TEST(CZYRStringTest, DataBuffersKeepTheirOwnCopy) {
    char bytes[] = "payload";
    const CZYRDataBuffer buffer(bytes, 7);
    bytes[0] = 'X';
    EXPECT_EQ(std::string(buffer.getBuffer(), buffer.getLength()), "payload");
    const CZYRDataBuffer copy = buffer;
    EXPECT_EQ(copy.getImpl(), buffer.getImpl());
    EXPECT_EQ(buffer.debugRefCount(), 2u);
    EXPECT_EQ(copy.getUniqueID(), buffer.getUniqueID());

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
    EXPECT_EQ(invalid.debugRefCount(), 0u);
    try {
        invalid.getUniqueID();
        ADD_FAILURE();
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), ZYRPublic::kZYRErrorInvalidObject);
        EXPECT_STREQ(e.getMessage(), "CZYRDataBuffer::getUniqueID invalid object");
    }
    err.setError(ZYRPublic::kZYRErrorBadParam, "earlier", nullptr, 1);
    EXPECT_EQ(createDataBuffer("x", 1, err), nullptr);
}

TEST(CZYRStringTest, MemBufferGrowsByReplacing) {
    CZYRMemBuffer<float> buffer;
    EXPECT_EQ(buffer.count(), 0u);
    EXPECT_THROW(buffer[0], CZYRError);
    buffer.grow(4);
    buffer[3] = 1.5f;
    buffer.grow(8);
    EXPECT_EQ(buffer.count(), 8u);
    buffer[7] = 2.0f;
    try {
        buffer[8];
        ADD_FAILURE();
    } catch (const CZYRError& e) {
        EXPECT_STREQ(e.getMessage(), "invalid index");
        EXPECT_STREQ(e.getSrcFileName(), "source/zyr/std/CZYRMemBuffer");
    }
}
