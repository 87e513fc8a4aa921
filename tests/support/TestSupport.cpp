// Helpers shared by the test suites.
#include "TestSupport.h"

#include <cstdlib>
#include <filesystem>
#include <stdexcept>

namespace zyrtest {

bool FailingHost::shouldFail() {
    ++calls;
    return failAll || calls == failAt || (failEvery != 0 && calls % failEvery == 0);
}

namespace {
void* failingAlloc(size_t size, void* data) {
    return static_cast<FailingHost*>(data)->shouldFail() ? nullptr : std::malloc(size);
}
void* failingRealloc(void* block, size_t size, void* data) {
    return static_cast<FailingHost*>(data)->shouldFail() ? nullptr : std::realloc(block, size);
}
void failingFree(void* block, void*) {
    std::free(block);
}
} // namespace

ZYRStd::tZYRMemMgr FailingHost::record() {
    return {failingAlloc, failingRealloc, failingFree, this};
}

void installFront(int statLevel, ZYRStd::tZYRMemMgr* host) {
    const char* previous = std::getenv("ZYR_MEMORY_STAT");
    const std::string saved = previous ? previous : "";
    ::setenv("ZYR_MEMORY_STAT", std::to_string(statLevel).c_str(), 1);
    ZYRStd::tZYRMemMgr crt{[](size_t n, void*) { return std::malloc(n); },
                           [](void* p, size_t n, void*) { return std::realloc(p, n); },
                           [](void* p, void*) { std::free(p); }, nullptr};
    ZYRStd::ZYRStdInit_ZYRMemMgrSet(host ? host : &crt);
    if (previous)
        ::setenv("ZYR_MEMORY_STAT", saved.c_str(), 1);
    else
        ::unsetenv("ZYR_MEMORY_STAT");
}

TempDir::TempDir() {
    std::string pattern = (std::filesystem::temp_directory_path() / "zyrstd-XXXXXX").string();
    if (!::mkdtemp(pattern.data()))
        throw std::runtime_error("mkdtemp failed");
    path_ = pattern;
}

TempDir::~TempDir() {
    std::error_code ignored;
    std::filesystem::remove_all(path_, ignored);
}

} // namespace zyrtest
