// The memory stream.
#include "zyr/std/io/IImpZYRMemStream.h"

#include <cstring>

#include "zyr/std/core/CZYRError.h"
#include "zyr/std/io/internal/ZYRFileSys_helper.h"

namespace ZYRFileSys {

using namespace ZYRStreams;
using ZYRStd::CZYRError;

namespace {
constexpr const char* kSource = "source/zyr/std/IImpZYRMemStream";
}

IImpZYRMemStream::IImpZYRMemStream(unsigned int mode, unsigned int capacity, void* buffer)
    : capacity_(capacity), access_(mode) {
    if (buffer) {
        data_ = static_cast<unsigned char*>(buffer);
        if (access_.isReadable() && !access_.has(kZYRStreamTruncate))
            eof_ = capacity_;
    } else if (capacity_ > 0) {
        try {
            ownBuffer_.grow(capacity_);
        } catch (const CZYRError&) {
            throw CZYRError(ZYRPublic::kZYRErrorOutOfMemory, nullptr, kSource, __LINE__);
        }
        data_ = ownBuffer_.data();
    }
    if (access_.has(kZYRStreamAppend))
        position_ = eof_;
}

IImpZYRMemStream::~IImpZYRMemStream() = default;

void IImpZYRMemStream::reOpen(unsigned int mode) {
    access_.setMode(mode);
    if (access_.has(kZYRStreamTruncate) ||
        (access_.has(kZYRStreamWrite) && !access_.has(kZYRStreamRead | kZYRStreamAppend)))
        eof_ = 0;
    if (access_.has(kZYRStreamAppend)) {
        position_ = eof_;
    } else {
        position_ = 0;
        eof_ = 0;
    }
}

unsigned int IImpZYRMemStream::read(void* buf, unsigned int size, unsigned int count,
                                    ZYRPublic::eZYRErrorType& err) {
    return reportStreamError(err, [&] { return read(buf, size, count); });
}

unsigned int IImpZYRMemStream::read(void* buf, unsigned int size, unsigned int count) {
    if (!access_.isReadable())
        throw CZYRError(ZYRPublic::kZYRErrorInvalidFuncCall, "stream is not readable", kSource,
                        __LINE__);
    if (position_ > eof_)
        throw CZYRError(ZYRPublic::kZYRErrorInvalidData, "attempt to read negative bytes", kSource,
                        __LINE__);
    unsigned int n = size * count; // 32-bit product, as the interface defines it
    if (n > eof_ - position_)
        n = eof_ - position_;
    if (n > 0) {
        std::memcpy(buf, data_ + position_, n);
        position_ += n;
    }
    return n;
}

unsigned int IImpZYRMemStream::write(const void* buf, unsigned int size, unsigned int count,
                                     ZYRPublic::eZYRErrorType& err) {
    return reportStreamError(err, [&] { return write(buf, size, count); });
}

unsigned int IImpZYRMemStream::write(const void* buf, unsigned int size, unsigned int count) {
    if (!access_.isWritable())
        throw CZYRError(ZYRPublic::kZYRErrorInvalidFuncCall, "stream is not writable", kSource,
                        __LINE__);
    const unsigned int n = size * count;
    // Summed in 64 bits: a 32-bit sum could wrap and let the copy run past the buffer.
    if (static_cast<unsigned long long>(position_) + n > capacity_)
        throw CZYRError(ZYRPublic::kZYRErrorInvalidData, "write past end of stream", kSource,
                        __LINE__);
    if (n > 0) {
        std::memcpy(data_ + position_, buf, n);
        position_ += n;
        if (position_ > eof_)
            eof_ = position_;
    }
    return n;
}

unsigned long long IImpZYRMemStream::setPos(const unsigned long long& pos) {
    if (pos > capacity_)
        throw CZYRError(ZYRPublic::kZYRErrorLimitCheck, "Attempt to setPos beyond Mem Stream size",
                        kSource, __LINE__);
    position_ = static_cast<unsigned int>(pos);
    return position_;
}

} // namespace ZYRFileSys
