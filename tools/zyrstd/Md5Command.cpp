// zyrstd md5: MD5 digests of files in md5sum's output format.
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <fcntl.h>
#include <memory>
#include <string>
#include <string_view>
#include <unistd.h>
#include <vector>

#include "Commands.h"
#include "ZYRStd.h"
#include "zyr/std/io/posix/ZYRPosixIO.h"

namespace zyrtool {

namespace {

constexpr std::size_t kChunkSize = 64 * 1024;

// Closes the descriptor it was given unless it is standard input, which we only borrow.
class InputFile {
public:
    explicit InputFile(std::string_view name)
        : fd_(name == "-" ? STDIN_FILENO : ::open(std::string(name).c_str(), O_RDONLY)) {}
    ~InputFile() {
        if (fd_ > STDIN_FILENO)
            ::close(fd_);
    }
    InputFile(const InputFile&) = delete;
    InputFile& operator=(const InputFile&) = delete;
    int fd() const { return fd_; }

private:
    int fd_;
};

// Returns 0 and fills `digest`, or the errno value that stopped the reading.
int digestFile(std::string_view name, std::vector<unsigned char>& chunk,
               ZYRStd::ZYRDigest& digest) {
    InputFile file(name);
    if (file.fd() < 0)
        return errno;
    std::unique_ptr<ZYRStd::CZYRHash> hash(ZYRStd::createMD5Hash());
    if (!hash)
        return ENOMEM;
    for (;;) {
        const ZYRStd::posixio::Transfer t =
            ZYRStd::posixio::readFully(file.fd(), chunk.data(), chunk.size());
        if (t.error != 0)
            return t.error;
        if (t.done > 0)
            hash->update(chunk.data(), static_cast<unsigned int>(t.done));
        if (t.done < chunk.size())
            break; // the end of the file
    }
    digest = hash->getDigest();
    return 0;
}

// md5sum marks a line whose name needed escaping with a leading backslash.
std::string formatLine(const ZYRStd::ZYRDigest& digest, std::string_view name) {
    static constexpr char digits[] = "0123456789abcdef";
    std::string line;
    if (name.find_first_of("\\\n\r") != std::string_view::npos)
        line += '\\';
    for (unsigned char byte : digest) {
        line += digits[byte >> 4];
        line += digits[byte & 15];
    }
    line += "  ";
    for (char c : name) {
        switch (c) {
        case '\\':
            line += "\\\\";
            break;
        case '\n':
            line += "\\n";
            break;
        case '\r':
            line += "\\r";
            break;
        default:
            line += c;
        }
    }
    line += '\n';
    return line;
}

} // namespace

int runMd5(int argc, char** argv) {
    std::vector<std::string_view> names;
    bool optionsDone = false;
    for (int i = 1; i < argc; ++i) {
        const std::string_view arg = argv[i];
        if (!optionsDone && arg == "--")
            optionsDone = true;
        else if (!optionsDone && arg.size() > 1 && arg[0] == '-')
            return usageError("md5", "unknown option '" + std::string(arg) + "'");
        else
            names.push_back(arg);
    }
    if (names.empty())
        names.emplace_back("-");

    std::vector<unsigned char> chunk(kChunkSize);
    int status = 0;
    for (std::string_view name : names) {
        ZYRStd::ZYRDigest digest;
        if (const int error = digestFile(name, chunk, digest)) {
            std::fflush(stdout); // keep the lines in order when both streams go to one place
            std::fprintf(stderr, "zyrstd: md5: %.*s: %s\n", static_cast<int>(name.size()),
                         name.data(), std::strerror(error));
            status = 1;
            continue;
        }
        const std::string line = formatLine(digest, name);
        std::fwrite(line.data(), 1, line.size(), stdout);
    }
    if (std::fflush(stdout) != 0 || std::ferror(stdout)) {
        std::fprintf(stderr, "zyrstd: md5: write error: %s\n", std::strerror(errno));
        status = 1;
    }
    return status;
}

} // namespace zyrtool
