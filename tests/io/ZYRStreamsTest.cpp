// Tests of the memory stream and the stream wrappers.
#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include "TestSupport.h"
#include "ZYRHostKit.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/io/CZYRBaseStream.h"
#include "zyr/std/io/CZYRFileSys.h"
#include "zyr/std/io/IImpZYRMemStream.h"

namespace {

using namespace ZYRStreams;
using ZYRFileSys::IImpZYRMemStream;
using ZYRStd::CZYRError;
using ZYRStd::CZYRSmartZYRRefPtr;

// Runs `body`, which must raise a CZYRError of `type` with `message`.
template <class Body>
void expectError(Body body, ZYRPublic::eZYRErrorType type, const char* message,
                 const char* source = "source/zyr/std/IImpZYRMemStream") {
    try {
        body();
        ADD_FAILURE() << "no error; expected \"" << (message ? message : "(none)") << "\"";
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), type);
        if (message)
            EXPECT_STREQ(e.getMessage(), message);
        else
            EXPECT_EQ(e.getMessage(), nullptr);
        EXPECT_STREQ(e.getSrcFileName(), source);
        EXPECT_GT(e.getSrcLineNumber(), 0);
    }
}

CZYRSmartZYRRefPtr<IImpZYRMemStream> memStream(unsigned int mode, unsigned int capacity,
                                               void* buffer = nullptr) {
    return CZYRSmartZYRRefPtr<IImpZYRMemStream>(new IImpZYRMemStream(mode, capacity, buffer));
}

TEST(ZYRStreamsTest, MemoryStreamReadsAndWritesWithinCapacity) {
    auto s = memStream(kZYRStreamRead | kZYRStreamWrite, 8);
    EXPECT_EQ(s->getCapacity(), 8u);
    EXPECT_EQ(s->getEOF(), 0u);
    EXPECT_EQ(s->write("abcdef", 2, 3), 6u) << "a byte count, not an item count";
    EXPECT_EQ(s->getPos(), 6u);
    EXPECT_EQ(s->getEOF(), 6u);
    EXPECT_EQ(s->getSize(), 6u);

    expectError([&] { s->write("xyz", 1, 3); }, ZYRPublic::kZYRErrorInvalidData,
                "write past end of stream");
    EXPECT_EQ(s->getPos(), 6u) << "a failed write changes nothing";
    EXPECT_EQ(s->getEOF(), 6u);

    EXPECT_EQ(s->setPos(2), 2u);
    char out[8] = {};
    EXPECT_EQ(s->read(out, 2, 3), 4u) << "up to the EOF, counted in bytes";
    EXPECT_EQ(std::string(out, 4), "cdef");
    EXPECT_EQ(s->read(out, 1, 1), 0u);

    s->setPos(1);
    EXPECT_EQ(s->write("Z", 1, 1), 1u);
    EXPECT_EQ(s->getEOF(), 6u) << "writing inside the data keeps the EOF";
    s->setPos(0);
    EXPECT_EQ(s->read(out, 1, 8), 6u);
    EXPECT_EQ(std::string(out, 6), "aZcdef");
    s->setPos(0);
    s->setEOF();
    EXPECT_EQ(s->getPos(), 6u);

    // The 32-bit product and sum of a huge write must not slip past the capacity check.
    s->setPos(4);
    expectError([&] { s->write("", 0x10000, 0x10000 - 1); }, ZYRPublic::kZYRErrorInvalidData,
                "write past end of stream");
}

TEST(ZYRStreamsTest, MemoryStreamPositionAndCapacityLimits) {
    auto s = memStream(kZYRStreamRead | kZYRStreamWrite, 10);
    s->write("abc", 1, 3);
    EXPECT_EQ(s->setPos(10), 10u) << "the capacity, not the EOF, is the limit";
    expectError([&] { s->setPos(11); }, ZYRPublic::kZYRErrorLimitCheck,
                "Attempt to setPos beyond Mem Stream size");
    EXPECT_EQ(s->getPos(), 10u);
    char out[4];
    expectError([&] { s->read(out, 1, 1); }, ZYRPublic::kZYRErrorInvalidData,
                "attempt to read negative bytes");

    auto none = memStream(kZYRStreamRead | kZYRStreamWrite, 0);
    EXPECT_EQ(none->write("", 1, 0), 0u);
    expectError([&] { none->write("a", 1, 1); }, ZYRPublic::kZYRErrorInvalidData,
                "write past end of stream");
    EXPECT_EQ(none->read(out, 1, 1), 0u);
}

TEST(ZYRStreamsTest, MemoryStreamOverCallerBuffer) {
    char bytes[10];
    std::memcpy(bytes, "0123456789", 10);
    auto reader = memStream(kZYRStreamRead, sizeof bytes, bytes);
    EXPECT_EQ(reader->getEOF(), 10u);
    EXPECT_EQ(reader->getSize(), 10u);
    char out[12] = {};
    EXPECT_EQ(reader->read(out, 3, 4), 10u);
    EXPECT_EQ(std::string(out, 10), "0123456789");
    EXPECT_EQ(reader->read(out, 3, 4), 0u);
    expectError([&] { reader->write("x", 1, 1); }, ZYRPublic::kZYRErrorInvalidFuncCall,
                "stream is not writable");

    auto truncated = memStream(kZYRStreamRead | kZYRStreamTruncate, sizeof bytes, bytes);
    EXPECT_EQ(truncated->getEOF(), 0u);
    EXPECT_EQ(truncated->read(out, 1, 4), 0u);

    auto appender = memStream(kZYRStreamRead | kZYRStreamAppend, sizeof bytes, bytes);
    EXPECT_EQ(appender->getPos(), 10u);
    expectError([&] { appender->write("x", 1, 1); }, ZYRPublic::kZYRErrorInvalidData,
                "write past end of stream");

    // Writes go into the caller's bytes, and the caller's buffer outlives the stream.
    auto writer = memStream(kZYRStreamWrite, sizeof bytes, bytes);
    EXPECT_EQ(writer->getEOF(), 0u);
    writer->write("ab", 1, 2);
    writer.reset();
    EXPECT_EQ(std::string(bytes, 3), "ab2");
}

TEST(ZYRStreamsTest, MemoryStreamAccessChecksAndErrorReporting) {
    auto writeOnly = memStream(kZYRStreamWrite, 4);
    char out[4];
    expectError([&] { writeOnly->read(out, 1, 1); }, ZYRPublic::kZYRErrorInvalidFuncCall,
                "stream is not readable");
    ZYRPublic::eZYRErrorType err = ZYRPublic::kZYRErrorNoError;
    EXPECT_EQ(writeOnly->read(out, 1, 1, err), 0u);
    EXPECT_EQ(err, ZYRPublic::kZYRErrorInvalidFuncCall);

    err = ZYRPublic::kZYRErrorNoError;
    EXPECT_EQ(writeOnly->write("abcde", 1, 5, err), 0u);
    EXPECT_EQ(err, ZYRPublic::kZYRErrorInvalidData);
    err = ZYRPublic::kZYRErrorNoError;
    EXPECT_EQ(writeOnly->write("ab", 1, 2, err), 2u);
    EXPECT_EQ(err, ZYRPublic::kZYRErrorNoError) << "success leaves the status alone";

    auto appendOnly = memStream(kZYRStreamAppend, 4);
    EXPECT_EQ(appendOnly->write("a", 1, 1), 1u) << "append implies writing";
}

TEST(ZYRStreamsTest, MemoryStreamReOpen) {
    auto s = memStream(kZYRStreamRead | kZYRStreamWrite, 8);
    s->write("hello", 1, 5);
    s->reOpen(kZYRStreamRead);
    EXPECT_EQ(s->getEOF(), 0u) << "without append the content goes";
    EXPECT_EQ(s->getPos(), 0u);
    EXPECT_EQ(s->getAccessMode(), kZYRStreamRead);

    s->reOpen(kZYRStreamWrite);
    s->write("hello", 1, 5);
    s->reOpen(kZYRStreamRead | kZYRStreamAppend);
    EXPECT_EQ(s->getEOF(), 5u) << "append keeps the data";
    EXPECT_EQ(s->getPos(), 5u);
    s->reOpen(kZYRStreamAppend | kZYRStreamTruncate);
    EXPECT_EQ(s->getEOF(), 0u);
}

TEST(ZYRStreamsTest, MemoryStreamAllocationFailure) {
    zyrtest::FailingHost host;
    host.failAll = true;
    ZYRStd::tZYRMemMgr record = host.record();
    zyrtest::installFront(0, &record);
    // On the stack, so that the buffer is the only allocation.
    expectError([] { IImpZYRMemStream s(kZYRStreamWrite, 64, nullptr); },
                ZYRPublic::kZYRErrorOutOfMemory, nullptr);
    zyrtest::installFront(0);
}

// ---- wrappers ------------------------------------------------------------------------------

TEST(ZYRStreamsTest, WrappersNeedAFileSystem) {
    ZYRStd::ZYRStdInit_SetDefaultFileSysProc(nullptr);
    expectError([] { ZYRStd::CZYRBaseStream s(kZYRStreamWrite, 16, nullptr); },
                ZYRPublic::kZYRErrorFileSystemNotInitialized,
                "A FileSys  not installed. Install one with ZYRFileSys_SetDefaultFileSys method",
                "source/zyr/std/CZYRFileSys");
}

class StreamWrapperTest : public ::testing::Test {
protected:
    void SetUp() override {
        fileSys_ = ZYRFileSys::createDefaultFileSystem(ZYRStd::CZYRUniString(),
                                                       ZYRStd::CZYRUniString(), nullptr);
        ASSERT_NE(fileSys_, nullptr);
        installed_ = fileSys_;
        ZYRStd::ZYRStdInit_SetDefaultFileSysProc([] { return installed_; });
        ZYRStd::ZYRStdInit_SetZYRFactoryProc(nullptr);
        ZYRStd::ZYRStdInit_SetZYRFactoryProc(ZYRHostKit::posixFileNameFactory);
    }
    void TearDown() override {
        ZYRStd::ZYRStdInit_SetZYRFactoryProc(nullptr);
        ZYRStd::ZYRStdInit_SetDefaultFileSysProc(nullptr);
        installed_ = nullptr;
        delete fileSys_;
    }

    static inline ZYRFileSys::IZYRFileSys* installed_ = nullptr;
    ZYRFileSys::IZYRFileSys* fileSys_ = nullptr;
    zyrtest::TempDir dir_;
};

TEST_F(StreamWrapperTest, BaseStreamForwardsAndCounts) {
    ZYRStd::CZYRBaseStream empty;
    EXPECT_FALSE(empty.isValid());
    EXPECT_FALSE(empty.isShared());
    expectError([&] { empty.getPos(); }, ZYRPublic::kZYRErrorInvalidObject, "Null object",
                "source/zyr/std/CZYRBaseStream");

    ZYRStd::CZYRBaseStream s(kZYRStreamRead | kZYRStreamWrite, 16, nullptr);
    ASSERT_TRUE(s.isValid());
    EXPECT_FALSE(s.isShared());
    EXPECT_EQ(s.write("abc", 1, 3), 3u);
    s.setPos(0);
    char out[3];
    EXPECT_EQ(s.read(out, 1, 3), 3u);
    EXPECT_EQ(std::string(out, 3), "abc");
    EXPECT_EQ(s.getCapacity(), 16u);
    EXPECT_EQ(s.getAccessMode(), kZYRStreamRead | kZYRStreamWrite);
    ZYRPublic::eZYRErrorType err = ZYRPublic::kZYRErrorNoError;
    EXPECT_EQ(s.write(out, 1, 20, err), 0u);
    EXPECT_EQ(err, ZYRPublic::kZYRErrorInvalidData);
    {
        ZYRStd::CZYRBaseStream copy(s);
        EXPECT_TRUE(s.isShared());
        const CZYRSmartZYRRefPtr<IZYRStream>& held = copy;
        EXPECT_EQ(held->peekRefCnt(), 2);
    }
    EXPECT_FALSE(s.isShared());
}

TEST_F(StreamWrapperTest, FileStreamWrapper) {
    const std::string path = dir_.file("wrapped.txt");
    {
        ZYRStd::CZYRFStream out(ZYRStd::CZYRFileName(path.c_str()),
                                kZYRStreamWrite | kZYRStreamTruncate);
        ASSERT_TRUE(out.isOpen());
        EXPECT_EQ(out.write("file text", 1, 9), 9u);
        out.flush();
        EXPECT_STREQ(ZYRStd::UniStringToUTF8String(out.getFilePath()).c_str(), path.c_str());
        out.close();
        EXPECT_FALSE(out.isOpen());
    }
    ZYRStd::CZYRFStream in(ZYRStd::CZYRFileName(path.c_str()), kZYRStreamRead);
    ASSERT_TRUE(in.isOpen());
    EXPECT_EQ(in.getSize(), 9u);
    char text[16] = {};
    EXPECT_EQ(in.read(text, 1, sizeof text), 9u);
    EXPECT_STREQ(text, "file text");

    ZYRStd::CZYRFStream missing(ZYRStd::CZYRFileName(dir_.file("missing").c_str()), kZYRStreamRead);
    EXPECT_TRUE(missing.isValid()) << "a file that does not open still gives a stream";
    EXPECT_FALSE(missing.isOpen());
}

} // namespace
