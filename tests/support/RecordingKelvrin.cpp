#include <atomic>
#include <chrono>
#include <mutex>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "Kelvrin.h"

struct Kelvrin {
    int nextGroup = 100; // far from -1 and 0, so that a wrong ID shows
};

namespace {

std::mutex callsLock; // guards calls
std::vector<std::string> calls;
std::atomic<int> delayMs{0};
std::atomic<bool> refuseSessions{false};
std::atomic<int> optIn{0};
std::atomic<int> started{0};
Kelvrin session;

std::string text(const char* s) {
    return s ? s : "<null>";
}

void record(std::string call) {
    started.fetch_add(1);
    if (const int ms = delayMs.load())
        std::this_thread::sleep_for(std::chrono::milliseconds(ms));
    const std::lock_guard guard(callsLock);
    calls.push_back(std::move(call));
}

} // namespace

extern "C" {

KELVRIN_API void RecordingTakeCalls(std::vector<std::string>& out) {
    const std::lock_guard guard(callsLock);
    out = std::exchange(calls, {});
}
KELVRIN_API void RecordingSetDelay(int ms) {
    delayMs = ms;
}
KELVRIN_API int RecordingCallsStarted() {
    return started;
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
