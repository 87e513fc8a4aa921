#include <gtest/gtest.h>

#include <algorithm>
#include <memory>
#include <random>
#include <string>
#include <string_view>
#include <vector>

#include "TestSupport.h"
#include "ZYRStd.h"

using ZYRStd::CZYRHash;
using ZYRStd::ZYRDigest;

namespace {

using HashPtr = std::unique_ptr<CZYRHash>;

std::string hex(const ZYRDigest& digest) {
    std::string out;
    for (unsigned char byte : digest)
        out += {"0123456789abcdef"[byte >> 4], "0123456789abcdef"[byte & 15]};
    return out;
}

std::string md5Of(std::string_view text, const std::vector<size_t>& pieces = {}) {
    HashPtr hash(ZYRStd::createMD5Hash());
    for (size_t piece : pieces) {
        hash->update(text.data(), static_cast<unsigned int>(piece));
        text.remove_prefix(piece);
    }
    hash->update(text.data(), static_cast<unsigned int>(text.size()));
    return hex(hash->getDigest());
}

constexpr const char* kEmptyDigest = "d41d8cd98f00b204e9800998ecf8427e";

} // namespace

TEST(CZYRHashTest, KnownDigests) {
    const std::string a(128, 'a');
    const std::pair<std::string, const char*> suite[] = {
        {"", kEmptyDigest},
        {"a", "0cc175b9c0f1b6a831c399e269772661"},
        {"abc", "900150983cd24fb0d6963f7d28e17f72"},
        {"ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789",
         "d174ab98d277d9f5a5611c2c9f419d9f"},
        {a.substr(0, 55), "ef1772b6dff9a122358552954ad0df65"},
        {a.substr(0, 56), "3b0c8ac703f828b04c6c197006d17218"},
        {a.substr(0, 57), "652b906d60af96844ebd21b674f35e93"},
        {a.substr(0, 63), "b06521f39153d618550606be297466d5"},
        {a.substr(0, 64), "014842d480b571495a4a0363793f7367"},
        {a.substr(0, 65), "c743a45e0d2e6a95cb859adae0248435"},
        {a.substr(0, 119), "8a7bd0732ed6a28ce75f6dabc90e1613"},
        {a.substr(0, 120), "5f61c0ccad4cac44c75ff505e1f1e537"},
        {a, "e510683b3f5ffe4093d021808bc6ff70"}};
    for (auto [message, digest] : suite) {
        EXPECT_EQ(md5Of(message), digest) << '"' << message << '"';
        HashPtr made(ZYRStd::createMD5Hash(reinterpret_cast<unsigned char*>(message.data()),
                                           static_cast<unsigned int>(message.size())));
        EXPECT_EQ(hex(made->getDigest()), digest) << "createMD5Hash of \"" << message << '"';
        EXPECT_EQ(md5Of(message, {message.size() / 2, 0, message.size() / 4}), digest) << message;
    }
}

TEST(CZYRHashTest, LongInputsInPieces) {
    const std::string million(1000000, 'a');
    EXPECT_EQ(md5Of(million), "7707d6ae4e027c70eea2a935c2296f21");
    EXPECT_EQ(md5Of(million, {1, 63, 64, 65, 70000, 0, 129}), "7707d6ae4e027c70eea2a935c2296f21");
    std::mt19937 random(20240607);
    std::string bytes(4099, '\0');
    std::generate(bytes.begin(), bytes.end(), [&] { return static_cast<char>(random()); });
    EXPECT_EQ(md5Of(std::string_view(bytes).substr(3), {1, 130}), md5Of(bytes.substr(3)));

    const std::vector<unsigned char> zeros(1 << 20, 0);
    HashPtr hash(ZYRStd::createMD5Hash());
    for (int i = 0; i < 512; ++i)
        hash->update(zeros.data(), static_cast<unsigned int>(zeros.size()));
    hash->update(zeros.data(), 1000);
    EXPECT_EQ(hex(hash->getDigest()), "b0b9022bf39b2600fd66892a61a628c7");
}

TEST(CZYRHashTest, EmptyInputFinalityAndFailedCreation) {
    unsigned char bytes[] = {'a', 'b', 'c'};
    for (CZYRHash* made : {ZYRStd::createMD5Hash(), ZYRStd::createMD5Hash(nullptr, 3),
                           ZYRStd::createMD5Hash(bytes, 0)}) {
        HashPtr hash(made);
        hash->update(nullptr, 10);
        hash->update("abc", 0);
        EXPECT_EQ(hex(hash->getDigest()), kEmptyDigest);
    }
    HashPtr hash(ZYRStd::createMD5Hash(bytes, 3));
    const ZYRDigest first = hash->getDigest();
    EXPECT_EQ(hex(first), "900150983cd24fb0d6963f7d28e17f72");
    for (const char* data : {"more", static_cast<const char*>(nullptr)})
        EXPECT_TRUE(zyrtest::startsWith(zyrtest::thrown([&] { hash->update(data, 4); }),
                                        "20: Can't Update MD5Hash after finalized "
                                        "(source/zyr/std/CZYRHash:"));
    EXPECT_EQ(hash->getDigest(), first);

    zyrtest::FailingHost host;
    host.failAll = true;
    ZYRStd::tZYRMemMgr record = host.record();
    zyrtest::installFront(0, &record);
    const HashPtr plain(ZYRStd::createMD5Hash()), withData(ZYRStd::createMD5Hash(bytes, 3));
    const unsigned int calls = host.calls;
    zyrtest::installFront(0);
    EXPECT_TRUE(!plain && !withData && calls == 2) << calls;
}
