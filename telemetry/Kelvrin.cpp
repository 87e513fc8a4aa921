// Our telemetry session library: each recording session writes one JSON Lines file (one
// object a line) into its session folder. The format is described in the README.
#include "Kelvrin.h"

#include <unistd.h>

#include <atomic>
#include <chrono>
#include <cstdio>
#include <ctime>
#include <filesystem>
#include <fstream>
#include <memory>
#include <mutex>
#include <string>

#include <nlohmann/json.hpp>

struct Kelvrin {
    std::mutex lock; // guards the file and the group numbers: any thread may log
    std::ofstream out;
    int nextGroup = 0;
};

namespace {

using nlohmann::json;

std::atomic<int> optInSetting{0};
std::atomic<unsigned> sessionsStarted{0};
std::mutex productLock; // guards productName
std::string productName = "unknown";

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

// One line per object. Texts that are not UTF-8 get U+FFFD instead of failing the line.
void write(Kelvrin* session, json object) {
    if (!session || !session->out.is_open())
        return;
    object["time"] = nowMs();
    const std::string line = object.dump(-1, ' ', false, json::error_handler_t::replace);
    const std::lock_guard guard(session->lock);
    session->out << line << '\n';
    session->out.flush(); // a crash later in the job keeps what was logged so far
}

std::string sessionFileName(const std::string& product) {
    char stamp[32];
    const std::time_t now = std::time(nullptr);
    std::tm utc{};
    gmtime_r(&now, &utc);
    std::strftime(stamp, sizeof stamp, "%Y%m%dT%H%M%SZ", &utc);
    return product + "-" + stamp + "-" + std::to_string(getpid()) + "-" +
           std::to_string(sessionsStarted.fetch_add(1, std::memory_order_relaxed)) + ".jsonl";
}

} // namespace

extern "C" {

void UTInitialize(const char* product, bool, const char*) {
    const std::lock_guard guard(productLock);
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
                const std::lock_guard guard(productLock);
                name = product && *product ? product : productName;
            }
            const std::filesystem::path folder(folderUTF8 && *folderUTF8 ? folderUTF8 : ".");
            std::error_code ec;
            std::filesystem::create_directories(folder, ec);
            session->out.open(folder / sessionFileName(name), std::ios::out | std::ios::trunc);
            if (!session->out.is_open())
                return; // a session that cannot record is no session
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
            const std::lock_guard guard(handle->lock);
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
