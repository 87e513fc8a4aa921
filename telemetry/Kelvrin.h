// The telemetry session library's entry points, as the session logger calls them. Any
// library that exports these nine functions under the name libKelvrin.so can take the
// place of ours.
#pragma once

#define KELVRIN_API __attribute__((visibility("default")))

// One telemetry session; opaque to its users.
struct Kelvrin;

extern "C" {

KELVRIN_API void UTInitialize(const char* product, bool unused, const char* reserved);
// `handle` becomes the new session, or null when the session cannot record.
KELVRIN_API void UTStartSession(Kelvrin*& handle, const char* kind, const char* product,
                                const char* version, const char* shortVersion, const char* reserved,
                                const char* folderUTF8);
KELVRIN_API void UTAddToSession(Kelvrin* handle, const char* key, const char* value);
KELVRIN_API void UTLogEvent(Kelvrin* handle, const char* category, const char* subcategory,
                            const char* name, unsigned char* data, int size);
// `groupID` receives the new group's number (from 0), or -1 when nothing is recorded.
KELVRIN_API void UTNewDataGroup(Kelvrin* handle, const char* name, const char* subname,
                                const char* displayName, int& groupID, unsigned char* data,
                                int size);
KELVRIN_API void UTAddToGroup(Kelvrin* handle, int groupID, const char* key, const char* value);
// Ends the session and sets `handle` to null.
KELVRIN_API void UTCloseSession(Kelvrin*& handle);
KELVRIN_API int UTGetOptIn();
KELVRIN_API void UTSetOptIn(int optIn);
}

// The same entry points as pointer types, for a loader that looks them up by name.
using UTInitializeProc = decltype(&UTInitialize);
using UTStartSessionProc = decltype(&UTStartSession);
using UTAddToSessionProc = decltype(&UTAddToSession);
using UTLogEventProc = decltype(&UTLogEvent);
using UTNewDataGroupProc = decltype(&UTNewDataGroup);
using UTAddToGroupProc = decltype(&UTAddToGroup);
using UTCloseSessionProc = decltype(&UTCloseSession);
using UTGetOptInProc = decltype(&UTGetOptIn);
using UTSetOptInProc = decltype(&UTSetOptIn);
