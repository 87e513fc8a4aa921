// zyrstd demo: a host start-up, allocation under a limit, and the leak report.
#include "Commands.h"

namespace zyrtool {

int runDemo(int, char**) { return 0; }

} // namespace zyrtool
