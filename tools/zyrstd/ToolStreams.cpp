// The zyrstd tool's streams.
#include "ToolStreams.h"

#include <cerrno>
#include <cstring>

#include "ToolSupport.h"
#include "zyr/std/io/CZYRBaseStream.h"
#include "zyr/std/io/CZYRFileSys.h"

namespace zyrtool {

using namespace ZYRStreams;

bool isStandard(const std::optional<std::string>& name) {
    return !name || *name == "-";
}

std::string displayName(const std::optional<std::string>& name, const char* standard) {
    return isStandard(name) ? standard : *name;
}

CZYRSmartZYRRefPtr<IZYRStream> openInput(const std::optional<std::string>& name) {
    if (isStandard(name))
        return CZYRSmartZYRRefPtr<IZYRStream>(new DescriptorStream(STDIN_FILENO, kZYRStreamRead));
    const ZYRStd::CZYRFileName fileName(name->c_str());
    ZYRStd::CZYRFStream stream(fileName, kZYRStreamRead | kZYRStreamSequentialScan);
    if (!stream.isOpen()) {
        const int error = errno ? errno : EIO;
        failWith(*name + ": " +
                 std::strerror(ZYRStd::CZYRFileSys::fileExists(fileName) ? error : ENOENT));
    }
    return stream;
}

} // namespace zyrtool
