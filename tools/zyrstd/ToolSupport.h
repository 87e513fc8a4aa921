// What the zyrstd commands share: exit codes and how a failure reaches standard error.
#pragma once

#include <cstdio>
#include <string>

#include "zyr/std/core/CZYRError.h"

namespace zyrtool {

constexpr int kFailure = 1;
constexpr int kUsageError = 2;

// What a command reports: a message for standard error.
struct Failure {
    std::string message;
};

[[noreturn]] inline void failWith(std::string message) {
    throw Failure{std::move(message)};
}

inline std::string describe(const ZYRStd::CZYRError& e) {
    return e.getMessage() ? e.getMessage() : "error " + std::to_string(e.getError());
}

// Prints "zyrstd: COMMAND: MESSAGE" after whatever standard output holds; returns kFailure.
inline int report(const char* command, const std::string& message) {
    std::fflush(stdout);
    std::fprintf(stderr, "zyrstd: %s: %s\n", command, message.c_str());
    return kFailure;
}

} // namespace zyrtool
