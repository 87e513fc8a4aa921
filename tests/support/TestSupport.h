#pragma once

#include <cstddef>
#include <string>
#include <vector>

#include "ZYRStd.h"

namespace zyrtest {

struct FailingHost {
    unsigned int failEvery = 0;
    unsigned int failAt = 0; // one given call
    bool failAll = false;
    unsigned int calls = 0;
    bool shouldFail();
    ZYRStd::tZYRMemMgr record();
};

void installFront(int statLevel, ZYRStd::tZYRMemMgr* host = nullptr);

std::string describe(int type, const char* message, const char* file, int line);
template <class Error> std::string describe(const Error& e) {
    return describe(e.getError(), e.getMessage(), e.getSrcFileName(), e.getSrcLineNumber());
}
template <class Call> std::string thrown(Call&& call) {
    try {
        call();
    } catch (const ZYRStd::CZYRError& e) {
        return describe(e);
    }
    return "no error";
}
inline bool startsWith(const std::string& s, const std::string& prefix) {
    return s.compare(0, prefix.size(), prefix) == 0;
}

std::string readFile(const std::string& path);
void writeFile(const std::string& path, const std::string& bytes);

class TempDir;
struct Outcome {
    int exitCode = -1; // -1: the program did not start
    std::string out;
    std::string err;
};

Outcome runProgram(const std::string& program, const std::vector<std::string>& args,
                   const TempDir& dir, const std::string& input = "/dev/null");

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
