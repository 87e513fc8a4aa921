// The one read and write loop over POSIX file descriptors, for the library, the host kit
// and the tool. Not exported: header only.
#pragma once

#include <cerrno>
#include <cstddef>
#include <unistd.h>

namespace ZYRStd::posixio {

// What a transfer did: the bytes moved, and the error that stopped it (0 when it moved
// everything or, reading, met the end of the file).
struct Transfer {
    size_t done = 0;
    int error = 0;
};

// Reads until `n` bytes are in, the end of the file, or an error; an interrupted call is
// retried. `readCall` stands in for ::read in tests.
template <class ReadCall = decltype(&::read)>
Transfer readFully(int fd, void* buf, size_t n, ReadCall readCall = &::read) {
    auto* p = static_cast<unsigned char*>(buf);
    Transfer t;
    while (t.done < n) {
        const ssize_t got = readCall(fd, p + t.done, n - t.done);
        if (got < 0) {
            if (errno == EINTR)
                continue;
            t.error = errno != 0 ? errno : EIO;
            break;
        }
        if (got == 0)
            break; // end of file
        t.done += static_cast<size_t>(got);
    }
    return t;
}

// Writes all `n` bytes or stops at an error; an interrupted call is retried. A write that
// moves nothing will never move anything: it is an error (EIO), not a reason to loop.
template <class WriteCall = decltype(&::write)>
Transfer writeFully(int fd, const void* buf, size_t n, WriteCall writeCall = &::write) {
    const auto* p = static_cast<const unsigned char*>(buf);
    Transfer t;
    while (t.done < n) {
        const ssize_t put = writeCall(fd, p + t.done, n - t.done);
        if (put < 0) {
            if (errno == EINTR)
                continue;
            t.error = errno != 0 ? errno : EIO;
            break;
        }
        if (put == 0) {
            t.error = EIO;
            break;
        }
        t.done += static_cast<size_t>(put);
    }
    return t;
}

} // namespace ZYRStd::posixio
