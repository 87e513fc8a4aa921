// Resource directories, the font cache list names and the font directory list.
#include "zyr/std/config/ZYRResourceDirs.h"

#include <atomic>
#include <cstring>
#include <limits>
#include <memory>

#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/io/internal/ZYRFileSys_helper.h"
#include "zyr/std/values/CZYRCommonUniStrings.h"
#include "zyr/std/values/CZYRDict.h"
#include "zyr/std/values/CZYRString.h"
#include "zyr/std/values/CZYRUniString.h"

namespace ZYRStd {

namespace {

// The directory functions belong to the start-up options; their errors keep that name.
constexpr const char* kSource = "source/zyr/std/ZYRStartupOptions";
// Source line of the out-of-memory error, as its clients have always seen it.
constexpr int kOutOfMemoryLine = 970;

constexpr char16_t kSystemCacheFile[] = u"/OrmunFnt14_sys.lst";
constexpr char16_t kCommonCacheFile[] = u"/OrmunFnt14_com.lst";
constexpr char16_t kCmapCacheFile[] = u"/OrmunFnt14_Cmap.lst";
constexpr char16_t kNumberedCacheFilePrefix[] = u"/OrmunFnt14_VELT_";
constexpr char16_t kCacheFileSuffix[] = u".lst";
constexpr unsigned int kFirstCacheListNumber = 1001;

// In search order. The fonts directory, when set, takes the place of "ZYRFonts/".
constexpr const char* kResourceDirs[] = {"ZYRFonts/TUMA/10.0/CMaps", "ZYRFonts/Fonts/Reqrd/CMaps",
                                         "ZYRFonts/Fonts"};
constexpr size_t kResourcePrefixLength = 9;

// Process-wide, set at start-up.
struct ResourceDirs {
    std::u16string fontsDir;
    std::u16string fontCacheDir;
    bool fontCacheDirSet = false;
    const char16_t* iccProfileDir = nullptr;
    std::string tempDir;
};

ResourceDirs& dirs() {
    static ResourceDirs instance;
    return instance;
}

// Several font modules may ask at once; each call must still name a file of its own.
constinit std::atomic<unsigned int> nextCacheListNumber{kFirstCacheListNumber};

struct ZYRFreeDeleter {
    void operator()(void* p) const { ZYRFree(p); }
};
using OwnedPath = std::unique_ptr<unsigned short, ZYRFreeDeleter>;

[[noreturn]] void throwOutOfMemory() {
    throw CZYRError(ZYRPublic::kZYRErrorOutOfMemory, "ZYRSetDirListAndCacheFileList out of memory",
                    kSource, kOutOfMemoryLine);
}

OwnedPath copyPath(const std::u16string& text) {
    const unsigned long long bytes = (text.size() + 1ull) * sizeof(unsigned short);
    void* block = bytes > std::numeric_limits<unsigned int>::max()
                      ? nullptr
                      : ZYRMalloc(static_cast<unsigned int>(bytes));
    if (!block)
        throwOutOfMemory();
    OwnedPath path(static_cast<unsigned short*>(block));
    std::memcpy(path.get(), text.c_str(), static_cast<size_t>(bytes));
    return path;
}

std::u16string numberText(unsigned int number) {
    const std::string digits = std::to_string(number);
    return std::u16string(digits.begin(), digits.end());
}

OwnedPath numberedCacheFile() {
    // Relaxed: the increment alone makes each number unique; nothing else is published by it.
    const unsigned int number = nextCacheListNumber.fetch_add(1, std::memory_order_relaxed);
    return copyPath(dirs().fontCacheDir + kNumberedCacheFilePrefix + numberText(number) +
                    kCacheFileSuffix);
}

// A conversion that recorded an error throws it: a directory must not vanish silently.
OwnedPath checked(unsigned short* converted, const C_Error& err) {
    OwnedPath path(converted);
    throwCZYRErrorIfErrorOccurred(err);
    return path;
}

// An array of pointers from ZYRMalloc and the entries stored in it, all freed unless
// handed out.
class PathArray {
public:
    explicit PathArray(unsigned long long slots) {
        const unsigned long long bytes = slots * sizeof(unsigned short*);
        if (slots > 0 && bytes <= std::numeric_limits<unsigned int>::max())
            slots_ = static_cast<unsigned short**>(ZYRMalloc(static_cast<unsigned int>(bytes)));
    }
    ~PathArray() {
        if (!slots_)
            return;
        for (unsigned int i = 0; i < stored_; ++i)
            ZYRFree(slots_[i]);
        ZYRFree(slots_);
    }
    PathArray(const PathArray&) = delete;
    PathArray& operator=(const PathArray&) = delete;

    bool allocated() const { return slots_ != nullptr; }
    void add(OwnedPath path) { slots_[stored_++] = path.release(); }
    unsigned int stored() const { return stored_; }
    unsigned short** release() {
        unsigned short** slots = slots_;
        slots_ = nullptr;
        return slots;
    }

private:
    unsigned short** slots_ = nullptr;
    unsigned int stored_ = 0;
};

std::u16string unitsOf(const unsigned short* path) {
    std::u16string text;
    for (; *path; ++path)
        text += static_cast<char16_t>(*path);
    return text;
}

struct DirList {
    std::unique_ptr<PathArray> dirs;
    OwnedPath cacheFile;
};

// Both forms of ZYRSetDirListAndCacheFileList: everything built, nothing handed out yet.
DirList buildDirList(I_Dict* options) {
    CZYRArray references(nullptr, false);
    if (options) {
        const CZYRDict dict(options, true);
        const CZYRUniString key(GetCommonUniStrings()->str_ReferenceFontDir());
        if (dict.getType(key) == ZYRPublic::kZYRValTypeArray)
            dict.get(key, references);
    }
    const unsigned int referenceCount = references.isValid() ? references.getLength() : 0;

    DirList list;
    list.dirs = std::make_unique<PathArray>(referenceCount + 3ull);
    if (ZYRFontCacheDirExist())
        list.cacheFile = numberedCacheFile();
    if (!list.dirs->allocated())
        return list;

    const std::u16string& fontsDir = dirs().fontsDir;
    for (const char* dir : kResourceDirs) {
        C_Error err;
        OwnedPath path = checked(ASCII2UTF16Path(dir, err), err);
        if (!path)
            continue;
        if (!fontsDir.empty())
            path = copyPath(fontsDir + unitsOf(path.get() + kResourcePrefixLength));
        list.dirs->add(std::move(path));
    }
    for (unsigned int i = 0; i < referenceCount; ++i) {
        if (references.getType(i) != ZYRPublic::kZYRValTypeString) {
            list.dirs->add(nullptr);
            continue;
        }
        CZYRUniString reference;
        references.get(i, reference);
        C_Error err;
        if (OwnedPath path = checked(UniURL2UTF16Path(reference, err), err))
            list.dirs->add(std::move(path));
    }
    return list;
}

} // namespace

void ZYRSetZYRFontsDir(const char16_t* dir) {
    dirs().fontsDir = dir ? dir : u"";
}

void ZYRSetFontCacheDir(const char16_t* dir) {
    dirs().fontCacheDir = dir ? dir : u"";
    dirs().fontCacheDirSet = !dirs().fontCacheDir.empty();
}

void ZYRSetIccProfileDir(const char16_t* dir) {
    dirs().iccProfileDir = dir;
}

void ZYRSetTempDirectory(const CZYRUniString& dir) {
    dirs().tempDir = ZYRFileSys::nativePathOf(dir).c_str(); // path bytes, any name kept
}

bool ZYRFontCacheDirExist() {
    return dirs().fontCacheDirSet;
}

CZYRUniString ZYRGetFontCacheDir() {
    return CZYRUniString(dirs().fontCacheDir.c_str());
}

CZYRUniString ZYRGetIccProfileDir() {
    return CZYRUniString(dirs().iccProfileDir);
}

std::string ZYRGetTempDirectory() {
    return dirs().tempDir;
}

CZYRUniString ZYRGetSystemCacheFile() {
    return CZYRUniString((dirs().fontCacheDir + kSystemCacheFile).c_str());
}

CZYRUniString ZYRGetCommonCacheFile() {
    return CZYRUniString((dirs().fontCacheDir + kCommonCacheFile).c_str());
}

CZYRUniString ZYRGetCmapCacheFile() {
    return CZYRUniString((dirs().fontCacheDir + kCmapCacheFile).c_str());
}

void ZYRSetDirListAndCacheFileList(const CZYRDict& options, unsigned short**& dirList,
                                   unsigned short*& cacheFile, unsigned int& count) {
    DirList list = buildDirList(options.getImpl());
    count += list.dirs->stored();
    dirList = list.dirs->release();
    if (list.cacheFile)
        cacheFile = list.cacheFile.release();
}

int32_t ZYRSetDirListAndCacheFileList(ZYRPublic::C_SmartPtr<ZYRPublic::I_Dict> options,
                                      unsigned short**& dirList, unsigned short**& cacheFiles) {
    try {
        DirList list = buildDirList(options.get());
        PathArray names(list.cacheFile ? 5 : 0);
        if (list.cacheFile) {
            if (!names.allocated())
                throwOutOfMemory();
            names.add(std::move(list.cacheFile));
            const std::u16string& cacheDir = dirs().fontCacheDir;
            for (const char16_t* name : {kSystemCacheFile, kCommonCacheFile, kCmapCacheFile})
                names.add(copyPath(cacheDir + name));
            names.add(nullptr);
        }
        const int32_t stored = static_cast<int32_t>(list.dirs->stored());
        dirList = list.dirs->release();
        if (names.allocated())
            cacheFiles = names.release();
        return stored;
    } catch (...) {
        return -1;
    }
}

} // namespace ZYRStd
