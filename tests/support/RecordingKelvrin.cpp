#include <atomic>
#include <condition_variable>
#include <mutex>
#include <string>
#include <utility>
#include <vector>

#include "Kelvrin.h"

struct Kelvrin {
    int nextGroup = 100; // far from -1 and 0, so that a wrong ID shows
};

namespace {

std::mutex callsLock; // guards calls, held and waiting
std::condition_variable released;
std::vector<std::string> calls;
bool held = false; // while set, every call waits before it is recorded
int waiting = 0;
std::atomic<bool> refuseSessions{false};
std::atomic<int> optIn{0};
Kelvrin session;

std::string text(const char* s) {
    return s ? s : "<null>";
}

void record(std::string call) {
    std::unique_lock guard(callsLock);
    ++waiting;
    released.wait(guard, [] { return !held; });
    --waiting;
    calls.push_back(std::move(call));
}

} // namespace

extern "C" {

KELVRIN_API void RecordingTakeCalls(std::vector<std::string>& out) {
    const std::lock_guard guard(callsLock);
    out = std::exchange(calls, {});
}
KELVRIN_API void RecordingHold(bool hold) {
    {
        const std::lock_guard guard(callsLock);
        held = hold;
    }
    released.notify_all();
}
KELVRIN_API int RecordingWaiting() {
    const std::lock_guard guard(callsLock);
    return waiting;
}
KELVRIN_API void RecordingRefuseSessions(bool refuse) {
    refuseSessions = refuse;
}

void UTInitialize(const char* product, bool flag, const char* reserved) {
    record("UTInitialize(" + text(product) + "," + std::to_string(flag) + "," + text(reserved) +
           ")");
}
void UTStartSession(Kelvrin*& handle, const char* kind, const char* product, const char* version,
                    const char* shortVersion, const char* reserved, const char* folderUTF8) {
    handle = refuseSessions ? nullptr : &session;
    session.nextGroup = 100;
    record("UTStartSession(" + text(kind) + "," + text(product) + "," + text(version) + "," +
           text(shortVersion) + "," + text(reserved) + "," + text(folderUTF8) + ")");
}
void UTAddToSession(Kelvrin*, const char* key, const char* value) {
    record("UTAddToSession(" + text(key) + "," + text(value) + ")");
}
void UTLogEvent(Kelvrin*, const char* category, const char* subcategory, const char* name,
                unsigned char*, int size) {
    record("UTLogEvent(" + text(category) + "," + text(subcategory) + "," + text(name) + "," +
           std::to_string(size) + ")");
}
void UTNewDataGroup(Kelvrin* handle, const char* name, const char* subname, const char* displayName,
                    int& groupID, unsigned char*, int) {
    groupID = handle ? handle->nextGroup++ : -1;
    record("UTNewDataGroup(" + text(name) + "," + text(subname) + "," + text(displayName) +
           ")=" + std::to_string(groupID));
}
void UTAddToGroup(Kelvrin*, int groupID, const char* key, const char* value) {
    record("UTAddToGroup(" + std::to_string(groupID) + "," + text(key) + "," + text(value) + ")");
}
void UTCloseSession(Kelvrin*& handle) {
    handle = nullptr;
    record("UTCloseSession()");
}
int UTGetOptIn() {
    return optIn;
}
#ifndef RECORDING_KELVRIN_INCOMPLETE // the incomplete variant lacks this one entry point
void UTSetOptIn(int value) {
    optIn = value;
    record("UTSetOptIn(" + std::to_string(value) + ")");
}
#endif
}
