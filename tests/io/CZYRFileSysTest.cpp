// Tests of the file system: the static calls, file names, and the native and host-procedure
// file streams on real files in a fresh temporary directory.
#include <gtest/gtest.h>

#include <algorithm>
#include <cerrno>
#include <new>
#include <set>
#include <string>
#include <sys/stat.h>
#include <unistd.h>
#include <vector>

#include "TestSupport.h"
#include "ZYRHostKit.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/io/CZYRBaseStream.h"
#include "zyr/std/io/CZYRFileSys.h"
#include "zyr/std/io/posix/ZYRPosixIO.h"

namespace {

using namespace ZYRStreams;
using ZYRStd::CZYRError;
using ZYRStd::CZYRFileName;
using ZYRStd::CZYRFileSys;
using ZYRStd::CZYRSmartZYRRefPtr;
using zyrtest::readFile;
using zyrtest::writeFile;

constexpr const char* kWindowsSource = "source/zyr/std/ZYRFileSys_Windows";
constexpr const char* kHostSource = "source/zyr/std/ZYRFileSys_OEM";

bool exists(const std::string& path) {
    struct stat st;
    return ::stat(path.c_str(), &st) == 0;
}

std::string utf8(const ZYRStd::CZYRUniString& s) {
    return ZYRStd::UniStringToUTF8String(s).c_str();
}

std::string withoutLine(const std::string& error) {
    return error.substr(0, error.rfind(':'));
}
template <class Body>
void expectError(Body body, int type, const char* message, const char* source = kWindowsSource) {
    EXPECT_EQ(withoutLine(zyrtest::thrown(body)),
              withoutLine(zyrtest::describe(type, message, source, 0)));
}
// The common failure of the native file operations.
template <class Body> void expectOpFailed(Body body, const char* message) {
    expectError(body, ZYRPublic::kZYRErrorFileOpFailed, message);
}

// A file name whose full path is missing, as a host's may be.
class PathlessName : public ZYRFileName::IZYRFileName {
public:
    bool isEmpty() const override { return true; }
    ZYRStd::CZYRWString getFileDirPath() const override { return {}; }
    ZYRStd::CZYRString getFileDirPathInZYRString() const override { return {}; }
    ZYRStd::CZYRWString getFileName() const override { return {}; }
    ZYRStd::eZYRPathSpecType GetPathSpecDefaultType() const override { return {}; }
    bool pathSpecTypeSupported(ZYRStd::eZYRPathSpecType) const override { return false; }
    const void* getPathSpec(ZYRStd::eZYRPathSpecType, unsigned int*) const override {
        return nullptr;
    }
    const ZYRStd::CZYRWString* getFullPath() const override { return nullptr; }
    IZYRFileName* clone() const override { return new PathlessName; }
};

// Installs the host kit's factory and a file system over a fresh directory; `host` routes
// file streams through the host-procedure record.
class FileSysFixture {
public:
    explicit FileSysFixture(bool host) : host_(host), record_(ZYRHostKit::posixFileProcs()) {
        ZYRStd::ZYRStdInit_SetZYRFactoryProc(nullptr);
        ZYRStd::ZYRStdInit_SetZYRFactoryProc(ZYRHostKit::posixFileNameFactory);
        fileSys_ = ZYRFileSys::createDefaultFileSystem(
            ZYRStd::CZYRUniString(), ZYRStd::CZYRUniString(), host ? &record_ : nullptr);
        installed_ = fileSys_;
        ZYRStd::ZYRStdInit_SetDefaultFileSysProc([] { return installed_; });
    }
    ~FileSysFixture() {
        ZYRStd::ZYRStdInit_SetDefaultFileSysProc(nullptr);
        ZYRStd::ZYRStdInit_SetZYRFactoryProc(nullptr);
        installed_ = nullptr;
        delete fileSys_;
    }

    CZYRSmartZYRRefPtr<IZYRFStream> open(const std::string& path, unsigned int mode) {
        return CZYRFileSys::createFileStream(CZYRFileName(path.c_str()), mode, host_);
    }

    static inline ZYRFileSys::IZYRFileSys* installed_ = nullptr;
    bool host_;
    ZYRPublic::_t_ZYRPDLFileSysRec record_;
    ZYRFileSys::IZYRFileSys* fileSys_ = nullptr;
    zyrtest::TempDir dir_;
};

TEST(CZYRFileSysTest, NothingInstalled) {
    const char* notInstalled =
        "A FileSys  not installed. Install one with ZYRFileSys_SetDefaultFileSys method";
    ZYRStd::ZYRStdInit_SetDefaultFileSysProc(nullptr);
    ZYRStd::ZYRStdInit_SetZYRFactoryProc(nullptr);
    expectError([] { CZYRFileSys::fileExists(CZYRFileName()); },
                ZYRPublic::kZYRErrorFileSystemNotInitialized, notInstalled,
                "source/zyr/std/CZYRFileSys");
    ZYRStd::ZYRStdInit_SetDefaultFileSysProc([]() -> ZYRFileSys::IZYRFileSys* { return nullptr; });
    expectError([] { CZYRFileSys::getTempDirName(); }, ZYRPublic::kZYRErrorFileSystemNotInitialized,
                notInstalled, "source/zyr/std/CZYRFileSys");
    ZYRStd::ZYRStdInit_SetDefaultFileSysProc(nullptr);
    expectError([] { CZYRFileName name("/tmp/x"); }, ZYRPublic::kZYRErrorFatal,
                "ZYRFactory Proc not set in ZYRStd", "source/zyr/std/ZYRStdInit");
}

TEST(CZYRFileSysTest, FileNameCountsAndForwards) {
    auto* raw = new ZYRHostKit::CPosixFileName(ZYRStd::CZYRWString(u"/a/b/c.txt"));
    raw->addRef(); // ours, kept across the wrappers below
    { CZYRFileName adopting(raw, false); }
    EXPECT_EQ(raw->peekRefCnt(), 1) << "adopting takes over a reference";
    {
        CZYRFileName sharing(raw, true);
        CZYRFileName copy(sharing);
        EXPECT_EQ(raw->peekRefCnt(), 3);
        EXPECT_TRUE(copy.getWStringPath() == ZYRStd::CZYRWString(u"/a/b/c.txt"));
        EXPECT_FALSE(copy.isEmpty());
        CZYRFileName clone = copy.clone();
        EXPECT_NE(static_cast<ZYRFileName::IZYRFileName*>(clone), raw);
        EXPECT_EQ(static_cast<ZYRFileName::IZYRFileName*>(clone)->peekRefCnt(), 1)
            << "the clone's reference is adopted, not doubled";
    }
    EXPECT_EQ(raw->peekRefCnt(), 1);
    raw->release();

    CZYRFileName pathless(new PathlessName, false);
    EXPECT_TRUE(pathless.getWStringPath().empty());
    CZYRFileName none;
    EXPECT_TRUE(none.isEmpty());
    expectError([&] { none.getWStringPath(); }, ZYRPublic::kZYRErrorInvalidObject, "Null object",
                "source/zyr/std/CZYRFileSys");
}

TEST(CZYRFileSysTest, DirectoriesMadeAtConstruction) {
    zyrtest::TempDir dir;
    // 245 characters in all is the longest accepted name.
    std::string longest = dir.path() + "/";
    longest += std::string(245 - longest.size(), 'd');
    const std::string cache = dir.file("cache");
    ZYRFileSys::IZYRFileSys* fs = ZYRFileSys::createDefaultFileSystem(
        ZYRStd::CZYRUniString(longest.c_str()), ZYRStd::CZYRUniString(cache.c_str()), nullptr);
    ASSERT_NE(fs, nullptr);
    EXPECT_TRUE(exists(longest));
    EXPECT_TRUE(exists(cache));
    EXPECT_EQ(utf8(fs->getTempDirName()), longest);
    EXPECT_EQ(utf8(fs->getDLCacheDirName()), cache);
    delete fs;

    // An empty text stands for a name not given.
    auto create = [](const std::string& temp, const std::string& dl) {
        auto uni = [](const std::string& t) {
            return t.empty() ? ZYRStd::CZYRUniString() : ZYRStd::CZYRUniString(t.c_str());
        };
        delete ZYRFileSys::createDefaultFileSystem(uni(temp), uni(dl), nullptr);
    };
    create(longest, cache); // existing directories are fine
    const std::string tooLong = longest + "x";
    expectError([&] { create(tooLong, ""); }, ZYRPublic::kZYRErrorLimitCheck,
                "temp dir filename too long");
    expectError([&] { create("", tooLong); }, ZYRPublic::kZYRErrorLimitCheck,
                "DL Cache dir filename too long");
    expectOpFailed([&] { create(dir.file("missing/child"), ""); }, "Directory create failed");
}

class FileStreamTest : public ::testing::TestWithParam<bool> {
protected:
    FileSysFixture fx_{GetParam()};
    const char* source() const { return GetParam() ? kHostSource : kWindowsSource; }
};

TEST_P(FileStreamTest, OpenModesAndTransfers) {
    const std::string path = fx_.dir_.file("data.bin");
    writeFile(path, "0123456789");

    {
        auto s = fx_.open(path, kZYRStreamRead | kZYRStreamWrite);
        ASSERT_TRUE(s && s->isOpen());
        EXPECT_EQ(s->getSize(), 10u) << "read-write keeps the content";
        EXPECT_EQ(utf8(s->getFilePath()), path);
        char buf[4] = {};
        EXPECT_EQ(s->read(buf, 2, 2), 4u);
        EXPECT_EQ(std::string(buf, 4), "0123");
        EXPECT_EQ(s->getPos(), 4u);
        EXPECT_EQ(s->write("AB", 1, 2), 2u);
        EXPECT_EQ(s->setPos(8), 8u);
        EXPECT_EQ(s->read(buf, 1, 4), 2u) << "a short read is the end of the file";
        s->setEOF();
        EXPECT_EQ(s->getPos(), 10u);
        s->setPos(3);
        EXPECT_TRUE(s->truncate());
        EXPECT_EQ(s->getSize(), 3u);
        s->close();
        EXPECT_FALSE(s->isOpen());
    }
    EXPECT_EQ(readFile(path), "012");

    {
        auto s = fx_.open(path, kZYRStreamAppend);
        ASSERT_TRUE(s->isOpen());
        EXPECT_EQ(s->write("xy", 1, 2), 2u);
        char c;
        EXPECT_THROW(s->read(&c, 1, 1), CZYRError);
    }
    EXPECT_EQ(readFile(path), "012xy") << "append writes at the end";

    {
        auto s = fx_.open(path, kZYRStreamWrite | kZYRStreamTruncate);
        ASSERT_TRUE(s->isOpen());
        EXPECT_EQ(s->getSize(), 0u);
        s->write("new", 1, 3);
        s->reOpen(kZYRStreamRead);
        char buf[8] = {};
        EXPECT_EQ(s->read(buf, 1, 8), 3u);
        EXPECT_EQ(std::string(buf, 3), "new");
        EXPECT_EQ(s->getAccessMode(), kZYRStreamRead);
    }

    if (!GetParam()) {
        // What write-only means to a host file is the host's choice; natively it empties.
        fx_.open(path, kZYRStreamWrite)->write("n", 1, 1);
        EXPECT_EQ(readFile(path), "n");
    }

    const std::string created = fx_.dir_.file("created.bin");
    fx_.open(created, kZYRStreamWrite | kZYRStreamTruncate)->write("abc", 1, 3);
    EXPECT_EQ(readFile(created), "abc");

    const std::string temporary = fx_.dir_.file("gone.tmp");
    {
        auto s = fx_.open(temporary, kZYRStreamRead | kZYRStreamWrite | kZYRStreamDeleteOnClose);
        ASSERT_TRUE(s->isOpen());
        s->write("x", 1, 1);
        EXPECT_TRUE(exists(temporary));
    }
    EXPECT_FALSE(exists(temporary)) << "deleted when its last handle closed";

    fx_.open(created, kZYRStreamRead)->removeFile();
    EXPECT_FALSE(exists(created));
}

TEST_P(FileStreamTest, FilesThatDoNotOpen) {
    auto missing = fx_.open(fx_.dir_.file("missing.txt"), kZYRStreamRead);
    ASSERT_TRUE(missing);
    EXPECT_FALSE(missing->isOpen()) << "the stream exists, the file did not open";
    char c;
    expectError([&] { missing->read(&c, 1, 1); }, ZYRPublic::kZYRErrorFileOpFailed,
                GetParam() ? "Error reading file" : "error reading from file", source());
    ZYRPublic::eZYRErrorType err = ZYRPublic::kZYRErrorNoError;
    EXPECT_EQ(missing->read(&c, 1, 1, err), 0u);
    EXPECT_EQ(err, ZYRPublic::kZYRErrorFileOpFailed);
    expectError([&] { missing->write("x", 1, 1); }, ZYRPublic::kZYRErrorInvalidFuncCall,
                "stream is not writable");

    if (!GetParam()) {
        EXPECT_FALSE(fx_.open(fx_.dir_.path(), kZYRStreamRead)->isOpen()) << "not a file";
    }
}

TEST_P(FileStreamTest, TemporaryFiles) {
    auto s = CZYRFileSys::createTmpFileStream(CZYRFileName(fx_.dir_.path().c_str()), u"zyrtemp",
                                              kZYRStreamRead | kZYRStreamWrite);
    ASSERT_TRUE(s && s->isOpen());
    const std::string path = utf8(s->getFilePath());
    EXPECT_EQ(path.rfind(fx_.dir_.path() + "/", 0), 0u) << path;
    EXPECT_EQ(path.find("/zyr", fx_.dir_.path().size()), fx_.dir_.path().size()) << path;
    EXPECT_TRUE(exists(path));
    EXPECT_EQ(s->getSize(), 0u);
    s->write("tmp", 1, 3);
    s->close();
    EXPECT_EQ(readFile(path), "tmp");

    auto other = CZYRFileSys::createTmpFileStream(CZYRFileName(fx_.dir_.path().c_str()), u"zyr",
                                                  kZYRStreamWrite | kZYRStreamDeleteOnClose);
    ASSERT_TRUE(other && other->isOpen());
    const std::string otherPath = utf8(other->getFilePath());
    EXPECT_NE(otherPath, path) << "each temporary file is new";
    other->close();
    EXPECT_FALSE(exists(otherPath));

    if (!GetParam()) {
        // Natively: at most three characters of the prefix, six random ones and ".TMP".
        EXPECT_EQ(path.size() - fx_.dir_.path().size(), 1u + 3 + 6 + 4) << path;
        EXPECT_EQ(path.substr(path.size() - 4), ".TMP");
        const auto bare = CZYRFileSys::createTmpFileStream(
            CZYRFileName((fx_.dir_.path() + "/").c_str()), nullptr, kZYRStreamWrite);
        EXPECT_EQ(utf8(bare->getFilePath()).size() - fx_.dir_.path().size(), 1u + 6 + 4)
            << "no prefix, and one separator";
        const CZYRFileName nowhere(fx_.dir_.file("no/such/dir").c_str());
        expectOpFailed([&] { CZYRFileSys::createTmpFileStream(nowhere, u"x", kZYRStreamWrite); },
                       "File rename failed");
    }
}

INSTANTIATE_TEST_SUITE_P(NativeAndHost, FileStreamTest, ::testing::Values(false, true),
                         [](const ::testing::TestParamInfo<bool>& info) {
                             return info.param ? "Host" : "Native";
                         });

TEST(CZYRFileSysTest, HostRecordWithMissingProcedures) {
    FileSysFixture fx(true);
    const std::string path = fx.dir_.file("host.txt");
    writeFile(path, "host");

    fx.record_.open64 = nullptr;
    auto unopened = fx.open(path, kZYRStreamRead);
    ASSERT_TRUE(unopened);
    EXPECT_FALSE(unopened->isOpen());
    EXPECT_EQ(utf8(unopened->getFilePath()), path) << "the text comes from the host";
    expectError([&] { unopened->reOpen(kZYRStreamRead); }, ZYRPublic::kZYRErrorInvalidFuncCall,
                "open64 proc not defined", kHostSource);
    fx.record_ = ZYRHostKit::posixFileProcs();
    fx.record_.diPathToPath = nullptr;
    auto fileless = fx.open(path, kZYRStreamRead);
    ASSERT_TRUE(fileless);
    EXPECT_FALSE(fileless->isOpen());
    char c;
    expectOpFailed([&] { fileless->read(&c, 1, 1); }, "file stm not open");
    fx.record_ = ZYRHostKit::posixFileProcs();
    fx.record_.wPathToDIPath = nullptr;
    EXPECT_TRUE(fx.open(path, kZYRStreamRead)->isOpen()) << "the narrow procedure stands in";
    fx.record_.pathToDIPath = nullptr;
    expectOpFailed([&] { fx.open(path, kZYRStreamRead); }, "pathFromDIPath not implemented");
    fx.record_.tempFile = nullptr;
    expectError([&] { CZYRFileSys::createTmpFileStream(CZYRFileName(path.c_str()), u"t", 0); },
                ZYRPublic::kZYRErrorInvalidFuncCall, "tempFile proc not defined");
    // A path the host cannot turn into a DI path gives no stream.
    fx.record_ = ZYRHostKit::posixFileProcs();
    EXPECT_FALSE(CZYRFileSys::createFileStream(CZYRFileName(""), kZYRStreamRead, true));

    // Each procedure missing, or failing, as the stream uses it.
    using Record = ZYRPublic::_t_ZYRPDLFileSysRec;
    using Stream = CZYRSmartZYRRefPtr<IZYRFStream>;
    const ZYRPublic::eZYRErrorType undefined = ZYRPublic::kZYRErrorInvalidFuncCall,
                                   fails = ZYRPublic::kZYRErrorFileOpFailed;
    const struct {
        void (*change)(Record&);
        void (*use)(Stream&);
        ZYRPublic::eZYRErrorType type;
        const char* message;
    } procedures[] = {
        {[](Record& r) { r.flush = nullptr; }, [](Stream& s) { s->flush(); }, undefined,
         "flush proc not defined"},
        {[](Record& r) { r.flush = [](void*) { return -1; }; }, [](Stream& s) { s->flush(); },
         fails, "error flushing file"},
        {[](Record& r) { r.getpos64 = nullptr; }, [](Stream& s) { s->getPos(); }, undefined,
         "getpos64 proc not defined"},
        {[](Record& r) { r.getpos64 = [](void*, unsigned long long*) { return -1; }; },
         [](Stream& s) { s->getPos(); }, fails, "Error getpos file"},
        {[](Record& r) { r.setpos64 = nullptr; }, [](Stream& s) { s->setPos(1); }, undefined,
         "setpos64 proc not defined"},
        {[](Record& r) { r.setpos64 = [](void*, uint32_t, uint32_t) { return -1; }; },
         [](Stream& s) { s->setPos(1); }, fails, "Error setpos file"},
        {[](Record& r) { r.setpos64 = nullptr; }, [](Stream& s) { s->setEOF(); }, undefined,
         "geteof64 or setpos64 proc not defined"},
        {[](Record& r) { r.setpos64 = [](void*, uint32_t, uint32_t) { return -1; }; },
         [](Stream& s) { s->setEOF(); }, fails, "Error seteof file"},
        {[](Record& r) { r.geteof64 = nullptr; }, [](Stream& s) { s->getSize(); }, undefined,
         "geteof proc not defined"},
        {[](Record& r) { r.geteof64 = [](void*, unsigned long long*) { return -1; }; },
         [](Stream& s) { s->getSize(); }, fails, "Error getting size of file"},
        {[](Record& r) { r.seteof = nullptr; }, [](Stream& s) { s->truncate(); }, undefined,
         "getpos64 or seteof proc not defined"},
        {[](Record& r) { r.read = nullptr; }, [](Stream& s) { s->read(nullptr, 1, 1); }, undefined,
         "read proc not defined"},
        {[](Record& r) { r.write = nullptr; }, [](Stream& s) { s->write("x", 1, 1); }, undefined,
         "write proc not defined"},
        {[](Record& r) {
             r.write = [](const void*, size_t, size_t, void*, int* error) -> size_t {
                 *error = EIO;
                 return 0;
             };
         },
         [](Stream& s) { s->write("x", 1, 1); }, fails, "Error writing file"},
        {[](Record& r) { r.remove = nullptr; }, [](Stream& s) { s->removeFile(); }, undefined,
         "remove proc not defined"},
        {[](Record& r) { r.remove = [](void*) { return -1; }; }, [](Stream& s) { s->removeFile(); },
         undefined, "Error removing file"},
        {[](Record& r) { r.close = nullptr; }, [](Stream& s) { s->close(); }, undefined,
         "close or remove proc not defined"},
        {[](Record& r) {
             r.close = [](void* handle) { return ZYRHostKit::posixFileProcs().close(handle), -1; };
         },
         [](Stream& s) { s->close(); }, fails, "Error closing file"},
        {[](Record& r) { r.open64 = [](void*, unsigned short, void**) { return -1; }; },
         [](Stream& s) { s->reOpen(kZYRStreamRead); }, fails, "Error opening file"},
    };
    for (const auto& row : procedures) {
        Stream s = fx.open(path, kZYRStreamRead | kZYRStreamWrite);
        ASSERT_TRUE(s->isOpen());
        row.change(fx.record_);
        expectError([&] { row.use(s); }, row.type, row.message, kHostSource);
        fx.record_ = ZYRHostKit::posixFileProcs();
    }
    fx.record_.seteof = [](void*, uint32_t, uint32_t) { return -1; };
    EXPECT_FALSE(fx.open(path, kZYRStreamRead | kZYRStreamWrite)->truncate());
    fx.record_ = ZYRHostKit::posixFileProcs();
}

class FileOperationsTest : public ::testing::Test {
protected:
    CZYRFileName name(const std::string& leaf) const {
        return CZYRFileName(fx_.dir_.file(leaf).c_str());
    }
    FileSysFixture fx_{false};
};

TEST_F(FileOperationsTest, CopyRemoveRenameExists) {
    const std::string a = fx_.dir_.file("a.txt"), b = fx_.dir_.file("b.txt");
    writeFile(a, "alpha");
    EXPECT_TRUE(CZYRFileSys::fileExists(name("a.txt")));
    EXPECT_FALSE(CZYRFileSys::fileExists(name("b.txt")));
    EXPECT_FALSE(CZYRFileSys::fileExists(CZYRFileName("")));

    CZYRFileSys::copy(name("a.txt"), name("b.txt"), true);
    EXPECT_EQ(readFile(b), "alpha");
    expectOpFailed([&] { CZYRFileSys::copy(name("a.txt"), name("b.txt"), true); },
                   "File copy failed");
    writeFile(a, "beta");
    CZYRFileSys::copy(name("a.txt"), name("b.txt"), false);
    EXPECT_EQ(readFile(b), "beta");
    expectOpFailed([&] { CZYRFileSys::copy(name("a.txt"), name("a.txt"), false); },
                   "File copy failed");
    EXPECT_EQ(readFile(a), "beta") << "copying a file onto itself must not empty it";
    expectOpFailed([&] { CZYRFileSys::copy(name("none"), name("c.txt"), false); },
                   "File copy failed");
    EXPECT_FALSE(exists(fx_.dir_.file("c.txt")));
    CZYRFileSys::copy(CZYRFileName(""), name("c.txt"), false); // an empty path does nothing

    expectOpFailed([&] { CZYRFileSys::rename(name("a.txt"), name("b.txt")); },
                   "File rename failed");
    EXPECT_EQ(readFile(b), "beta") << "an existing target is not replaced";
    CZYRFileSys::rename(name("a.txt"), name("c.txt"));
    EXPECT_FALSE(exists(a));
    EXPECT_EQ(readFile(fx_.dir_.file("c.txt")), "beta");
    expectOpFailed([&] { CZYRFileSys::rename(name("a.txt"), name("d.txt")); },
                   "File rename failed");

    CZYRFileSys::remove(name("c.txt"), false);
    EXPECT_FALSE(exists(fx_.dir_.file("c.txt")));
    CZYRFileSys::remove(name("c.txt"), true);
    expectOpFailed([&] { CZYRFileSys::remove(name("c.txt"), false); }, "File delete failed");

    EXPECT_TRUE(CZYRFileSys::isSameFile(name("x"), name("x")));
    EXPECT_FALSE(
        CZYRFileSys::isSameFile(name("x"), CZYRFileName((fx_.dir_.path() + "/./x").c_str())))
        << "texts only, no normalisation";

    CZYRFileSys::makeDirectory(name("sub"));
    struct stat st;
    ASSERT_EQ(::stat(fx_.dir_.file("sub").c_str(), &st), 0);
    EXPECT_TRUE(S_ISDIR(st.st_mode));
    CZYRFileSys::makeDirectory(name("sub")); // exists: nothing to do
    expectOpFailed([&] { CZYRFileSys::makeDirectory(name("no/such")); }, "Directory create failed");
    expectOpFailed([&] { CZYRFileSys::makeDirectory(CZYRFileName("")); },
                   "Directory create failed empty filename");
}

// Collects what an enumeration reports.
class Collector : public ZYRFileSys::IDirEnumCBProc {
public:
    explicit Collector(size_t stopAfter = ~size_t{0}) : stopAfter_(stopAfter) {}
    bool operator()(const ZYRStd::CZYRUniString& path, unsigned int attributes) override {
        entries.emplace_back(utf8(path), attributes);
        return entries.size() < stopAfter_;
    }
    std::vector<std::pair<std::string, unsigned int>> entries;

private:
    size_t stopAfter_;
};

TEST_F(FileOperationsTest, EnumDirectory) {
    const std::string root = fx_.dir_.file("tree");
    ::mkdir(root.c_str(), 0777);
    ::mkdir((root + "/inner").c_str(), 0777);
    writeFile(root + "/plain", "p");
    writeFile(root + "/.hidden", "h");
    writeFile(root + "/...", "dots"); // an ordinary name on POSIX
    writeFile(root + "/locked", "l");
    ::chmod((root + "/locked").c_str(), 0444);

    Collector plain, slashed;
    EXPECT_TRUE(CZYRFileSys::enumDirectory(CZYRFileName(root.c_str()), plain));
    EXPECT_TRUE(CZYRFileSys::enumDirectory(CZYRFileName((root + "/").c_str()), slashed));
    std::sort(plain.entries.begin(), plain.entries.end());
    std::sort(slashed.entries.begin(), slashed.entries.end());
    EXPECT_EQ(plain.entries, slashed.entries) << "a trailing separator changes nothing";
    const std::vector<std::pair<std::string, unsigned int>> expected{
        {root + "/...", ZYRFileSys::kZYRFileAttrHidden},
        {root + "/.hidden", ZYRFileSys::kZYRFileAttrHidden},
        {root + "/inner", ZYRFileSys::kZYRFileAttrDirectory},
        {root + "/locked", ZYRFileSys::kZYRFileAttrReadOnly},
        {root + "/plain", 0},
    };
    EXPECT_EQ(plain.entries, expected);

    Collector first(1);
    EXPECT_FALSE(CZYRFileSys::enumDirectory(CZYRFileName(root.c_str()), first));
    EXPECT_EQ(first.entries.size(), 1u) << "false stops the enumeration";

    const std::string empty = fx_.dir_.file("empty");
    ::mkdir(empty.c_str(), 0777);
    Collector none;
    EXPECT_TRUE(CZYRFileSys::enumDirectory(CZYRFileName(empty.c_str()), none));
    EXPECT_TRUE(none.entries.empty());

    Collector ignored;
    expectOpFailed([&] { CZYRFileSys::enumDirectory(name("missing"), ignored); },
                   "Directory enum failed");
    expectOpFailed([&] { CZYRFileSys::enumDirectory(CZYRFileName(""), ignored); },
                   "Directory create failed empty filename");
    if (::geteuid() != 0) {
        ::chmod(empty.c_str(), 0);
        expectOpFailed([&] { CZYRFileSys::enumDirectory(name("empty"), ignored); },
                       "Directory enum failed");
        ::chmod(empty.c_str(), 0700);
    }
}

TEST_F(FileOperationsTest, MappedStreams) {
    const std::string path = fx_.dir_.file("mapped.bin");
    std::string content(10000, '\0');
    for (size_t i = 0; i < content.size(); ++i)
        content[i] = static_cast<char>('a' + i % 26);
    writeFile(path, content);

    {
        ZYRStd::CZYRMemMapFStream whole(name("mapped.bin"), kZYRStreamRead, 0, 0);
        ASSERT_TRUE(whole.isMapped());
        EXPECT_TRUE(whole.isOpen());
        EXPECT_EQ(whole.getSize(), content.size());
        EXPECT_EQ(whole.getCapacity(), content.size());
        std::string back(content.size(), '\0');
        EXPECT_EQ(whole.read(back.data(), 1, 20000), content.size());
        EXPECT_EQ(back, content);
        expectError([&] { whole.write("x", 1, 1); }, ZYRPublic::kZYRErrorInvalidFuncCall,
                    "stream is not writable", "source/zyr/std/IImpZYRMemStream");

        whole.close();
        EXPECT_FALSE(whole.isMapped());
        char c;
        expectOpFailed([&] { whole.read(&c, 1, 1); }, "file stm not mapped");
        ZYRPublic::eZYRErrorType err = ZYRPublic::kZYRErrorNoError;
        EXPECT_EQ(whole.read(&c, 1, 1, err), 0u);
        EXPECT_EQ(err, ZYRPublic::kZYRErrorFileOpFailed);
        EXPECT_EQ(whole.getSize(), 0u);
        EXPECT_EQ(whole.getCapacity(), 0u);
        unsigned long long offset = 1;
        unsigned int length = 1;
        EXPECT_EQ(whole.getMapAttributes(offset, length), nullptr);
        EXPECT_EQ(offset, 0u);
        EXPECT_EQ(length, 0u);

        whole.reOpen(kZYRStreamRead);
        ASSERT_TRUE(whole.isMapped()) << "a closed stream maps again on reOpen";
        EXPECT_EQ(whole.read(&c, 1, 1), 1u);
        EXPECT_EQ(c, 'a');
    }

    {
        // Not on a page boundary: the stream starts at the requested byte anyway.
        ZYRStd::CZYRMemMapFStream window(name("mapped.bin"), kZYRStreamRead, 4099, 100);
        unsigned long long offset = 0;
        unsigned int length = 0;
        const char* base = static_cast<const char*>(window.getMapAttributes(offset, length));
        EXPECT_EQ(offset, 4099u);
        EXPECT_EQ(length, 100u);
        EXPECT_EQ(std::string(base, 100), content.substr(4099, 100));
        char buf[100];
        EXPECT_EQ(window.read(buf, 1, 100), 100u);
        EXPECT_EQ(std::string(buf, 100), content.substr(4099, 100));
        window.setPos(5);
        window.setEOF();
        EXPECT_EQ(window.getPos(), 100u);
        EXPECT_EQ(window.getSize(), 100u);
        ASSERT_EQ(::truncate(path.c_str(), 4099 + 10), 0);
        EXPECT_EQ(window.getSize(), 10u) << "only what is left of a file that shrank";
        ASSERT_EQ(::truncate(path.c_str(), 4000), 0);
        EXPECT_EQ(window.getSize(), 0u);
        writeFile(path, content);
    }

    expectOpFailed(
        [&] { ZYRStd::CZYRMemMapFStream past(name("mapped.bin"), kZYRStreamRead, 9990, 100); },
        "error mapping view of file");

    {
        // A writable view past the end grows the file; the bytes reach it.
        ZYRStd::CZYRMemMapFStream out(name("grown.bin"), kZYRStreamRead | kZYRStreamWrite, 100, 8);
        ASSERT_TRUE(out.isMapped());
        EXPECT_EQ(out.getSize(), 8u) << "readable: the whole window is the content";
        out.write("ABCDEFGH", 1, 8);
        out.flush();
    }
    const std::string grown = readFile(fx_.dir_.file("grown.bin"));
    ASSERT_EQ(grown.size(), 108u);
    EXPECT_EQ(grown.substr(100), "ABCDEFGH");

    writeFile(fx_.dir_.file("empty.bin"), "");
    expectOpFailed([&] { ZYRStd::CZYRMemMapFStream e(name("empty.bin"), kZYRStreamRead, 0, 0); },
                   "Error mapping empty file");
    expectOpFailed([&] { ZYRStd::CZYRMemMapFStream m(name("missing.bin"), kZYRStreamRead, 0, 0); },
                   "error opening file");
}

// A scripted system call: each step is the result of one call (with errno for -1).
struct Script {
    std::vector<std::pair<ssize_t, int>> steps;
    size_t calls = 0;
    ssize_t next() {
        if (calls >= steps.size())
            return ADD_FAILURE() << "called again after the script ended", -1;
        const auto [result, error] = steps[calls++];
        errno = error;
        return result;
    }
};
Script* script = nullptr;
ssize_t scriptedRead(int, void*, size_t) {
    return script->next();
}
ssize_t scriptedWrite(int, const void*, size_t) {
    return script->next();
}

TEST(CZYRFileSysTest, PosixTransfersRetryInterruptsAndStopAtNoProgress) {
    struct Case {
        bool write;
        std::vector<std::pair<ssize_t, int>> steps;
        size_t done;
        int error;
        const char* why;
    };
    const Case cases[] = {
        {true, {{-1, EINTR}, {4, 0}, {-1, EINTR}, {6, 0}}, 10, 0, "interrupts are retried"},
        {true, {{3, 0}, {0, 0}}, 3, EIO, "a write that moves nothing must not be retried for ever"},
        {true, {{2, 0}, {-1, ENOSPC}}, 2, ENOSPC, "the failure's errno"},
        {true, {{-1, 0}}, 0, EIO, "a failure without errno"},
        {false, {{-1, EINTR}, {7, 0}, {0, 0}}, 7, 0, "the end of the file is no error"},
        {false, {{5, 0}, {-1, EBADF}}, 5, EBADF, "the failure's errno"},
    };
    char buf[10] = {};
    for (const Case& c : cases) {
        Script s{c.steps};
        script = &s;
        const auto t = c.write ? ZYRStd::posixio::writeFully(3, buf, 10, scriptedWrite)
                               : ZYRStd::posixio::readFully(3, buf, 10, scriptedRead);
        EXPECT_EQ(t.done, c.done) << c.why;
        EXPECT_EQ(t.error, c.error) << c.why;
        EXPECT_EQ(s.calls, s.steps.size()) << c.why;
    }
    script = nullptr;
}

// The host kit's procedures, noting which DI paths and path texts the host has handed out
// and not yet been given back.
struct DIPathLedger {
    static inline ZYRPublic::_t_ZYRPDLFileSysRec real{};
    static inline std::set<void*> outstanding;

    static void* wPathToDIPath(const char16_t* path, int reserved) {
        void* diPath = real.wPathToDIPath(path, reserved);
        if (diPath)
            outstanding.insert(diPath);
        return diPath;
    }
    static char16_t* diPathToWPath(void* diPath, int reserved) {
        char16_t* text = real.diPathToWPath(diPath, reserved);
        if (text)
            outstanding.insert(text);
        return text;
    }
    static void free(void* p) {
        outstanding.erase(p);
        real.free(p);
    }
};

TEST(CZYRFileSysTest, HostPathIsFreedWhateverAllocationFails) {
    FileSysFixture fx(true);
    const std::string path = fx.dir_.file("host.txt");
    writeFile(path, "host");
    DIPathLedger::real = fx.record_;
    fx.record_.wPathToDIPath = DIPathLedger::wPathToDIPath;
    fx.record_.diPathToWPath = DIPathLedger::diPathToWPath;
    fx.record_.free = DIPathLedger::free;

    zyrtest::FailingHost host;
    ZYRStd::tZYRMemMgr memory = host.record();
    zyrtest::installFront(0, &memory);
    fx.open(path, kZYRStreamRead);
    const unsigned int callsPerOpen = host.calls;
    ASSERT_GT(callsPerOpen, 1u);
    ASSERT_TRUE(DIPathLedger::outstanding.empty());
    for (unsigned int failing = 1; failing <= callsPerOpen; ++failing) {
        host.calls = 0;
        host.failAt = failing;
        try {
            fx.open(path, kZYRStreamRead);
        } catch (const ZYRStd::CZYRError&) {
        } catch (const std::bad_alloc&) {
        }
        host.failAt = 0;
        EXPECT_TRUE(DIPathLedger::outstanding.empty()) << "allocation " << failing << " failed";
        DIPathLedger::outstanding.clear();
    }
    zyrtest::installFront(0);
}

} // namespace
