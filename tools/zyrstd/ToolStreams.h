// The zyrstd tool's streams: standard input and output as streams, a writer that gathers
// short writes, and the opening of a named or standard input.
#pragma once

#include <cerrno>
#include <cstring>
#include <optional>
#include <string>
#include <unistd.h>
#include <utility>
#include <vector>

#include "IZYRStream.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/CZYRSmartPtr.h"
#include "zyr/std/io/posix/ZYRPosixIO.h"

namespace zyrtool {

using ZYRStd::CZYRError;
using ZYRStd::CZYRSmartZYRRefPtr;
using namespace ZYRStreams;

// The size of the tool's reads and of its gathered writes.
constexpr unsigned int kChunk = 1 << 20;

// Standard input or output as a stream; the descriptor is borrowed.
class DescriptorStream : public IZYRStream, public ZYRStd::CZYRClientBase {
public:
    DescriptorStream(int fd, unsigned int mode) : fd_(fd), mode_(mode) {}

    void reOpen(unsigned int) override { unsupported(); }
    unsigned int read(void* buf, unsigned int size, unsigned int count,
                      ZYRPublic::eZYRErrorType& err) override {
        return reporting(err, [&] { return read(buf, size, count); });
    }
    unsigned int read(void* buf, unsigned int size, unsigned int count) override {
        const ZYRStd::posixio::Transfer t = ZYRStd::posixio::readFully(fd_, buf, size * count);
        if (t.error != 0)
            throw CZYRError(ZYRPublic::kZYRErrorFileOpFailed, "error reading standard input",
                            "tools/zyrstd/ToolStreams", __LINE__);
        position_ += t.done;
        return static_cast<unsigned int>(t.done);
    }
    unsigned int write(const void* buf, unsigned int size, unsigned int count,
                       ZYRPublic::eZYRErrorType& err) override {
        return reporting(err, [&] { return write(buf, size, count); });
    }
    unsigned int write(const void* buf, unsigned int size, unsigned int count) override {
        const ZYRStd::posixio::Transfer t = ZYRStd::posixio::writeFully(fd_, buf, size * count);
        if (t.error != 0)
            throw CZYRError(ZYRPublic::kZYRErrorFileOpFailed, "error writing standard output",
                            "tools/zyrstd/ToolStreams", __LINE__);
        position_ += t.done;
        return static_cast<unsigned int>(t.done);
    }
    unsigned long long setPos(const unsigned long long&) override { unsupported(); }
    unsigned long long getPos() override { return position_; }
    void setEOF() override { unsupported(); }
    unsigned long long getEOF() override { return position_; }
    unsigned long long getSize() override { return position_; }
    unsigned long long getCapacity() override { return ~0ull; }
    unsigned int getAccessMode() override { return mode_; }

private:
    template <class Body> static unsigned int reporting(ZYRPublic::eZYRErrorType& err, Body body) {
        try {
            return body();
        } catch (const CZYRError& e) {
            err = e.getError();
        } catch (...) {
            err = ZYRPublic::kZYRErrorUnknown;
        }
        return 0;
    }
    [[noreturn]] static void unsupported() {
        throw CZYRError(ZYRPublic::kZYRErrorInvalidFuncCall, "not supported on a pipe",
                        "tools/zyrstd/ToolStreams", __LINE__);
    }

    int fd_;
    unsigned int mode_;
    unsigned long long position_ = 0;
};

// Gathers the filters' short lines into large writes to the stream below.
class BufferedWriter : public IZYRStream, public ZYRStd::CZYRClientBase {
public:
    explicit BufferedWriter(CZYRSmartZYRRefPtr<IZYRStream> target)
        : target_(std::move(target)), buffer_(kChunk) {}

    void flushBuffer() {
        if (used_ > 0) {
            const unsigned int n = std::exchange(used_, 0u);
            target_->write(buffer_.data(), 1, n);
        }
    }

    void reOpen(unsigned int) override {}
    unsigned int read(void*, unsigned int, unsigned int, ZYRPublic::eZYRErrorType& err) override {
        err = ZYRPublic::kZYRErrorInvalidFuncCall;
        return 0;
    }
    unsigned int read(void*, unsigned int, unsigned int) override {
        throw CZYRError(ZYRPublic::kZYRErrorInvalidFuncCall, "stream is not readable",
                        "tools/zyrstd/ToolStreams", __LINE__);
    }
    unsigned int write(const void* buf, unsigned int size, unsigned int count,
                       ZYRPublic::eZYRErrorType& err) override {
        try {
            return write(buf, size, count);
        } catch (const CZYRError& e) {
            err = e.getError();
        }
        return 0;
    }
    unsigned int write(const void* buf, unsigned int size, unsigned int count) override {
        const unsigned int n = size * count;
        if (n > buffer_.size() - used_)
            flushBuffer();
        if (n >= buffer_.size()) {
            target_->write(buf, 1, n);
        } else if (n > 0) {
            std::memcpy(buffer_.data() + used_, buf, n);
            used_ += n;
        }
        written_ += n;
        return n;
    }
    unsigned long long setPos(const unsigned long long&) override { return written_; }
    unsigned long long getPos() override { return written_; }
    void setEOF() override {}
    unsigned long long getEOF() override { return written_; }
    unsigned long long getSize() override { return written_; }
    unsigned long long getCapacity() override { return ~0ull; }
    unsigned int getAccessMode() override { return kZYRStreamWrite; }

private:
    CZYRSmartZYRRefPtr<IZYRStream> target_;
    std::vector<unsigned char> buffer_;
    unsigned int used_ = 0;
    unsigned long long written_ = 0;
};

// "-" or no name: the standard stream.
bool isStandard(const std::optional<std::string>& name);
std::string displayName(const std::optional<std::string>& name, const char* standard);
// Standard input, or the named file through the library's file system.
CZYRSmartZYRRefPtr<IZYRStream> openInput(const std::optional<std::string>& name);

} // namespace zyrtool
