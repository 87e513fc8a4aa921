/// \file
/// The host's file procedures: a record of 30 words, one C procedure per word.
#pragma once

#include <cstddef>
#include <cstdint>

namespace ZYRPublic {

/// A null word means that the host lacks that procedure. Handles and DI paths are the
/// host's own tokens; every procedure that returns int returns 0 on success. Strings and
/// DI paths the host hands out go back through `free`.
struct _t_ZYRPDLFileSysRec {
    void* reserved0;            ///< unused by the library
    void* reserved1;            ///< unused by the library
    int (*close)(void* handle); ///< closes an open handle
    int (*flush)(void* handle); ///< writes buffered data of a handle out
    void* reserved4;            ///< unused by the library
    void* reserved5;            ///< unused by the library
    void* reserved6;            ///< unused by the library
    void* reserved7;            ///< unused by the library
    /// Called as read(buffer, byteCount, 1, handle, &errorOut); errorOut != 0 is a failure.
    size_t (*read)(void* buffer, size_t size, size_t count, void* handle, int* errorOut);
    /// Called as write(buffer, byteCount, 1, handle, &errorOut); errorOut != 0 is a failure.
    size_t (*write)(const void* buffer, size_t size, size_t count, void* handle, int* errorOut);
    int (*remove)(void* diPath); ///< deletes the file a DI path names
    void* reserved11;            ///< unused by the library
    void* reserved12;            ///< unused by the library
    void* reserved13;            ///< unused by the library
    /// A new temporary file in the directory `dirPath`, as a DI path, or null.
    void* (*tempFile)(const char* dirPath);
    void* reserved15; ///< unused by the library
    void* reserved16; ///< unused by the library
    /// The narrow path of a DI path; the caller hands it back through `free`.
    char* (*diPathToPath)(void* diPath, int reserved);
    /// A new DI path for a narrow path, or null; the caller hands it back through `free`.
    void* (*pathToDIPath)(const char* path, int reserved);
    void (*free)(void* p); ///< frees a string or DI path the host handed out
    void* reserved20;      ///< unused by the library
    void* reserved21;      ///< unused by the library
    void* reserved22;      ///< unused by the library
    /// `mode`: 0x1 read, 0x2 write, 0x4 truncate, 0x8 sequential scan, 0x20 random access.
    int (*open64)(void* diPath, unsigned short mode, void** handle);
    /// Moves the position of a handle to the 64-bit offset (high << 32) | low.
    int (*setpos64)(void* handle, uint32_t low, uint32_t high);
    /// The 64-bit position of a handle.
    int (*getpos64)(void* handle, unsigned long long* position);
    /// Sets the file's end to the 64-bit offset (high << 32) | low.
    int (*seteof)(void* handle, uint32_t low, uint32_t high);
    /// The 64-bit size of the file behind a handle.
    int (*geteof64)(void* handle, unsigned long long* eof);
    /// The UTF-16 path of a DI path; the caller hands it back through `free`.
    char16_t* (*diPathToWPath)(void* diPath, int reserved);
    /// A new DI path for a UTF-16 path, or null; the caller hands it back through `free`.
    void* (*wPathToDIPath)(const char16_t* path, int reserved);
};

static_assert(sizeof(_t_ZYRPDLFileSysRec) == 30 * sizeof(void*), "30 pointer-sized words");
static_assert(offsetof(_t_ZYRPDLFileSysRec, close) == 2 * sizeof(void*));
static_assert(offsetof(_t_ZYRPDLFileSysRec, read) == 8 * sizeof(void*));
static_assert(offsetof(_t_ZYRPDLFileSysRec, tempFile) == 14 * sizeof(void*));
static_assert(offsetof(_t_ZYRPDLFileSysRec, free) == 19 * sizeof(void*));
static_assert(offsetof(_t_ZYRPDLFileSysRec, open64) == 23 * sizeof(void*));
static_assert(offsetof(_t_ZYRPDLFileSysRec, wPathToDIPath) == 29 * sizeof(void*));

} // namespace ZYRPublic
