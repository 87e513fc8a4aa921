// The zyrstd sub-commands; each returns the process exit code.
#pragma once

#include <cstdio>
#include <string>
#include <string_view>

namespace zyrtool {

// Every sub-command gets argv[0] = its own name, then its arguments.
int runDemo(int argc, char** argv);
// md5 [FILE...]: one md5sum-style line per file; "-" or no file reads standard input.
int runMd5(int argc, char** argv);
// encode ascii85|asciihex [--prefix P] [--eod E] [--no-z] [IN [OUT]]: standard input and
// output when not named; a failure leaves no output file.
int runEncode(int argc, char** argv);
// decode ascii85|asciihex [IN [OUT]]: the bytes of ASCII85 or ASCIIHex text.
int runDecode(int argc, char** argv);
// config FILE... | config --defaults: the effective start-up options after the setup files.
int runConfig(int argc, char** argv);
// hwinfo [--root DIR]: the hardware reports and the timing lines, in UTF-8.
int runHwinfo(int argc, char** argv);

// Prints the usage of the command `name`: its synopsis and what it does.
void printCommandUsage(std::FILE* out, std::string_view name);
// Prints "zyrstd: COMMAND: WHY" and the command's usage to standard error; returns the exit
// code of a usage error.
int usageError(std::string_view command, const std::string& why);

} // namespace zyrtool
