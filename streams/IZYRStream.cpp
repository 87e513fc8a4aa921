// Out-of-line destructors, so that each interface has one home for its vtable.
#include "IZYRStream.h"

namespace ZYRStreams {

IZYRStream::~IZYRStream() = default;
IZYRFStream::~IZYRFStream() = default;
IZYRMemMapFStream::~IZYRMemMapFStream() = default;

} // namespace ZYRStreams

namespace ZYRFileSys {

CStreamAccess::~CStreamAccess() = default;

} // namespace ZYRFileSys
