// Out-of-line destructors, so that each interface has one home for its vtable.
#include "IZYRFileSys.h"

namespace ZYRFileName {
IZYRFileName::~IZYRFileName() = default;
}

namespace ZYRFileSys {
IDirEnumCBProc::~IDirEnumCBProc() = default;
IZYRFileSys::~IZYRFileSys() = default;
IFile::~IFile() = default;
} // namespace ZYRFileSys
