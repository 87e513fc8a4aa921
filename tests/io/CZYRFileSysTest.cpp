// Tests of the file system: the static calls, file names, and the native and host-procedure
// file streams on real files in a fresh temporary directory.
#include <gtest/gtest.h>

#include <algorithm>
#include <cerrno>
#include <functional>
#include <memory>
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
        CZYRFileName sharing(raw, true), copy(sharing), clone = copy.clone();
        EXPECT_EQ(raw->peekRefCnt(), 3);
        EXPECT_TRUE(copy.getWStringPath() == ZYRStd::CZYRWString(u"/a/b/c.txt") && !copy.isEmpty());
        auto* cloned = static_cast<ZYRFileName::IZYRFileName*>(clone);
        EXPECT_TRUE(cloned != raw && cloned->peekRefCnt() == 1) << "adopted, not doubled";
    }
    EXPECT_EQ(raw->peekRefCnt(), 1);
    raw->release();
    EXPECT_TRUE(CZYRFileName(new PathlessName, false).getWStringPath().empty());
    CZYRFileName none;
    EXPECT_TRUE(none.isEmpty());
    expectError([&] { none.getWStringPath(); }, ZYRPublic::kZYRErrorInvalidObject, "Null object",
                "source/zyr/std/CZYRFileSys");
}

TEST(CZYRFileSysTest, DirectoriesMadeAtConstruction) {
    zyrtest::TempDir dir;
    // 245 characters in all is the longest accepted name; an empty text is a name not given.
    const std::string longest = dir.path() + "/" + std::string(244 - dir.path().size(), 'd'),
                      cache = dir.file("cache"), tooLong = longest + "x";
    auto create = [](const std::string& temp, const std::string& dl) {
        auto uni = [](const std::string& t) {
            return t.empty() ? ZYRStd::CZYRUniString() : ZYRStd::CZYRUniString(t.c_str());
        };
        return std::unique_ptr<ZYRFileSys::IZYRFileSys>(
            ZYRFileSys::createDefaultFileSystem(uni(temp), uni(dl), nullptr));
    };
    for (int twice = 0; twice < 2; ++twice) { // existing directories are fine
        const auto fs = create(longest, cache);
        EXPECT_TRUE(exists(longest) && exists(cache));
        EXPECT_EQ(utf8(fs->getTempDirName()) + "|" + utf8(fs->getDLCacheDirName()),
                  longest + "|" + cache);
    }
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
        EXPECT_EQ(std::string(buf, 4) + std::to_string(s->getPos()), "01234");
        EXPECT_EQ(s->write("AB", 1, 2), 2u);
        EXPECT_EQ(s->setPos(8), 8u);
        EXPECT_EQ(s->read(buf, 1, 4), 2u) << "a short read is the end of the file";
        s->setEOF();
        EXPECT_EQ(s->getPos(), 10u);
        s->setPos(3);
        EXPECT_TRUE(s->truncate() && s->getSize() == 3);
        s->close();
        EXPECT_FALSE(s->isOpen());
    }
    EXPECT_EQ(readFile(path), "012");
    {
        auto s = fx_.open(path, kZYRStreamAppend);
        EXPECT_EQ(s->write("xy", 1, 2), 2u);
        char c;
        EXPECT_THROW(s->read(&c, 1, 1), CZYRError);
    }
    EXPECT_EQ(readFile(path), "012xy") << "append writes at the end";
    {
        auto s = fx_.open(path, kZYRStreamWrite | kZYRStreamTruncate);
        EXPECT_EQ(s->getSize(), 0u);
        s->write("new", 1, 3);
        s->reOpen(kZYRStreamRead);
        char buf[8] = {};
        EXPECT_EQ(s->read(buf, 1, 8), 3u);
        EXPECT_EQ(std::string(buf, 3), "new");
        EXPECT_EQ(s->getAccessMode(), kZYRStreamRead);
    }
    if (!GetParam()) { // what write-only means to a host file is the host's choice
        fx_.open(path, kZYRStreamWrite)->write("n", 1, 1);
        EXPECT_EQ(readFile(path), "n");
    }
    const std::string temporary = fx_.dir_.file("gone.tmp");
    {
        auto s = fx_.open(temporary, kZYRStreamRead | kZYRStreamWrite | kZYRStreamDeleteOnClose);
        s->write("x", 1, 1);
        EXPECT_TRUE(exists(temporary));
    }
    EXPECT_FALSE(exists(temporary)) << "deleted when its last handle closed";
    fx_.open(path, kZYRStreamRead)->removeFile();
    EXPECT_FALSE(exists(path));
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

    EXPECT_TRUE(GetParam() || !fx_.open(fx_.dir_.path(), kZYRStreamRead)->isOpen())
        << "a directory";
}

TEST_P(FileStreamTest, TemporaryFiles) {
    const std::string dir = fx_.dir_.path();
    auto s = CZYRFileSys::createTmpFileStream(CZYRFileName(dir.c_str()), u"zyrtemp",
                                              kZYRStreamRead | kZYRStreamWrite);
    ASSERT_TRUE(s && s->isOpen());
    const std::string path = utf8(s->getFilePath());
    EXPECT_EQ(path.find(dir + "/zyr"), 0u) << path;
    EXPECT_EQ(s->getSize(), 0u);
    s->write("tmp", 1, 3);
    s->close();
    EXPECT_EQ(readFile(path), "tmp");
    auto other = CZYRFileSys::createTmpFileStream(CZYRFileName(dir.c_str()), u"zyr",
                                                  kZYRStreamWrite | kZYRStreamDeleteOnClose);
    const std::string otherPath = utf8(other->getFilePath());
    EXPECT_NE(otherPath, path) << "each temporary file is new";
    other->close();
    EXPECT_FALSE(exists(otherPath));
    if (!GetParam()) {
        // Natively: at most three characters of the prefix, six random ones and ".TMP".
        EXPECT_EQ(path.size() - dir.size(), 1u + 3 + 6 + 4) << path;
        EXPECT_EQ(path.substr(path.size() - 4), ".TMP");
        const auto bare = CZYRFileSys::createTmpFileStream(CZYRFileName((dir + "/").c_str()),
                                                           nullptr, kZYRStreamWrite);
        EXPECT_EQ(utf8(bare->getFilePath()).size() - dir.size(), 1u + 6 + 4) << "one separator";
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
    EXPECT_FALSE(CZYRFileSys::fileExists(name("b.txt")) ||
                 CZYRFileSys::fileExists(CZYRFileName("")));
    CZYRFileSys::copy(name("a.txt"), name("b.txt"), true);
    EXPECT_EQ(readFile(b), "alpha");
    writeFile(a, "beta");
    CZYRFileSys::copy(name("a.txt"), name("b.txt"), false);
    EXPECT_EQ(readFile(b), "beta");
    CZYRFileSys::copy(CZYRFileName(""), name("c.txt"), false); // an empty path does nothing
    // Refused: an existing target when asked, a file onto itself, a missing source, an
    // existing or missing rename, a missing file to delete.
    const std::pair<std::function<void()>, const char*> refusals[] = {
        {[&] { CZYRFileSys::copy(name("a.txt"), name("b.txt"), true); }, "File copy failed"},
        {[&] { CZYRFileSys::copy(name("a.txt"), name("a.txt"), false); }, "File copy failed"},
        {[&] { CZYRFileSys::copy(name("none"), name("c.txt"), false); }, "File copy failed"},
        {[&] { CZYRFileSys::rename(name("a.txt"), name("b.txt")); }, "File rename failed"},
        {[&] { CZYRFileSys::rename(name("none"), name("d.txt")); }, "File rename failed"},
        {[&] { CZYRFileSys::remove(name("none"), false); }, "File delete failed"},
        {[&] { CZYRFileSys::makeDirectory(name("no/such")); }, "Directory create failed"},
        {[&] { CZYRFileSys::makeDirectory(CZYRFileName("")); },
         "Directory create failed empty filename"},
    };
    for (const auto& [call, message] : refusals)
        expectOpFailed(call, message);
    EXPECT_EQ(readFile(a) + readFile(b), "betabeta") << "nothing emptied or replaced";
    EXPECT_FALSE(exists(fx_.dir_.file("c.txt")));
    CZYRFileSys::rename(name("a.txt"), name("c.txt"));
    EXPECT_EQ(std::to_string(exists(a)) + readFile(fx_.dir_.file("c.txt")), "0beta");
    CZYRFileSys::remove(name("c.txt"), false);
    EXPECT_FALSE(exists(fx_.dir_.file("c.txt")));
    CZYRFileSys::remove(name("c.txt"), true);
    EXPECT_TRUE(CZYRFileSys::isSameFile(name("x"), name("x")));
    EXPECT_FALSE(
        CZYRFileSys::isSameFile(name("x"), CZYRFileName((fx_.dir_.path() + "/./x").c_str())))
        << "texts only, no normalisation";
    for (int twice = 0; twice < 2; ++twice) // the second time it exists: nothing to do
        CZYRFileSys::makeDirectory(name("sub"));
    struct stat st;
    EXPECT_TRUE(::stat(fx_.dir_.file("sub").c_str(), &st) == 0 && S_ISDIR(st.st_mode));
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
    const std::string root = fx_.dir_.file("tree"), empty = fx_.dir_.file("empty");
    for (const std::string& dir : {root, root + "/inner", empty})
        ::mkdir(dir.c_str(), 0777);
    for (const char* leaf : {"/plain", "/.hidden", "/...", "/locked"}) // "..." is ordinary here
        writeFile(root + leaf, "x");
    ::chmod((root + "/locked").c_str(), 0444);
    Collector plain, slashed, first(1), none, ignored;
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
    EXPECT_FALSE(CZYRFileSys::enumDirectory(CZYRFileName(root.c_str()), first));
    EXPECT_EQ(first.entries.size(), 1u) << "false stops the enumeration";
    EXPECT_TRUE(CZYRFileSys::enumDirectory(CZYRFileName(empty.c_str()), none));
    EXPECT_TRUE(none.entries.empty());
    expectOpFailed([&] { CZYRFileSys::enumDirectory(name("missing"), ignored); },
                   "Directory enum failed");
    expectOpFailed([&] { CZYRFileSys::enumDirectory(CZYRFileName(""), ignored); },
                   "Directory create failed empty filename");
}

TEST_F(FileOperationsTest, MappedStreams) {
    const std::string path = fx_.dir_.file("mapped.bin");
    std::string content(10000, '\0');
    for (size_t i = 0; i < content.size(); ++i)
        content[i] = static_cast<char>('a' + i % 26);
    writeFile(path, content);
    unsigned long long offset = 1;
    unsigned int length = 1;
    char c;
    {
        ZYRStd::CZYRMemMapFStream whole(name("mapped.bin"), kZYRStreamRead, 0, 0);
        ASSERT_TRUE(whole.isMapped() && whole.isOpen());
        EXPECT_EQ(std::pair(whole.getSize(), whole.getCapacity()), std::pair(10000ull, 10000ull));
        std::string back(content.size(), '\0');
        EXPECT_EQ(whole.read(back.data(), 1, 20000), content.size());
        EXPECT_EQ(back, content);
        expectError([&] { whole.write("x", 1, 1); }, ZYRPublic::kZYRErrorInvalidFuncCall,
                    "stream is not writable", "source/zyr/std/IImpZYRMemStream");
        whole.close();
        EXPECT_FALSE(whole.isMapped());
        expectOpFailed([&] { whole.read(&c, 1, 1); }, "file stm not mapped");
        EXPECT_EQ(std::tuple(whole.getSize(), whole.getCapacity(),
                             whole.getMapAttributes(offset, length), offset, length),
                  std::tuple(0u, 0u, nullptr, 0u, 0u));
        whole.reOpen(kZYRStreamRead);
        ASSERT_TRUE(whole.isMapped()) << "a closed stream maps again on reOpen";
        EXPECT_TRUE(whole.read(&c, 1, 1) == 1 && c == 'a');
    }
    {
        // Not on a page boundary: the stream starts at the requested byte anyway.
        ZYRStd::CZYRMemMapFStream window(name("mapped.bin"), kZYRStreamRead, 4099, 100);
        const char* base = static_cast<const char*>(window.getMapAttributes(offset, length));
        EXPECT_EQ(std::pair(offset, length), std::pair(4099ull, 100u));
        EXPECT_EQ(std::string(base, 100), content.substr(4099, 100));
        ASSERT_EQ(::truncate(path.c_str(), 4099 + 10), 0);
        EXPECT_EQ(window.getSize(), 10u) << "only what is left of a file that shrank";
        ASSERT_EQ(::truncate(path.c_str(), 4000), 0);
        EXPECT_EQ(window.getSize(), 0u);
    }
    expectOpFailed(
        [&] { ZYRStd::CZYRMemMapFStream past(name("mapped.bin"), kZYRStreamRead, 3990, 100); },
        "error mapping view of file");
    {
        // A writable view past the end grows the file; the bytes reach it.
        ZYRStd::CZYRMemMapFStream out(name("grown.bin"), kZYRStreamRead | kZYRStreamWrite, 100, 8);
        EXPECT_EQ(out.getSize(), 8u) << "readable: the whole window is the content";
        out.write("ABCDEFGH", 1, 8);
        out.flush();
    }
    EXPECT_EQ(readFile(fx_.dir_.file("grown.bin")), std::string(100, '\0') + "ABCDEFGH");
    writeFile(fx_.dir_.file("empty.bin"), "");
    expectOpFailed([&] { ZYRStd::CZYRMemMapFStream e(name("empty.bin"), kZYRStreamRead, 0, 0); },
                   "Error mapping empty file");
    expectOpFailed([&] { ZYRStd::CZYRMemMapFStream m(name("missing.bin"), kZYRStreamRead, 0, 0); },
                   "error opening file");
}

// A scripted system call: each step is the result of one call (with errno for -1).
std::vector<std::pair<ssize_t, int>> steps;
size_t calls = 0;
ssize_t scripted() {
    if (calls >= steps.size())
        return ADD_FAILURE() << "called again after the script ended", -1;
    return errno = steps[calls].second, steps[calls++].first;
}

TEST(CZYRFileSysTest, PosixTransfersRetryInterruptsAndStopAtNoProgress) {
    // Interrupts are retried; a write that moves nothing must not be retried for ever; the
    // failure's errno, or EIO without one; the end of the file is no error.
    const std::tuple<bool, std::vector<std::pair<ssize_t, int>>, size_t, int> cases[] = {
        {true, {{-1, EINTR}, {4, 0}, {-1, EINTR}, {6, 0}}, 10, 0},
        {true, {{3, 0}, {0, 0}}, 3, EIO},
        {true, {{2, 0}, {-1, ENOSPC}}, 2, ENOSPC},
        {true, {{-1, 0}}, 0, EIO},
        {false, {{-1, EINTR}, {7, 0}, {0, 0}}, 7, 0},
        {false, {{5, 0}, {-1, EBADF}}, 5, EBADF},
    };
    char buf[10] = {};
    for (const auto& [write, script, done, error] : cases) {
        steps = script;
        calls = 0;
        const auto t = write ? ZYRStd::posixio::writeFully(
                                   3, buf, 10, [](int, const void*, size_t) { return scripted(); })
                             : ZYRStd::posixio::readFully(
                                   3, buf, 10, [](int, void*, size_t) { return scripted(); });
        EXPECT_EQ(std::tuple(t.done, t.error, calls), std::tuple(done, error, steps.size()));
    }
}

// The host kit's procedures, noting which DI paths and path texts the host has handed out
// and not yet been given back.
ZYRPublic::_t_ZYRPDLFileSysRec real{};
std::set<void*> outstanding;
template <class T> T* noted(T* p) {
    return p ? outstanding.insert(p), p : p;
}

TEST(CZYRFileSysTest, HostPathIsFreedWhateverAllocationFails) {
    FileSysFixture fx(true);
    const std::string path = fx.dir_.file("host.txt");
    writeFile(path, "host");
    real = fx.record_;
    fx.record_.wPathToDIPath = [](const char16_t* p, int r) {
        return noted(real.wPathToDIPath(p, r));
    };
    fx.record_.diPathToWPath = [](void* p, int r) { return noted(real.diPathToWPath(p, r)); };
    fx.record_.free = [](void* p) { outstanding.erase(p), real.free(p); };
    zyrtest::FailingHost host;
    ZYRStd::tZYRMemMgr memory = host.record();
    zyrtest::installFront(0, &memory);
    fx.open(path, kZYRStreamRead);
    const unsigned int callsPerOpen = host.calls;
    ASSERT_TRUE(callsPerOpen > 1 && outstanding.empty());
    for (host.failAt = 1; host.failAt <= callsPerOpen; ++host.failAt) {
        host.calls = 0;
        try {
            fx.open(path, kZYRStreamRead);
        } catch (const ZYRStd::CZYRError&) {
        } catch (const std::bad_alloc&) {
        }
        EXPECT_TRUE(outstanding.empty()) << "allocation " << host.failAt << " failed";
        outstanding.clear();
    }
    host.failAt = 0;
    zyrtest::installFront(0);
}

} // namespace
