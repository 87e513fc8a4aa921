// The stack walker's interface and the stub the library ships.
#include "zyr/std/core/IStackWalker.h"

namespace ZYRStd {

IStackWalker::~IStackWalker() = default;

IImpStackWalkerStub::~IImpStackWalkerStub() = default;

IStackWalker* IImpStackWalkerStub::create() {
    return new IImpStackWalkerStub;
}

} // namespace ZYRStd
