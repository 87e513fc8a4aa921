// Output that appears whole or not at all.
#pragma once

#include <cerrno>
#include <cstring>
#include <optional>
#include <string>
#include <sys/stat.h>
#include <unistd.h>

#include "IZYRFileSys.h"
#include "ToolStreams.h"
#include "ToolSupport.h"
#include "zyr/std/io/CZYRFileSys.h"
#include "zyr/std/values/CZYRUniString.h"

namespace zyrtool {

// The output: standard output, or a temporary file beside the named one that takes its
// name only when everything has been written, so a failure leaves no partial file.
class AtomicOutput {
public:
    explicit AtomicOutput(const std::optional<std::string>& name) {
        if (isStandard(name)) {
            writer_ = CZYRSmartZYRRefPtr<BufferedWriter>(
                new BufferedWriter(CZYRSmartZYRRefPtr<IZYRStream>(
                    new DescriptorStream(STDOUT_FILENO, kZYRStreamWrite))));
            return;
        }
        target_ = *name;
        const ZYRStd::CZYRFileName fileName(name->c_str());
        ZYRStd::CZYRWString dir = fileName.getFileDirPath();
        if (dir.empty())
            dir = ZYRStd::CZYRWString(u".");
        errno = 0;
        try {
            // The data is worth nothing until renamed into place, so no flush at close.
            file_ = ZYRStd::CZYRFileSys::createTmpFileStream(ZYRStd::CZYRFileName(dir), u"zyr",
                                                             kZYRStreamWrite | kZYRStreamTruncate |
                                                                 kZYRStreamNoFlushOnClose);
        } catch (const CZYRError&) {
            file_.reset();
        }
        if (!file_ || !file_->isOpen()) {
            const int error = errno ? errno : EIO;
            failWith(*name + ": cannot create the output file: " + std::strerror(error));
        }
        temporary_ = ZYRStd::UniStringToUTF8String(file_->getFilePath()).c_str();
        writer_ = CZYRSmartZYRRefPtr<BufferedWriter>(
            new BufferedWriter(CZYRSmartZYRRefPtr<IZYRStream>(file_)));
    }
    ~AtomicOutput() {
        if (!file_)
            return;
        try {
            file_->close();
        } catch (const CZYRError&) {
            // Going away anyway.
        }
        ::unlink(temporary_.c_str());
    }
    AtomicOutput(const AtomicOutput&) = delete;
    AtomicOutput& operator=(const AtomicOutput&) = delete;

    IZYRStream& stream() { return *writer_; }
    CZYRSmartZYRRefPtr<IZYRStream> streamRef() const {
        return CZYRSmartZYRRefPtr<IZYRStream>(writer_);
    }

    void commit() {
        writer_->flushBuffer();
        if (!file_)
            return;
        file_->close();
        const mode_t mask = ::umask(0);
        ::umask(mask);
        ::chmod(temporary_.c_str(), 0666 & ~mask);
        // A plain rename replaces an existing output in one step.
        if (::rename(temporary_.c_str(), target_.c_str()) != 0)
            failWith(target_ + ": " + std::strerror(errno));
        file_.reset();
    }

private:
    std::string target_;
    std::string temporary_;
    CZYRSmartZYRRefPtr<IZYRFStream> file_;
    CZYRSmartZYRRefPtr<BufferedWriter> writer_;
};

} // namespace zyrtool
