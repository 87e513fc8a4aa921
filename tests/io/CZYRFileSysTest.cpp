#include <gtest/gtest.h>

#include <algorithm>
#include <cerrno>
#include <functional>
#include <memory>
#include <new>
#include <numeric>
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
#include "zyr/std/io/internal/ZYRFileSys_helper.h"
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
    return ::access(path.c_str(), F_OK) == 0;
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
template <class Body> void expectOpFailed(Body body, const char* message) {
    expectError(body, ZYRPublic::kZYRErrorFileOpFailed, message);
}

// A file system over a fresh directory; `host` routes file streams through the record.
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

TEST(CZYRFileSysTest, NothingInstalledFileNamesAndDirectories) {
    ZYRStd::ZYRStdInit_SetZYRFactoryProc(nullptr);
    using Proc = ZYRFileSys::IZYRFileSys* (*)();
    for (Proc proc : {Proc([]() -> ZYRFileSys::IZYRFileSys* { return nullptr; }), Proc()}) {
        ZYRStd::ZYRStdInit_SetDefaultFileSysProc(proc);
        expectError(
            [] { CZYRFileSys::getTempDirName(); }, ZYRPublic::kZYRErrorFileSystemNotInitialized,
            "A FileSys  not installed. Install one with ZYRFileSys_SetDefaultFileSys method",
            "source/zyr/std/CZYRFileSys");
    }
    expectError([] { CZYRFileName name("/tmp/x"); }, ZYRPublic::kZYRErrorFatal,
                "ZYRFactory Proc not set in ZYRStd", "source/zyr/std/ZYRStdInit");
    auto* raw = new ZYRHostKit::CPosixFileName(ZYRStd::CZYRWString(u"/a/b/c.txt"));
    raw->addRef(); // ours, kept across the wrappers below
    { CZYRFileName adopting(raw, false); }
    EXPECT_EQ(raw->peekRefCnt(), 1) << "adopting takes over a reference";
    {
        CZYRFileName sharing(raw, true), clone = sharing.clone();
        EXPECT_TRUE(sharing.getWStringPath() == ZYRStd::CZYRWString(u"/a/b/c.txt") &&
                    static_cast<ZYRFileName::IZYRFileName*>(clone)->peekRefCnt() == 1);
    }
    raw->release();
    expectError([&] { CZYRFileName().getWStringPath(); }, ZYRPublic::kZYRErrorInvalidObject,
                "Null object", "source/zyr/std/CZYRFileSys");
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
        EXPECT_EQ(utf8(fs->getTempDirName()) + "|" + utf8(fs->getDLCacheDirName()),
                  longest + "|" + cache);
    }
    EXPECT_TRUE(exists(longest) && exists(cache));
    for (const auto& [temp, dl, message] :
         {std::tuple{tooLong, std::string(), "temp dir filename too long"},
          {std::string(), tooLong, "DL Cache dir filename too long"}})
        expectError([&] { create(temp, dl); }, ZYRPublic::kZYRErrorLimitCheck, message);
    expectOpFailed([&] { create(dir.file("missing/child"), ""); }, "Directory create failed");
}

class FileStreamTest : public ::testing::TestWithParam<bool> {
protected:
    FileSysFixture fx_{GetParam()};
    const char* source() const { return GetParam() ? kHostSource : kWindowsSource; }
};

TEST_P(FileStreamTest, OpenModesTransfersAndFilesThatDoNotOpen) {
    const std::string path = fx_.dir_.file("data.bin"), temporary = fx_.dir_.file("gone.tmp");
    writeFile(path, "0123456789");
    char buf[8] = {};
    {
        auto s = fx_.open(path, kZYRStreamRead | kZYRStreamWrite);
        EXPECT_TRUE(s->getSize() == 10 && utf8(s->getFilePath()) == path) << "content kept";
        EXPECT_EQ(s->getPos() + s->setPos(0) + s->read(buf, 2, 2) + s->write("AB", 1, 2) +
                      s->setPos(8),
                  4u + 2 + 8);
        EXPECT_EQ(s->read(buf, 1, 4), 2u) << "a short read is the end of the file";
        s->setEOF();
        EXPECT_EQ(std::string(buf, 4) + std::to_string(s->getPos()), "892310");
        s->setPos(3);
        EXPECT_TRUE(s->truncate() && s->getSize() == 3);
    }
    fx_.open(path, kZYRStreamAppend)->write("xy", 1, 2);
    EXPECT_EQ(readFile(path), "012xy") << "append writes at the end";
    EXPECT_THROW(fx_.open(path, kZYRStreamAppend)->read(buf, 1, 1), CZYRError);
    {
        auto s = fx_.open(path, kZYRStreamWrite | kZYRStreamTruncate);
        EXPECT_EQ(s->getSize(), 0u);
        s->write("new", 1, 3);
        s->reOpen(kZYRStreamRead);
        EXPECT_TRUE(s->read(buf, 1, 8) == 3 && s->getAccessMode() == kZYRStreamRead);
    }
    if (!GetParam()) { // what write-only means to a host file is the host's choice
        fx_.open(path, kZYRStreamWrite)->write("n", 1, 1);
        EXPECT_EQ(readFile(path), "n");
    }
    fx_.open(temporary, kZYRStreamRead | kZYRStreamWrite | kZYRStreamDeleteOnClose)
        ->write("x", 1, 1);
    fx_.open(path, kZYRStreamRead)->removeFile();
    EXPECT_FALSE(exists(temporary) || exists(path)) << "deleted on close, and removed";
    auto missing = fx_.open(fx_.dir_.file("missing.txt"), kZYRStreamRead);
    char c;
    ZYRPublic::eZYRErrorType err = ZYRPublic::kZYRErrorNoError;
    EXPECT_TRUE(!missing->isOpen() && missing->read(&c, 1, 1, err) == 0 &&
                err == ZYRPublic::kZYRErrorFileOpFailed)
        << "a stream, but no open file";
    expectError([&] { missing->read(&c, 1, 1); }, ZYRPublic::kZYRErrorFileOpFailed,
                GetParam() ? "Error reading file" : "error reading from file", source());
    expectError([&] { missing->write("x", 1, 1); }, ZYRPublic::kZYRErrorInvalidFuncCall,
                "stream is not writable");
    EXPECT_TRUE(GetParam() || !fx_.open(fx_.dir_.path(), kZYRStreamRead)->isOpen())
        << "a directory";
}

TEST_P(FileStreamTest, TemporaryFiles) {
    const std::string dir = fx_.dir_.path();
    auto s = CZYRFileSys::createTmpFileStream(CZYRFileName(dir.c_str()), u"zyrtemp",
                                              kZYRStreamRead | kZYRStreamWrite);
    auto other = CZYRFileSys::createTmpFileStream(CZYRFileName((dir + "/").c_str()), nullptr,
                                                  kZYRStreamWrite | kZYRStreamDeleteOnClose);
    const std::string path = utf8(s->getFilePath()), otherPath = utf8(other->getFilePath());
    s->write("tmp", 1, 3);
    s->close();
    other->close();
    EXPECT_TRUE(path.starts_with(dir + "/zyr") && readFile(path) == "tmp" && !exists(otherPath));
    if (!GetParam()) {
        // Natively: three characters of the prefix at most, six random ones and ".TMP".
        EXPECT_EQ(path.substr(dir.size()), "/zyr" + path.substr(dir.size() + 4, 6) + ".TMP");
        EXPECT_EQ(otherPath.size() - dir.size(), 1u + 6 + 4);
        const CZYRFileName nowhere(fx_.dir_.file("no/such/dir").c_str());
        expectOpFailed([&] { CZYRFileSys::createTmpFileStream(nowhere, u"x", kZYRStreamWrite); },
                       "File rename failed");
    }
}

INSTANTIATE_TEST_SUITE_P(NativeAndHost, FileStreamTest, ::testing::Values(false, true),
                         [](const ::testing::TestParamInfo<bool>& info) {
                             return info.param ? "Host" : "Native";
                         });

constexpr auto failOne = [](void*) { return -1; };
constexpr auto failGet = [](void*, unsigned long long*) { return -1; };
constexpr auto failSet = [](void*, uint32_t, uint32_t) { return -1; };
constexpr auto failOpen = [](void*, unsigned short, void**) { return -1; };
constexpr auto failWrite = [](const void*, size_t, size_t, void*, int* e) -> size_t {
    return *e = EIO, 0;
};
const auto failClose = [](void* handle) { return ZYRHostKit::posixFileProcs().close(handle), -1; };

TEST(CZYRFileSysTest, HostRecordWithMissingProcedures) {
    FileSysFixture fx(true);
    const std::string path = fx.dir_.file("host.txt");
    writeFile(path, "host");
    fx.record_.open64 = nullptr;
    auto unopened = fx.open(path, kZYRStreamRead);
    EXPECT_TRUE(!unopened->isOpen() && utf8(unopened->getFilePath()) == path) << "from the host";
    expectError([&] { unopened->reOpen(kZYRStreamRead); }, ZYRPublic::kZYRErrorInvalidFuncCall,
                "open64 proc not defined", kHostSource);
    fx.record_ = ZYRHostKit::posixFileProcs();
    fx.record_.diPathToPath = nullptr;
    expectOpFailed([&] { fx.open(path, kZYRStreamRead)->read(nullptr, 1, 1); },
                   "file stm not open");
    fx.record_ = ZYRHostKit::posixFileProcs();
    fx.record_.wPathToDIPath = nullptr;
    EXPECT_TRUE(fx.open(path, kZYRStreamRead)->isOpen()) << "the narrow procedure stands in";
    fx.record_.pathToDIPath = nullptr;
    expectOpFailed([&] { fx.open(path, kZYRStreamRead); }, "pathFromDIPath not implemented");
    fx.record_.tempFile = nullptr;
    expectError([&] { CZYRFileSys::createTmpFileStream(CZYRFileName(path.c_str()), u"t", 0); },
                ZYRPublic::kZYRErrorInvalidFuncCall, "tempFile proc not defined");
    fx.record_ = ZYRHostKit::posixFileProcs();
    EXPECT_FALSE(CZYRFileSys::createFileStream(CZYRFileName(""), kZYRStreamRead, true)) << "no DI";

    using R = ZYRPublic::_t_ZYRPDLFileSysRec&;
    using S = CZYRSmartZYRRefPtr<IZYRFStream>&;
    const auto undefined = ZYRPublic::kZYRErrorInvalidFuncCall;
    const auto fails = ZYRPublic::kZYRErrorFileOpFailed;
    using Row = std::tuple<void (*)(R, S), ZYRPublic::eZYRErrorType, const char*>;
    const Row procedures[] = {
        {[](R r, S s) { r.flush = nullptr, s->flush(); }, undefined, "flush proc not defined"},
        {[](R r, S s) { r.flush = failOne, s->flush(); }, fails, "error flushing file"},
        {[](R r, S s) { r.getpos64 = nullptr, s->getPos(); }, undefined,
         "getpos64 proc not defined"},
        {[](R r, S s) { r.getpos64 = failGet, s->getPos(); }, fails, "Error getpos file"},
        {[](R r, S s) { r.setpos64 = nullptr, s->setPos(1); }, undefined,
         "setpos64 proc not defined"},
        {[](R r, S s) { r.setpos64 = failSet, s->setPos(1); }, fails, "Error setpos file"},
        {[](R r, S s) { r.setpos64 = nullptr, s->setEOF(); }, undefined,
         "geteof64 or setpos64 proc not defined"},
        {[](R r, S s) { r.setpos64 = failSet, s->setEOF(); }, fails, "Error seteof file"},
        {[](R r, S s) { r.geteof64 = nullptr, s->getSize(); }, undefined,
         "geteof proc not defined"},
        {[](R r, S s) { r.geteof64 = failGet, s->getSize(); }, fails, "Error getting size of file"},
        {[](R r, S s) { r.seteof = nullptr, s->truncate(); }, undefined,
         "getpos64 or seteof proc not defined"},
        {[](R r, S s) { r.read = nullptr, s->read(nullptr, 1, 1); }, undefined,
         "read proc not defined"},
        {[](R r, S s) { r.write = nullptr, s->write("x", 1, 1); }, undefined,
         "write proc not defined"},
        {[](R r, S s) { r.write = failWrite, s->write("x", 1, 1); }, fails, "Error writing file"},
        {[](R r, S s) { r.remove = nullptr, s->removeFile(); }, undefined,
         "remove proc not defined"},
        {[](R r, S s) { r.remove = failOne, s->removeFile(); }, undefined, "Error removing file"},
        {[](R r, S s) { r.close = nullptr, s->close(); }, undefined,
         "close or remove proc not defined"},
        {[](R r, S s) { r.close = failClose, s->close(); }, fails, "Error closing file"},
        {[](R r, S s) { r.open64 = failOpen, s->reOpen(kZYRStreamRead); }, fails,
         "Error opening file"},
    };
    for (const auto& [use, type, message] : procedures) {
        auto s = fx.open(path, kZYRStreamRead | kZYRStreamWrite);
        ASSERT_TRUE(s->isOpen());
        expectError([&] { use(fx.record_, s); }, type, message, kHostSource);
        fx.record_ = ZYRHostKit::posixFileProcs();
    }
    fx.record_.seteof = failSet;
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

TEST_F(FileOperationsTest, CopyRemoveRenameEnumerateAndMap) {
    const std::string a = fx_.dir_.file("a.txt"), b = fx_.dir_.file("b.txt");
    writeFile(a, "alpha");
    EXPECT_TRUE(CZYRFileSys::fileExists(name("a.txt")) && !CZYRFileSys::fileExists(name("b.txt")) &&
                !CZYRFileSys::fileExists(CZYRFileName("")));
    CZYRFileSys::copy(name("a.txt"), name("b.txt"), true);
    writeFile(a, readFile(b) + "beta");
    CZYRFileSys::copy(name("a.txt"), name("b.txt"), false);
    CZYRFileSys::copy(CZYRFileName(""), name("c.txt"), false); // an empty path does nothing
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
    EXPECT_EQ(readFile(a) + readFile(b), "alphabetaalphabeta") << "nothing emptied or replaced";
    EXPECT_FALSE(exists(fx_.dir_.file("c.txt")));
    CZYRFileSys::rename(name("a.txt"), name("c.txt"));
    EXPECT_EQ(std::to_string(exists(a)) + readFile(fx_.dir_.file("c.txt")), "0alphabeta");
    CZYRFileSys::remove(name("c.txt"), false);
    CZYRFileSys::remove(name("c.txt"), true);
    EXPECT_FALSE(exists(fx_.dir_.file("c.txt")));
    EXPECT_TRUE(
        CZYRFileSys::isSameFile(name("x"), name("x")) &&
        !CZYRFileSys::isSameFile(name("x"), CZYRFileName((fx_.dir_.path() + "/./x").c_str())))
        << "texts only, no normalisation";
    for (int twice = 0; twice < 2; ++twice) // the second time it exists: nothing to do
        CZYRFileSys::makeDirectory(name("sub"));
    struct stat st;
    EXPECT_TRUE(::stat(fx_.dir_.file("sub").c_str(), &st) == 0 && S_ISDIR(st.st_mode));
    const std::string root = fx_.dir_.file("tree"), empty = fx_.dir_.file("empty");
    for (const std::string& dir : {root, root + "/inner", empty})
        ::mkdir(dir.c_str(), 0777);
    for (const char* leaf : {"/plain", "/.hidden", "/...", "/locked"}) // "..." is ordinary here
        writeFile(root + leaf, "x");
    ::chmod((root + "/locked").c_str(), 0444);
    Collector first(1), none, ignored;
    for (const std::string& dir : {root, root + "/"}) { // a trailing separator changes nothing
        Collector all;
        EXPECT_TRUE(CZYRFileSys::enumDirectory(CZYRFileName(dir.c_str()), all));
        std::sort(all.entries.begin(), all.entries.end());
        EXPECT_EQ(all.entries, (std::vector<std::pair<std::string, unsigned int>>{
                                   {root + "/...", ZYRFileSys::kZYRFileAttrHidden},
                                   {root + "/.hidden", ZYRFileSys::kZYRFileAttrHidden},
                                   {root + "/inner", ZYRFileSys::kZYRFileAttrDirectory},
                                   {root + "/locked", ZYRFileSys::kZYRFileAttrReadOnly},
                                   {root + "/plain", 0}}));
    }
    EXPECT_FALSE(CZYRFileSys::enumDirectory(CZYRFileName(root.c_str()), first));
    EXPECT_TRUE(CZYRFileSys::enumDirectory(CZYRFileName(empty.c_str()), none));
    EXPECT_EQ(first.entries.size() + none.entries.size(), 1u) << "false stops the enumeration";
    expectOpFailed([&] { CZYRFileSys::enumDirectory(name("missing"), ignored); },
                   "Directory enum failed");
    expectOpFailed([&] { CZYRFileSys::enumDirectory(CZYRFileName(""), ignored); },
                   "Directory create failed empty filename");
    const std::string path = fx_.dir_.file("mapped.bin");
    std::string content(10000, 'a');
    std::iota(content.begin(), content.end(), 'a');
    writeFile(path, content);
    unsigned long long offset = 1;
    unsigned int length = 1;
    char c;
    {
        ZYRStd::CZYRMemMapFStream whole(name("mapped.bin"), kZYRStreamRead, 0, 0);
        std::string back(content.size(), '\0');
        EXPECT_EQ(whole.read(back.data(), 1, 20000), content.size());
        EXPECT_TRUE(whole.isMapped() && whole.getCapacity() == 10000 && back == content);
        expectError([&] { whole.write("x", 1, 1); }, ZYRPublic::kZYRErrorInvalidFuncCall,
                    "stream is not writable", "source/zyr/std/IImpZYRMemStream");
        whole.close();
        expectOpFailed([&] { whole.read(&c, 1, 1); }, "file stm not mapped");
        EXPECT_TRUE(whole.getSize() == 0 && !whole.getMapAttributes(offset, length) && length == 0);
        whole.reOpen(kZYRStreamRead);
        EXPECT_TRUE(whole.read(&c, 1, 1) == 1 && c == 'a') << "mapped again on reOpen";
    }
    {
        // Not on a page boundary: the stream starts at the requested byte anyway.
        ZYRStd::CZYRMemMapFStream window(name("mapped.bin"), kZYRStreamRead, 4099, 100);
        const char* base = static_cast<const char*>(window.getMapAttributes(offset, length));
        EXPECT_EQ(std::pair(offset, length), std::pair(4099ull, 100u));
        EXPECT_EQ(std::string(base, 100), content.substr(4099, 100));
        ASSERT_EQ(::truncate(path.c_str(), 4099 + 10), 0);
        EXPECT_EQ(window.getSize(), 10u) << "only what is left of a file that shrank";
    }
    expectOpFailed(
        [&] { ZYRStd::CZYRMemMapFStream past(name("mapped.bin"), kZYRStreamRead, 4050, 100); },
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

// Names in several scripts, and bytes that are not UTF-8 (a lone byte, an overlong form, an
// encoded surrogate, a cut sequence, a lead byte past U+10FFFF), open and round-trip.
TEST_F(FileOperationsTest, PathsAreBytesAndEveryNameRoundTrips) {
    EXPECT_TRUE(ZYRHostKit::utf8ToUTF16("d\xc3\xa9j\xc3\xa0\xf0\x9f\x98\x80\xff") ==
                ZYRStd::CZYRWString(u"d\u00e9j\u00e0\U0001F600\xDCFF"));
    const std::string names[] = {"d\xc3\xa9j\xc3\xa0",       "\xce\x95\xce\xbb\xce\xbb",
                                 "\xe6\x97\xa5\xe6\x9c\xac", "\xf0\x9f\x98\x80 smile",
                                 "latin1 \xe9t\xe9",         "\xc0\xaf overlong",
                                 "\xed\xa0\x80 surrogate",   "cut \xe2\x82",
                                 "\xf5\x80\x80\x80 beyond"};
    const std::string dir = fx_.dir_.file("names");
    CZYRFileSys::makeDirectory(CZYRFileName(dir.c_str()));
    for (const std::string& leaf : names) {
        const std::string path = dir + "/" + leaf;
        const ZYRStd::CZYRWString wide = ZYRHostKit::utf8ToUTF16(path.c_str());
        EXPECT_EQ(ZYRFileSys::utf16ToUTF8(wide).c_str(), path);
        {
            CZYRSmartZYRRefPtr<IZYRFStream> out =
                CZYRFileSys::createFileStream(CZYRFileName(wide), kZYRStreamWrite, false);
            out->write(leaf.data(), 1, static_cast<unsigned int>(leaf.size()));
        }
        EXPECT_EQ(readFile(path), leaf) << "created under its own bytes";
    }
    struct Bytes : ZYRFileSys::IDirEnumCBProc {
        bool operator()(const ZYRStd::CZYRUniString& path, unsigned int) override {
            const std::string bytes = ZYRFileSys::nativePathOf(path).c_str();
            found.insert(bytes.substr(bytes.rfind('/') + 1));
            return true;
        }
        std::set<std::string> found;
    } listed;
    EXPECT_TRUE(CZYRFileSys::enumDirectory(CZYRFileName(dir.c_str()), listed));
    EXPECT_EQ(listed.found, std::set<std::string>(std::begin(names), std::end(names)));
}

// A scripted system call: each step is the result of one call (with errno for -1).
std::vector<std::pair<ssize_t, int>> steps;
size_t calls = 0;
ssize_t scripted() {
    if (calls >= steps.size())
        return ADD_FAILURE() << "called again after the script ended", -1;
    return errno = steps[calls].second, steps[calls++].first;
}

// The DI paths and path texts that the host handed out and did not get back yet.
ZYRPublic::_t_ZYRPDLFileSysRec real{};
std::set<void*> outstanding;
template <class T> T* noted(T* p) {
    return p ? outstanding.insert(p), p : p;
}

TEST(CZYRFileSysTest, HostPathFreedAndPosixTransfersRetried) {
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

} // namespace
