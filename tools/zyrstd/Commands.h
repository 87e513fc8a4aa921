// The zyrstd sub-commands; each returns the process exit code.
#pragma once

namespace zyrtool {

// Every sub-command gets argv[0] = its own name, then its arguments.
int runDemo(int argc, char** argv);
// md5 [FILE...]: one md5sum-style line per file; "-" or no file reads standard input.
int runMd5(int argc, char** argv);

} // namespace zyrtool
