// Memory-mapped file streams on POSIX.
#include "zyr/std/io/posix/ZYRPosixSupport.h"

namespace ZYRPosixFileSys {

using namespace detail;

// ---- IImpZYRMemMapFStream ------------------------------------------------------------------

IImpZYRMemMapFStream::IImpZYRMemMapFStream(const CZYRUniString& path, unsigned int mode,
                                           unsigned long long offset, unsigned int length)
    : file_(path, mode), offset_(offset), length_(length) {
    map();
}

IImpZYRMemMapFStream::~IImpZYRMemMapFStream() {
    try {
        unmap();
    } catch (...) {
        // A destructor has no one to report to; the file closes with file_.
    }
}

void IImpZYRMemMapFStream::map() {
    file_.openForMapping();
    try {
        const unsigned long long fileSize = file_.getSize();
        unsigned long long length = length_;
        if (offset_ == 0 && length_ == 0) {
            if (fileSize == 0)
                raise("Error mapping empty file", __LINE__);
            // The inner memory stream is 32-bit.
            if (fileSize > 0xFFFFFFFFull) {
                errno = EFBIG;
                raise("error mapping view of file", __LINE__);
            }
            length = fileSize;
        }
        const auto page = static_cast<unsigned long long>(::sysconf(_SC_PAGESIZE));
        const unsigned long long start = offset_ - offset_ % page;
        const unsigned long long viewLength = length + (offset_ - start);
        if (length == 0 || offset_ > ~0ull - length ||
            start > static_cast<unsigned long long>(INT64_MAX)) {
            errno = EINVAL;
            raise("error mapping view of file", __LINE__);
        }
        const unsigned long long viewEnd = start + viewLength;
        const bool writable = file_.hasAccessMode(kZYRStreamWrite | kZYRStreamAppend);
        if (fileSize < viewEnd) {
            // A read-only view past the end would fault on first touch, so refuse it; a
            // writable file grows to cover the view.
            if (!writable) {
                errno = EINVAL;
                raise("error mapping view of file", __LINE__);
            }
            checkCall(::ftruncate(file_.descriptor(), static_cast<off_t>(viewEnd)) == 0,
                      "error mapping view of file", __LINE__);
        }
        const int protection = writable ? PROT_READ | PROT_WRITE : PROT_READ;
        void* view = ::mmap(nullptr, static_cast<size_t>(viewLength), protection, MAP_SHARED,
                            file_.descriptor(), static_cast<off_t>(start));
        checkCall(view != MAP_FAILED, "error mapping view of file", __LINE__);
        view_ = view;
        viewLength_ = static_cast<size_t>(viewLength);
        file_.viewMapped();
        length_ = static_cast<unsigned int>(length);
        inner_ = CZYRSmartZYRRefPtr<IImpZYRMemStream>(new IImpZYRMemStream(
            file_.getAccessMode(), length_, static_cast<unsigned char*>(view) + (offset_ - start)));
    } catch (...) {
        try {
            unmap();
            file_.close();
        } catch (...) {
            // The mapping failure is the error worth reporting.
        }
        throw;
    }
}

void IImpZYRMemMapFStream::unmap() {
    inner_.reset();
    if (!view_)
        return;
    void* view = view_;
    view_ = nullptr;
    file_.viewUnmapped();
    checkCall(::munmap(view, viewLength_) == 0, "error unmapping view of file", __LINE__);
}

ZYRFileSys::IImpZYRMemStream& IImpZYRMemMapFStream::inner(int line) const {
    if (!inner_)
        raise("file stm not mapped", line);
    return *inner_;
}

void IImpZYRMemMapFStream::reOpen(unsigned int mode) {
    unmap();
    file_.close();
    file_.setAccessMode(mode);
    map();
}

unsigned int IImpZYRMemMapFStream::read(void* buf, unsigned int size, unsigned int count,
                                        ZYRPublic::eZYRErrorType& err) {
    return reportStreamError(err, [&] { return read(buf, size, count); });
}

unsigned int IImpZYRMemMapFStream::read(void* buf, unsigned int size, unsigned int count) {
    return inner(__LINE__).read(buf, size, count);
}

unsigned int IImpZYRMemMapFStream::write(const void* buf, unsigned int size, unsigned int count,
                                         ZYRPublic::eZYRErrorType& err) {
    return reportStreamError(err, [&] { return write(buf, size, count); });
}

unsigned int IImpZYRMemMapFStream::write(const void* buf, unsigned int size, unsigned int count) {
    return inner(__LINE__).write(buf, size, count);
}

unsigned long long IImpZYRMemMapFStream::setPos(const unsigned long long& pos) {
    return inner(__LINE__).setPos(pos);
}

unsigned long long IImpZYRMemMapFStream::getPos() {
    return inner(__LINE__).getPos();
}

void IImpZYRMemMapFStream::setEOF() {
    inner(__LINE__).setEOF();
}

unsigned long long IImpZYRMemMapFStream::getEOF() {
    return inner(__LINE__).getEOF();
}

unsigned long long IImpZYRMemMapFStream::getSize() {
    if (!inner_)
        return 0;
    const unsigned long long fileSize = file_.getSize();
    const unsigned long long inFile = fileSize > offset_ ? fileSize - offset_ : 0;
    const unsigned long long size = inner_->getSize();
    return inFile < size ? inFile : size;
}

unsigned long long IImpZYRMemMapFStream::getCapacity() {
    return inner_ ? inner_->getCapacity() : 0;
}

unsigned int IImpZYRMemMapFStream::getAccessMode() {
    return inner_ ? inner_->getAccessMode() : 0;
}

void IImpZYRMemMapFStream::close() {
    unmap();
    file_.close();
}

void IImpZYRMemMapFStream::flush() {
    if (view_)
        checkCall(::msync(view_, viewLength_, MS_SYNC) == 0, "error flushing file", __LINE__);
}

void* IImpZYRMemMapFStream::getMapAttributes(unsigned long long& offset, unsigned int& length) {
    if (!inner_) {
        offset = 0;
        length = 0;
        return nullptr;
    }
    offset = offset_;
    length = length_;
    return inner_->data();
}

} // namespace ZYRPosixFileSys
