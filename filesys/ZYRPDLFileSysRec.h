// The host's file procedures: a record of 30 words, one C procedure per word.
#pragma once

#include <cstddef>
#include <cstdint>

namespace ZYRPublic {

// A null word means that the host lacks that procedure. Handles and DI paths are the
// host's own tokens; every procedure that returns int returns 0 on success. Strings and
// DI paths the host hands out go back through `free`.
struct _t_ZYRPDLFileSysRec {
    void* reserved0;
    void* reserved1;
    int (*close)(void* handle);
    int (*flush)(void* handle);
    void* reserved4;
    void* reserved5;
    void* reserved6;
    void* reserved7;
    // Called as read(buffer, byteCount, 1, handle, &errorOut); errorOut != 0 is a failure.
    size_t (*read)(void* buffer, size_t size, size_t count, void* handle, int* errorOut);
    size_t (*write)(const void* buffer, size_t size, size_t count, void* handle, int* errorOut);
    int (*remove)(void* diPath);
    void* reserved11;
    void* reserved12;
    void* reserved13;
    // A new temporary file in the directory `dirPath`, as a DI path, or null.
    void* (*tempFile)(const char* dirPath);
    void* reserved15;
    void* reserved16;
    char* (*diPathToPath)(void* diPath, int reserved);
    void* (*pathToDIPath)(const char* path, int reserved);
    void (*free)(void* p);
    void* reserved20;
    void* reserved21;
    void* reserved22;
    // `mode`: 0x1 read, 0x2 write, 0x4 truncate, 0x8 sequential scan, 0x20 random access.
    int (*open64)(void* diPath, unsigned short mode, void** handle);
    int (*setpos64)(void* handle, uint32_t low, uint32_t high);
    int (*getpos64)(void* handle, unsigned long long* position);
    int (*seteof)(void* handle, uint32_t low, uint32_t high);
    int (*geteof64)(void* handle, unsigned long long* eof);
    char16_t* (*diPathToWPath)(void* diPath, int reserved);
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
