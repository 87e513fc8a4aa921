// A file through the host's procedure record.
#include "zyr/std/io/internal/ZYRFileSys_OEM.h"

#include <memory>

#include "zyr/std/core/CZYRError.h"
#include "zyr/std/io/internal/ZYRFileSys_helper.h"

namespace ZYROEMFileSys {

using namespace ZYRStreams;
using ZYRStd::CZYRError;

namespace {

constexpr const char* kSource = "source/zyr/std/ZYRFileSys_OEM";

[[noreturn]] void missing(const char* message, int line) {
    throw CZYRError(ZYRPublic::kZYRErrorInvalidFuncCall, message, kSource, line);
}

[[noreturn]] void failed(const char* message, int line) {
    throw CZYRError(ZYRPublic::kZYRErrorFileOpFailed, message, kSource, line);
}

uint32_t lowWord(unsigned long long v) {
    return static_cast<uint32_t>(v);
}

uint32_t highWord(unsigned long long v) {
    return static_cast<uint32_t>(v >> 32);
}

unsigned short hostMode(const ZYRFileSys::CStreamAccess& access) {
    unsigned short mode = 0;
    if (access.isReadable())
        mode |= 0x1;
    if (access.isWritable())
        mode |= 0x2;
    if (access.has(kZYRStreamTruncate))
        mode |= 0x4;
    if (access.has(kZYRStreamSequentialScan))
        mode |= 0x8;
    if (access.has(kZYRStreamRandomAccess))
        mode |= 0x20;
    return mode;
}

} // namespace

CFile::CFile(void* diPath, unsigned int mode, ZYRPublic::_t_ZYRPDLFileSysRec* record)
    : diPath_(diPath), access_(mode), record_(record) {
    if (!record_ || !record_->diPathToPath) {
        freeDIPath();
        missing("diPathFromPath proc not defined", __LINE__);
    }
    // The host's path texts go back to it also when making the string fails.
    const auto hostFree = [this](void* text) {
        if (text && record_->free)
            record_->free(text);
    };
    try {
        if (record_->diPathToWPath) {
            const std::unique_ptr<char16_t, decltype(hostFree)> text(
                record_->diPathToWPath(diPath_, 0), hostFree);
            if (text)
                path_ = ZYRStd::CZYRUniString(text.get());
        } else {
            const std::unique_ptr<char, decltype(hostFree)> text(record_->diPathToPath(diPath_, 0),
                                                                 hostFree);
            if (text)
                path_ = ZYRFileSys::uniPathOf(text.get());
        }
    } catch (...) {
        freeDIPath();
        throw;
    }
}

std::unique_ptr<ZYRFileSys::IFile> CFile::create(void* diPath, unsigned int mode,
                                                 ZYRPublic::_t_ZYRPDLFileSysRec* record) {
    void* storage = nullptr;
    try {
        storage = CFile::operator new(sizeof(CFile));
    } catch (...) {
        // No object to take the path over: it goes back to the host here.
        if (diPath && record && record->free)
            record->free(diPath);
        throw;
    }
    try {
        return std::unique_ptr<ZYRFileSys::IFile>(::new (storage) CFile(diPath, mode, record));
    } catch (...) {
        CFile::operator delete(storage); // the constructor has freed the path
        throw;
    }
}

CFile::~CFile() {
    try {
        close();
    } catch (...) {
        // A destructor has no one to report to.
    }
    freeDIPath();
}

void CFile::freeDIPath() noexcept {
    if (diPath_ && record_ && record_->free)
        record_->free(diPath_);
    diPath_ = nullptr;
}

void CFile::open() {
    if (!record_->open64)
        missing("open64 proc not defined", __LINE__);
    void* handle = nullptr;
    if (record_->open64(diPath_, hostMode(access_), &handle) != 0 || !handle)
        failed("Error opening file", __LINE__);
    handle_ = handle;
}

void CFile::close() {
    if (!record_->close || !record_->remove)
        missing("close or remove proc not defined", __LINE__);
    if (!handle_)
        return;
    void* handle = handle_;
    handle_ = nullptr; // closed or not, the handle is not used again
    if (record_->close(handle) != 0)
        failed("Error closing file", __LINE__);
    if (access_.has(kZYRStreamDeleteOnClose) && record_->remove(diPath_) != 0)
        missing("Error removing file", __LINE__);
}

unsigned long long CFile::setPos(const unsigned long long& pos) {
    if (!record_->setpos64)
        missing("setpos64 proc not defined", __LINE__);
    if (record_->setpos64(handle_, lowWord(pos), highWord(pos)) != 0)
        failed("Error setpos file", __LINE__);
    return pos;
}

unsigned long long CFile::getPos() {
    if (!record_->getpos64)
        missing("getpos64 proc not defined", __LINE__);
    unsigned long long pos = 0;
    if (record_->getpos64(handle_, &pos) != 0)
        failed("Error getpos file", __LINE__);
    return pos;
}

unsigned long long CFile::setEOF() {
    if (!record_->geteof64 || !record_->setpos64)
        missing("geteof64 or setpos64 proc not defined", __LINE__);
    unsigned long long eof = 0;
    if (record_->geteof64(handle_, &eof) != 0 ||
        record_->setpos64(handle_, lowWord(eof), highWord(eof)) != 0)
        failed("Error seteof file", __LINE__);
    return eof;
}

unsigned int CFile::read(void* buf, unsigned int bytes) {
    if (!record_->read)
        missing("read proc not defined", __LINE__);
    int error = 0;
    const size_t got = record_->read(buf, bytes, 1, handle_, &error);
    if (error != 0)
        failed("Error reading file", __LINE__);
    return static_cast<unsigned int>(got);
}

unsigned int CFile::write(const void* buf, unsigned int bytes) {
    if (!record_->write)
        missing("write proc not defined", __LINE__);
    int error = 0;
    const size_t put = record_->write(buf, bytes, 1, handle_, &error);
    if (error != 0)
        failed("Error writing file", __LINE__);
    return static_cast<unsigned int>(put);
}

unsigned long long CFile::getSize() {
    if (!record_->geteof64)
        missing("geteof proc not defined", __LINE__);
    unsigned long long eof = 0;
    if (record_->geteof64(handle_, &eof) != 0)
        failed("Error getting size of file", __LINE__);
    return eof;
}

void CFile::flush() {
    if (!record_->flush)
        missing("flush proc not defined", __LINE__);
    if (record_->flush(handle_) != 0)
        failed("error flushing file", __LINE__);
}

bool CFile::truncate() {
    if (!record_->getpos64 || !record_->seteof)
        missing("getpos64 or seteof proc not defined", __LINE__);
    unsigned long long pos = 0;
    return record_->getpos64(handle_, &pos) == 0 &&
           record_->seteof(handle_, lowWord(pos), highWord(pos)) == 0;
}

void CFile::remove() {
    if (!record_->remove)
        missing("remove proc not defined", __LINE__);
    if (record_->remove(diPath_) != 0)
        missing("Error removing file", __LINE__);
}

} // namespace ZYROEMFileSys
