// The zyrstd sub-commands; each returns the process exit code.
#pragma once

namespace zyrtool {

int runDemo(int argc, char** argv);

} // namespace zyrtool
