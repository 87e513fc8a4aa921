// The arguments of zyrstd encode and decode.
#include "EncodeArguments.h"

#include <cstring>
#include <string_view>
#include <vector>

#include "Commands.h"

namespace zyrtool {

int parseEncodeArguments(int argc, char** argv, bool encoding, EncodeArguments& args) {
    const auto usage = [&](const std::string& why) {
        return usageError(encoding ? "encode" : "decode", why);
    };
    std::vector<std::string> positional;
    bool optionsDone = false;
    for (int i = 1; i < argc; ++i) {
        const std::string_view arg = argv[i];
        if (!optionsDone && arg == "--") {
            optionsDone = true;
        } else if (!optionsDone && encoding && (arg == "--prefix" || arg == "--eod")) {
            if (i + 1 >= argc)
                return usage(std::string(arg) + " needs a value");
            (arg == "--prefix" ? args.prefix : args.eod) = argv[++i];
        } else if (!optionsDone && encoding && arg == "--no-z") {
            args.allowZ = false;
        } else if (!optionsDone && arg.size() > 1 && arg[0] == '-') {
            return usage("unknown option '" + std::string(arg) + "'");
        } else {
            positional.emplace_back(arg);
        }
    }
    if (positional.empty())
        return usage("no encoding given");
    args.kind = positional[0];
    if (args.kind != "ascii85" && args.kind != "asciihex")
        return usage("unknown encoding '" + args.kind + "'");
    if (positional.size() > 3)
        return usage("too many arguments");
    if (positional.size() > 1)
        args.in = positional[1];
    if (positional.size() > 2)
        args.out = positional[2];
    if (args.prefix && std::strlen(args.prefix) > 2)
        return usage("--prefix takes at most 2 characters");
    if (args.eod && std::strlen(args.eod) > 14)
        return usage("--eod takes at most 14 characters");
    if (!args.allowZ && args.kind != "ascii85")
        return usage("--no-z applies to ascii85 only");
    return 0;
}

} // namespace zyrtool
