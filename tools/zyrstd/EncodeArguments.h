// The arguments of zyrstd encode and decode.
#pragma once

#include <optional>
#include <string>

namespace zyrtool {

struct EncodeArguments {
    std::string kind;
    const char* prefix = nullptr;
    const char* eod = nullptr;
    bool allowZ = true;
    std::optional<std::string> in;
    std::optional<std::string> out;
};

// Returns an exit code for a usage error (after printing the usage), or 0.
int parseEncodeArguments(int argc, char** argv, bool encoding, EncodeArguments& args);

} // namespace zyrtool
