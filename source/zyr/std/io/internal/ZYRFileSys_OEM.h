// A file through the host's procedure record, for files the host names by its own paths.
#pragma once

#include <memory>

#include "IZYRFileSys.h"
#include "ZYRPDLFileSysRec.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/values/CZYRUniString.h"

namespace ZYROEMFileSys {

// A missing procedure raises kZYRErrorInvalidFuncCall, a failing one
// kZYRErrorFileOpFailed (removal failures are kZYRErrorInvalidFuncCall).
class CFile : public ZYRStd::CZYRClientBase, public ZYRFileSys::IFile {
public:
    // Takes over `diPath` and frees it with the record's free procedure, also when the
    // construction fails.
    CFile(void* diPath, unsigned int mode, ZYRPublic::_t_ZYRPDLFileSysRec* record);
    // The same on the library's heap, taking over `diPath` also when the file object itself
    // cannot be allocated.
    static std::unique_ptr<ZYRFileSys::IFile> create(void* diPath, unsigned int mode,
                                                     ZYRPublic::_t_ZYRPDLFileSysRec* record);
    CFile(const CFile&) = delete;
    CFile& operator=(const CFile&) = delete;
    ~CFile() override; // closes (errors dropped) and frees the DI path

    void open() override;
    void close() override;
    unsigned long long setPos(const unsigned long long& pos) override;
    unsigned long long getPos() override;
    unsigned long long setEOF() override;
    unsigned int read(void* buf, unsigned int bytes) override;
    unsigned int write(const void* buf, unsigned int bytes) override;
    unsigned long long getSize() override;
    unsigned long long getCapacity() override { return ~0ull; }
    void setAccessMode(unsigned int mode) override { access_.setMode(mode); }
    unsigned int getAccessMode() override { return access_.mode(); }
    const ZYRStd::CZYRUniString& getFilePath() override { return path_; }
    void flush() override;
    bool truncate() override;
    bool hasAccessMode(unsigned int bits) override { return access_.has(bits); }
    bool isOpen() override { return handle_ != nullptr; }
    void remove() override;

private:
    void freeDIPath() noexcept;

    void* handle_ = nullptr;
    void* diPath_;
    ZYRStd::CZYRUniString path_;
    ZYRFileSys::CStreamAccess access_;
    ZYRPublic::_t_ZYRPDLFileSysRec* record_;
};

} // namespace ZYROEMFileSys
