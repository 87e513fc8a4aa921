#include "TestSupport.h"
#include "ZYRHostKit.h"

#include <cerrno>
#include <cstdlib>
#include <fcntl.h>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <spawn.h>
#include <stdexcept>
#include <sys/wait.h>

extern char** environ;

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
    ZYRStd::tZYRMemMgr crt = ZYRHostKit::crtMemMgr();
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

std::string describe(int type, const char* message, const char* file, int line) {
    const auto text = [](const char* s) { return std::string(s ? s : "<null>"); };
    return std::to_string(type) + ": " + text(message) + " (" + text(file) + ":" +
           std::to_string(line) + ")";
}

std::string readFile(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>()};
}

void writeFile(const std::string& path, const std::string& bytes) {
    std::ofstream(path, std::ios::binary) << bytes;
}

Outcome runProgram(const std::string& program, const std::vector<std::string>& args,
                   const TempDir& dir, const std::string& input) {
    const std::string outPath = dir.file(".stdout"), errPath = dir.file(".stderr");
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, 0, input.c_str(), O_RDONLY, 0);
    posix_spawn_file_actions_addopen(&actions, 1, outPath.c_str(), O_WRONLY | O_CREAT | O_TRUNC,
                                     0600);
    posix_spawn_file_actions_addopen(&actions, 2, errPath.c_str(), O_WRONLY | O_CREAT | O_TRUNC,
                                     0600);
    std::vector<std::string> argvText{program};
    argvText.insert(argvText.end(), args.begin(), args.end());
    std::vector<char*> argv;
    for (std::string& arg : argvText)
        argv.push_back(arg.data());
    argv.push_back(nullptr);

    Outcome outcome;
    pid_t pid = 0;
    const int spawned =
        posix_spawnp(&pid, program.c_str(), &actions, nullptr, argv.data(), environ);
    posix_spawn_file_actions_destroy(&actions);
    if (spawned != 0)
        return outcome;
    int status = 0;
    while (::waitpid(pid, &status, 0) < 0 && errno == EINTR) {
    }
    outcome.exitCode = WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
    outcome.out = readFile(outPath);
    outcome.err = readFile(errPath);
    return outcome;
}

} // namespace zyrtest
