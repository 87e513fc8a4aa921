// Our telemetry session library: each recording session writes one JSON Lines file (one
// object a line) into its session folder. The format is described in the README.
#include "Kelvrin.h"

#include <fcntl.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <chrono>
#include <cstdio>
#include <cstring>
#include <ctime>
#include <filesystem>
#include <memory>
#include <mutex>
#include <string>

#include <nlohmann/json.hpp>

// Header-only lock annotations shared with the library; nothing of the library is linked.
#include "zyr/std/core/ZYRThreadSafety.h"

struct Kelvrin {
    ZYRStd::detail::Mutex lock; // any thread may log
    // The session file, or -1 for a session that records nothing.
    int fd ZYR_GUARDED_BY(lock) = -1;
    std::string path ZYR_GUARDED_BY(lock);
    int writeError ZYR_GUARDED_BY(lock) = 0; // the first write that failed; reported at close
    unsigned long long linesLost ZYR_GUARDED_BY(lock) = 0;
    int nextGroup ZYR_GUARDED_BY(lock) = 0;
};

namespace {

using nlohmann::json;

// Relaxed: a setting read on its own; nothing else is published with it.
std::atomic<int> optInSetting{0};
// Relaxed: only a source of distinct numbers for file names.
std::atomic<unsigned> sessionsStarted{0};
ZYRStd::detail::Mutex productLock;
std::string productName ZYR_GUARDED_BY(productLock) = "unknown";

// A null text is recorded as JSON null, so that "" and "not given" stay apart.
json text(const char* s) {
    return s ? json(s) : json(nullptr);
}

long long nowMs() {
    using namespace std::chrono;
    return duration_cast<milliseconds>(system_clock::now().time_since_epoch()).count();
}

json bytes(const unsigned char* data, int size) {
    json out = json::array();
    for (int i = 0; data && i < size; ++i)
        out.push_back(data[i]);
    return out;
}

// One line per object, time-stamped under the session's lock so that the lines are in time
// order. Texts that are not UTF-8 get U+FFFD instead of failing the line.
void write(Kelvrin* session, json object) {
    if (!session)
        return;
    const ZYRStd::detail::LockGuard guard(session->lock);
    if (session->fd < 0)
        return;
    object["time"] = nowMs();
    const std::string line = object.dump(-1, ' ', false, json::error_handler_t::replace) + '\n';
    // Written at once, unbuffered: a crash later in the job keeps what was logged so far.
    size_t done = 0;
    while (done < line.size() && session->writeError == 0) {
        const ssize_t n = ::write(session->fd, line.data() + done, line.size() - done);
        if (n > 0)
            done += static_cast<size_t>(n);
        else if (n < 0 && errno != EINTR)
            session->writeError = errno;
    }
    if (done < line.size())
        ++session->linesLost;
}

// A product name becomes part of a file name: one plain component only.
bool plainComponent(const std::string& name) {
    return !name.empty() && name.find_first_of("/\\") == std::string::npos &&
           name.find("..") == std::string::npos;
}

// Creates a new session file exclusively, never through a link: a name that exists (another
// session in the same second, or anything planted there) moves on to the next number.
int createSessionFile(const std::filesystem::path& folder, const std::string& product,
                      std::string& path) {
    char stamp[32];
    const std::time_t now = std::time(nullptr);
    std::tm utc{};
    gmtime_r(&now, &utc);
    std::strftime(stamp, sizeof stamp, "%Y%m%dT%H%M%SZ", &utc);
    for (int attempt = 0; attempt < 1000; ++attempt) {
        const unsigned n = sessionsStarted.fetch_add(1, std::memory_order_relaxed);
        path = (folder / (product + "-" + stamp + "-" + std::to_string(getpid()) + "-" +
                          std::to_string(n) + ".jsonl"))
                   .string();
        const int fd =
            ::open(path.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0644);
        if (fd >= 0 || errno != EEXIST)
            return fd;
    }
    return -1;
}

} // namespace

extern "C" {

void UTInitialize(const char* product, bool, const char*) {
    const ZYRStd::detail::LockGuard guard(productLock);
    productName = product && *product ? product : "unknown";
}

void UTStartSession(Kelvrin*& handle, const char* kind, const char* product, const char* version,
                    const char* shortVersion, const char* reserved, const char* folderUTF8) {
    handle = nullptr;
    try {
        auto session = std::make_unique<Kelvrin>();
        if (optInSetting.load(std::memory_order_relaxed) != 0) {
            std::string name;
            {
                const ZYRStd::detail::LockGuard guard(productLock);
                name = product && *product ? product : productName;
            }
            const std::filesystem::path folder(folderUTF8 && *folderUTF8 ? folderUTF8 : ".");
            std::error_code ec;
            std::filesystem::create_directories(folder, ec);
            if (!plainComponent(name))
                return; // a name that would leave the folder records nothing
            {
                // Not shared yet; the lock only keeps the analysis exact.
                const ZYRStd::detail::LockGuard guard(session->lock);
                session->fd = createSessionFile(folder, name, session->path);
                if (session->fd < 0)
                    return; // a session that cannot record is no session
            }
            write(session.get(), {{"type", "session_start"},
                                  {"kind", text(kind)},
                                  {"product", text(product)},
                                  {"version", text(version)},
                                  {"short_version", text(shortVersion)},
                                  {"reserved", text(reserved)},
                                  {"folder", text(folderUTF8)}});
        }
        handle = session.release();
    } catch (...) {
        handle = nullptr; // nothing may escape into the caller
    }
}

void UTAddToSession(Kelvrin* handle, const char* key, const char* value) {
    try {
        write(handle, {{"type", "session_value"}, {"key", text(key)}, {"value", text(value)}});
    } catch (...) {
    }
}

void UTLogEvent(Kelvrin* handle, const char* category, const char* subcategory, const char* name,
                unsigned char* data, int size) {
    try {
        write(handle, {{"type", "event"},
                       {"category", text(category)},
                       {"subcategory", text(subcategory)},
                       {"name", text(name)},
                       {"data", bytes(data, size)}});
    } catch (...) {
    }
}

void UTNewDataGroup(Kelvrin* handle, const char* name, const char* subname, const char* displayName,
                    int& groupID, unsigned char* data, int size) {
    groupID = -1;
    if (!handle)
        return;
    try {
        {
            const ZYRStd::detail::LockGuard guard(handle->lock);
            groupID = handle->nextGroup++;
        }
        write(handle, {{"type", "group"},
                       {"group", groupID},
                       {"name", text(name)},
                       {"subname", text(subname)},
                       {"display_name", text(displayName)},
                       {"data", bytes(data, size)}});
    } catch (...) {
    }
}

void UTAddToGroup(Kelvrin* handle, int groupID, const char* key, const char* value) {
    try {
        write(handle,
              {{"type", "value"}, {"group", groupID}, {"key", text(key)}, {"value", text(value)}});
    } catch (...) {
    }
}

void UTCloseSession(Kelvrin*& handle) {
    if (!handle)
        return;
    try {
        write(handle, {{"type", "session_close"}});
    } catch (...) {
    }
    {
        // The last user closes; the lock only keeps the analysis exact.
        const ZYRStd::detail::LockGuard guard(handle->lock);
        if (handle->fd >= 0) {
            // A record that did not reach the disk (a full disk) is reported, not ignored.
            if (::close(handle->fd) != 0 && handle->writeError == 0)
                handle->writeError = errno;
            if (handle->writeError != 0)
                std::fprintf(stderr, "libKelvrin: %s: %s: %llu records lost\n",
                             handle->path.c_str(), std::strerror(handle->writeError),
                             handle->linesLost);
        }
    }
    delete handle;
    handle = nullptr;
}

int UTGetOptIn() {
    return optInSetting.load(std::memory_order_relaxed);
}

void UTSetOptIn(int optIn) {
    optInSetting.store(optIn, std::memory_order_relaxed);
}
}
