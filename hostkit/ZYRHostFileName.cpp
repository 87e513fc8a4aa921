// POSIX file names and their factory.
#include "ZYRHostKit.h"

#include "zyr/std/io/internal/ZYRFileSys_helper.h"
#include "zyr/std/values/CZYRUniString.h"

namespace ZYRHostKit {

using ZYRStd::CZYRString;
using ZYRStd::CZYRWString;

namespace {

constexpr unsigned int kNone = ~0u;

unsigned int lastSeparator(const CZYRWString& path) {
    for (unsigned int i = path.length(); i > 0; --i)
        if (path[i - 1] == u'/')
            return i - 1;
    return kNone;
}

class PosixFileNameFactory final : public ZYRFactory::IZYRFactory {
public:
    ZYRStd::CZYRSmartZYRRefPtr<ZYRFileName::IZYRFileName>
    createFileName(const ZYRStd::CZYRUniString& path) override {
        return ZYRStd::CZYRSmartZYRRefPtr<ZYRFileName::IZYRFileName>(
            new CPosixFileName(ZYRFileSys::pathUnitsOf(path)));
    }
};

} // namespace

CPosixFileName::CPosixFileName(const CZYRWString& path)
    : path_(path), utf8_(ZYRFileSys::utf16ToUTF8(path)) {}

CPosixFileName::~CPosixFileName() = default;

CZYRWString CPosixFileName::getFileDirPath() const {
    const unsigned int at = lastSeparator(path_);
    if (at == kNone)
        return CZYRWString();
    return at == 0 ? CZYRWString(u"/") : CZYRWString(path_, 0, at);
}

CZYRString CPosixFileName::getFileDirPathInZYRString() const {
    return ZYRFileSys::utf16ToUTF8(getFileDirPath());
}

CZYRWString CPosixFileName::getFileName() const {
    const unsigned int at = lastSeparator(path_);
    return at == kNone ? path_ : CZYRWString(path_, at + 1);
}

bool CPosixFileName::pathSpecTypeSupported(ZYRStd::eZYRPathSpecType type) const {
    return type == kPathSpecUTF8 || type == kPathSpecUTF16;
}

const void* CPosixFileName::getPathSpec(ZYRStd::eZYRPathSpecType type, unsigned int* length) const {
    if (type == kPathSpecUTF8) {
        if (length)
            *length = utf8_.length();
        return utf8_.c_str();
    }
    if (type == kPathSpecUTF16) {
        if (length)
            *length = path_.length() * 2;
        return path_.c_str();
    }
    if (length)
        *length = 0;
    return nullptr;
}

ZYRFactory::IZYRFactory* posixFileNameFactory() {
    static PosixFileNameFactory factory;
    return &factory;
}

CZYRWString utf8ToUTF16(const char* text) {
    CZYRWString out;
    ZYRStd::detail::appendPathUnits(out, text, std::char_traits<char>::length(text));
    return out;
}

} // namespace ZYRHostKit
