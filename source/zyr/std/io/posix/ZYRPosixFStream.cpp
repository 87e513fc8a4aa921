// File streams on POSIX.
#include "zyr/std/io/posix/ZYRPosixSupport.h"

namespace ZYRPosixFileSys {

using namespace detail;

// ---- IImpZYRFStream ------------------------------------------------------------------------

IImpZYRFStream::IImpZYRFStream(std::unique_ptr<IFile> file, unsigned int mode)
    : file_(std::move(file)), mode_(mode) {
    if (!file_)
        return;
    try {
        file_->open();
        if (file_->hasAccessMode(kZYRStreamAppend))
            file_->setEOF();
    } catch (const CZYRError&) {
        // Whether the file opened is what isOpen reports.
    }
}

IImpZYRFStream::~IImpZYRFStream() = default;

IFile& IImpZYRFStream::file(int line) const {
    if (!file_)
        throw CZYRError(ZYRPublic::kZYRErrorFileOpFailed, "file stm not open", kSource, line);
    return *file_;
}

void IImpZYRFStream::reOpen(unsigned int mode) {
    IFile& f = file(__LINE__);
    f.close();
    f.setAccessMode(mode);
    mode_ = mode;
    f.open();
}

unsigned int IImpZYRFStream::read(void* buf, unsigned int size, unsigned int count,
                                  ZYRPublic::eZYRErrorType& err) {
    return reportStreamError(err, [&] { return read(buf, size, count); });
}

unsigned int IImpZYRFStream::read(void* buf, unsigned int size, unsigned int count) {
    if (!(getAccessMode() & kZYRStreamRead))
        throw CZYRError(ZYRPublic::kZYRErrorInvalidFuncCall, "stream is not readable", kSource,
                        __LINE__);
    return file(__LINE__).read(buf, size * count);
}

unsigned int IImpZYRFStream::write(const void* buf, unsigned int size, unsigned int count,
                                   ZYRPublic::eZYRErrorType& err) {
    return reportStreamError(err, [&] { return write(buf, size, count); });
}

unsigned int IImpZYRFStream::write(const void* buf, unsigned int size, unsigned int count) {
    if (!(getAccessMode() & (kZYRStreamWrite | kZYRStreamAppend)))
        throw CZYRError(ZYRPublic::kZYRErrorInvalidFuncCall, "stream is not writable", kSource,
                        __LINE__);
    return file(__LINE__).write(buf, size * count);
}

unsigned long long IImpZYRFStream::setPos(const unsigned long long& pos) {
    return file(__LINE__).setPos(pos);
}

unsigned long long IImpZYRFStream::getPos() {
    return file(__LINE__).getPos();
}

void IImpZYRFStream::setEOF() {
    file(__LINE__).setEOF();
}

unsigned long long IImpZYRFStream::getEOF() {
    return getSize();
}

unsigned long long IImpZYRFStream::getSize() {
    return file(__LINE__).getSize();
}

unsigned long long IImpZYRFStream::getCapacity() {
    return file(__LINE__).getCapacity();
}

unsigned int IImpZYRFStream::getAccessMode() {
    return file_ ? file_->getAccessMode() : mode_;
}

bool IImpZYRFStream::isOpen() {
    return file_ && file_->isOpen();
}

void IImpZYRFStream::close() {
    if (file_)
        file_->close();
}

void IImpZYRFStream::flush() {
    file(__LINE__).flush();
}

const CZYRUniString& IImpZYRFStream::getFilePath() {
    static const CZYRUniString none;
    return file_ ? file_->getFilePath() : none;
}

bool IImpZYRFStream::truncate() {
    return file_ && file_->truncate();
}

void IImpZYRFStream::removeFile() {
    file(__LINE__).remove();
}

} // namespace ZYRPosixFileSys
