// Helpers shared by the test suites: a host memory record and temporary directories.
#pragma once

#include <cstddef>
#include <string>

#include "ZYRStd.h"

namespace zyrtest {

// A host allocator over malloc that can be told to fail.
struct FailingHost {
    // Calls (counting from 1) to fail: every n-th, or all once `failAll` is set.
    unsigned int failEvery = 0;
    unsigned int failAt = 0; // one given call
    bool failAll = false;
    unsigned int calls = 0;
    bool shouldFail();
    ZYRStd::tZYRMemMgr record();
};

// Installs a host record (C runtime by default) with the given statistics level and a
// generous limit; restores "ZYR_MEMORY_STAT" afterwards.
void installFront(int statLevel, ZYRStd::tZYRMemMgr* host = nullptr);

// A fresh directory under the system's temporary directory, removed by the destructor.
class TempDir {
public:
    TempDir();
    ~TempDir();
    TempDir(const TempDir&) = delete;
    TempDir& operator=(const TempDir&) = delete;
    const std::string& path() const { return path_; }
    std::string file(const std::string& name) const { return path_ + "/" + name; }

private:
    std::string path_;
};

} // namespace zyrtest
