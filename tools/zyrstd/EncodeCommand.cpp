// zyrstd encode and decode: ASCII85 and ASCIIHex text through the library's streams and
// filters.
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <sys/stat.h>
#include <unistd.h>
#include <utility>
#include <vector>

#include "Commands.h"
#include "IZYRFileSys.h"
#include "IZYRStream.h"
#include "ZYRHostKit.h"
#include "ZYRStd.h"
#include "zyr/std/CZYRBaseStream.h"
#include "zyr/std/CZYRCommonUniStrings.h"
#include "zyr/std/CZYRFileSys.h"
#include "zyr/std/CZYRStreamsFilterASCII85.h"
#include "zyr/std/CZYRStreamsFilterASCIIHEX.h"
#include "zyr/std/CZYRUniString.h"
#include "zyr/std/ZYRPosixIO.h"

namespace zyrtool {

namespace {

using namespace ZYRStreams;
using ZYRStd::CZYRError;
using ZYRStd::CZYRSmartZYRRefPtr;

constexpr int kFailure = 1;
constexpr int kUsageError = 2;
constexpr unsigned int kChunk = 1 << 20;

// What a command reports: a message for standard error.
struct Failure {
    std::string message;
};

[[noreturn]] void failWith(std::string message) {
    throw Failure{std::move(message)};
}

std::string describe(const CZYRError& e) {
    return e.getMessage() ? e.getMessage() : "error " + std::to_string(e.getError());
}

// The library as this host sets it up: string tables, the POSIX file-name factory and
// the native file system; all undone in reverse order.
class LibrarySession {
public:
    LibrarySession() {
        ZYRStd::InitCommonUniStrings();
        ZYRStd::InitDynamicUniStringCache();
        ZYRStd::ZYRStdInit_SetZYRFactoryProc(ZYRHostKit::posixFileNameFactory);
        fileSys_ = ZYRFileSys::createDefaultFileSystem(ZYRStd::CZYRUniString(),
                                                       ZYRStd::CZYRUniString(), nullptr);
        if (!fileSys_) {
            shutDown();
            failWith("cannot create the file system");
        }
        current_ = fileSys_;
        ZYRStd::ZYRStdInit_SetDefaultFileSysProc([] { return current_; });
    }
    ~LibrarySession() { shutDown(); }
    LibrarySession(const LibrarySession&) = delete;
    LibrarySession& operator=(const LibrarySession&) = delete;

private:
    void shutDown() {
        ZYRStd::ZYRStdInit_SetDefaultFileSysProc(nullptr);
        current_ = nullptr;
        delete fileSys_;
        ZYRStd::ZYRStdInit_SetZYRFactoryProc(nullptr);
        ZYRStd::ReleaseDynamicUniStringCache();
        ZYRStd::ReleaseCommonUniStrings();
    }

    static inline ZYRFileSys::IZYRFileSys* current_ = nullptr;
    ZYRFileSys::IZYRFileSys* fileSys_ = nullptr;
};

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
                            "tools/zyrstd/EncodeCommand", __LINE__);
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
                            "tools/zyrstd/EncodeCommand", __LINE__);
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
                        "tools/zyrstd/EncodeCommand", __LINE__);
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
                        "tools/zyrstd/EncodeCommand", __LINE__);
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

bool isStandard(const std::optional<std::string>& name) {
    return !name || *name == "-";
}

std::string displayName(const std::optional<std::string>& name, const char* standard) {
    return isStandard(name) ? standard : *name;
}

CZYRSmartZYRRefPtr<IZYRStream> openInput(const std::optional<std::string>& name) {
    if (isStandard(name))
        return CZYRSmartZYRRefPtr<IZYRStream>(new DescriptorStream(STDIN_FILENO, kZYRStreamRead));
    const ZYRStd::CZYRFileName fileName(name->c_str());
    ZYRStd::CZYRFStream stream(fileName, kZYRStreamRead | kZYRStreamSequentialScan);
    if (!stream.isOpen()) {
        const int error = errno ? errno : EIO;
        failWith(*name + ": " +
                 std::strerror(ZYRStd::CZYRFileSys::fileExists(fileName) ? error : ENOENT));
    }
    return stream;
}

// The output: standard output, or a temporary file beside the named one that takes its
// name only when everything has been written, so a failure leaves no partial file.
class Output {
public:
    explicit Output(const std::optional<std::string>& name) {
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
    ~Output() {
        if (!file_)
            return;
        try {
            file_->close();
        } catch (const CZYRError&) {
            // Going away anyway.
        }
        ::unlink(temporary_.c_str());
    }
    Output(const Output&) = delete;
    Output& operator=(const Output&) = delete;

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

struct Arguments {
    std::string kind;
    const char* prefix = nullptr;
    const char* eod = nullptr;
    bool allowZ = true;
    std::optional<std::string> in;
    std::optional<std::string> out;
};

// Returns an exit code for a usage error, or 0.
int parse(int argc, char** argv, bool encoding, Arguments& args) {
    const char* command = encoding ? "encode" : "decode";
    auto usage = [&](const std::string& why) {
        std::fprintf(stderr, "zyrstd: %s: %s\nusage: %s\n", command, why.c_str(),
                     encoding ? "zyrstd encode ascii85|asciihex [--prefix P] [--eod E] [--no-z] "
                                "[IN [OUT]]"
                              : "zyrstd decode ascii85|asciihex [IN [OUT]]");
        return kUsageError;
    };
    std::vector<std::string> positional;
    bool optionsDone = false;
    for (int i = 1; i < argc; ++i) {
        const std::string_view arg = argv[i];
        if (!optionsDone && arg == "--") {
            optionsDone = true;
        } else if (!optionsDone && encoding && (arg == "--prefix" || arg == "--eod")) {
            if (i + 1 >= argc)
                return usage(std::string(arg) + " needs a value");
            (arg == "--prefix" ? args.prefix : args.eod) = argv[++i];
        } else if (!optionsDone && encoding && arg == "--no-z") {
            args.allowZ = false;
        } else if (!optionsDone && arg.size() > 1 && arg[0] == '-') {
            return usage("unknown option '" + std::string(arg) + "'");
        } else {
            positional.emplace_back(arg);
        }
    }
    if (positional.empty())
        return usage("no encoding given");
    args.kind = positional[0];
    if (args.kind != "ascii85" && args.kind != "asciihex")
        return usage("unknown encoding '" + args.kind + "'");
    if (positional.size() > 3)
        return usage("too many arguments");
    if (positional.size() > 1)
        args.in = positional[1];
    if (positional.size() > 2)
        args.out = positional[2];
    if (args.prefix && std::strlen(args.prefix) > 2)
        return usage("--prefix takes at most 2 characters");
    if (args.eod && std::strlen(args.eod) > 14)
        return usage("--eod takes at most 14 characters");
    if (!args.allowZ && args.kind != "ascii85")
        return usage("--no-z applies to ascii85 only");
    return 0;
}

int report(const char* command, const std::string& message) {
    std::fflush(stdout);
    std::fprintf(stderr, "zyrstd: %s: %s\n", command, message.c_str());
    return kFailure;
}

template <class Filter> void encodeAll(IZYRStream& in, Filter& filter) {
    std::vector<unsigned char> chunk(kChunk);
    for (;;) {
        const unsigned int got = in.read(chunk.data(), 1, kChunk);
        if (got == 0)
            break;
        filter.write(chunk.data(), 1, got);
    }
    filter.close();
}

// Bad encoded data is the input's fault: the report names it and where the fault is.
template <class Decoder>
void decodeAll(Decoder& decoder, IZYRStream& out, const std::string& inName) {
    std::vector<unsigned char> chunk(kChunk);
    try {
        for (;;) {
            const unsigned int got = decoder.read(chunk.data(), 1, kChunk);
            if (got == 0)
                break;
            out.write(chunk.data(), 1, got);
        }
    } catch (const CZYRError& e) {
        if (e.getError() != ZYRPublic::kZYRErrorInvalidData)
            throw;
        char where[64];
        if (decoder.getFailureCharacter() >= 0)
            std::snprintf(where, sizeof where, " 0x%02X at offset %llu",
                          decoder.getFailureCharacter(), decoder.getFailureOffset());
        else
            std::snprintf(where, sizeof where, " at offset %llu", decoder.getFailureOffset());
        failWith(inName + ": " + describe(e) + where);
    }
}

int run(int argc, char** argv, bool encoding) {
    const char* command = encoding ? "encode" : "decode";
    Arguments args;
    if (const int usage = parse(argc, argv, encoding, args))
        return usage;
    const std::string inName = displayName(args.in, "standard input");
    try {
        LibrarySession session;
        CZYRSmartZYRRefPtr<IZYRStream> in = openInput(args.in);
        Output out(args.out);
        try {
            if (encoding && args.kind == "ascii85") {
                ZYRStd::CZYRStreamFilterASCII85 filter(out.streamRef(), args.prefix, args.eod,
                                                       args.allowZ);
                encodeAll(*in, filter);
            } else if (encoding) {
                ZYRStd::CZYRStreamFilterASCIIHEX filter(out.streamRef(), args.prefix, args.eod);
                encodeAll(*in, filter);
            } else if (args.kind == "ascii85") {
                ZYRStd::CZYRStreamFilterASCII85Decode decoder(in);
                decodeAll(decoder, out.stream(), inName);
            } else {
                ZYRStd::CZYRStreamFilterASCIIHEXDecode decoder(in);
                decodeAll(decoder, out.stream(), inName);
            }
        } catch (const CZYRError& e) {
            // Bad encoded data is the input's fault; name it.
            if (e.getError() == ZYRPublic::kZYRErrorInvalidData)
                return report(command, inName + ": " + describe(e));
            throw;
        }
        out.commit();
        return 0;
    } catch (const Failure& f) {
        return report(command, f.message);
    } catch (const CZYRError& e) {
        return report(command, describe(e));
    }
}

} // namespace

int runEncode(int argc, char** argv) {
    return run(argc, argv, true);
}

int runDecode(int argc, char** argv) {
    return run(argc, argv, false);
}

} // namespace zyrtool
