// Resource directories: the directory list with and without a fonts directory, reference
// directories, the numbered cache list names, both forms, and failing allocations.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "TestSupport.h"
#include "zyr/std/config/ZYRResourceDirs.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/values/CZYRDict.h"
#include "zyr/std/values/CZYRString.h"

using namespace ZYRStd;

namespace {

const std::u16string kNull = u"<null>";

std::u16string text(const unsigned short* path) {
    if (!path)
        return kNull;
    std::u16string out;
    for (; *path; ++path)
        out += static_cast<char16_t>(*path);
    return out;
}

std::u16string text(const CZYRUniString& s) {
    const CZYRWString wide(s);
    return std::u16string(wide.c_str(), wide.length());
}

// The first `count` entries as texts; frees the list and its entries.
std::vector<std::u16string> takeList(unsigned short** list, unsigned int count) {
    std::vector<std::u16string> out;
    if (!list)
        return out;
    for (unsigned int i = 0; i < count; ++i) {
        out.push_back(text(list[i]));
        ZYRFree(list[i]);
    }
    ZYRFree(list);
    return out;
}

std::u16string takeText(unsigned short* path) {
    std::u16string out = text(path);
    ZYRFree(path);
    return out;
}

CZYRDict withReferences() {
    CZYRArray references;
    references.set(0, CZYRUniString("/usr/share/fonts"));
    references.set(1, int32_t{5});
    references.set(2, CZYRUniString("file:///tmp/a%20b"));
    references.set(3, CZYRUniString(""));
    references.set(4, CZYRUniString("file:///C:/Fonts"));
    CZYRDict options;
    options.set(CZYRUniString("ReferenceFontDir"), references);
    return options;
}

const std::vector<std::u16string> kRelative = {u"ZYRFonts/TUMA/10.0/CMaps",
                                               u"ZYRFonts/Fonts/Reqrd/CMaps", u"ZYRFonts/Fonts"};
const std::vector<std::u16string> kUnderR = {u"C:/R/TUMA/10.0/CMaps", u"C:/R/Fonts/Reqrd/CMaps",
                                             u"C:/R/Fonts"};

} // namespace

// One sequence: the directories and the list number are process-wide.
TEST(ZYRResourceDirsTest, DirectoryListsAndCacheNames) {
    EXPECT_FALSE(ZYRFontCacheDirExist());
    EXPECT_EQ(text(ZYRGetFontCacheDir()), u"");

    // Without fonts and cache directories: the relative directories, no cache file.
    unsigned short** list = nullptr;
    auto* const untouched = reinterpret_cast<unsigned short*>(0x1);
    unsigned short* cacheFile = untouched;
    unsigned int count = 5;
    ZYRSetDirListAndCacheFileList(CZYRDict(), list, cacheFile, count);
    EXPECT_EQ(count, 8u) << "count grows by the entries stored";
    EXPECT_EQ(cacheFile, untouched);
    EXPECT_EQ(ZYRMemSize(list), 3 * sizeof(unsigned short*));
    EXPECT_EQ(takeList(list, 3), kRelative) << "entries start at dirList[0]";

    ZYRSetZYRFontsDir(u"C:/R/");
    count = 0;
    ZYRSetDirListAndCacheFileList(CZYRDict(), list, cacheFile, count);
    ASSERT_EQ(count, 3u);
    EXPECT_EQ(takeList(list, count), kUnderR);

    // Reference directories: paths and file URLs, a null slot for a non-string, and what
    // the URL conversion makes of an empty text (an empty path); n + 3 slots.
    ZYRSetFontCacheDir(u"/cache");
    EXPECT_TRUE(ZYRFontCacheDirExist());
    EXPECT_EQ(text(ZYRGetFontCacheDir()), u"/cache");
    count = 0;
    ZYRSetDirListAndCacheFileList(withReferences(), list, cacheFile, count);
    ASSERT_EQ(count, 8u);
    EXPECT_EQ(ZYRMemSize(list), 8 * sizeof(unsigned short*));
    std::vector<std::u16string> expected = kUnderR;
    expected.insert(expected.end(), {u"/usr/share/fonts", kNull, u"/tmp/a b", u"", u"C:/Fonts"});
    EXPECT_EQ(takeList(list, count), expected);
    // The numbering is process-wide, and other tests may have drawn names already: the
    // first names of a process are checked in a fresh one below.
    const std::u16string first = takeText(cacheFile);
    ASSERT_EQ(first.rfind(u"/cache/OrmunFnt14_VELT_", 0), 0u);
    const int firstNumber = std::stoi(std::string(first.begin() + 23, first.end() - 4));
    EXPECT_GE(firstNumber, 1001);
    auto nthName = [&](int n) {
        const std::string digits = std::to_string(firstNumber + n);
        return u"/cache/OrmunFnt14_VELT_" + std::u16string(digits.begin(), digits.end()) + u".lst";
    };
    count = 0;
    ZYRSetDirListAndCacheFileList(CZYRDict(), list, cacheFile, count);
    takeList(list, count);
    EXPECT_EQ(takeText(cacheFile), nthName(1));

    EXPECT_EQ(text(ZYRGetSystemCacheFile()), u"/cache/OrmunFnt14_sys.lst");
    EXPECT_EQ(text(ZYRGetCommonCacheFile()), u"/cache/OrmunFnt14_com.lst");
    EXPECT_EQ(text(ZYRGetCmapCacheFile()), u"/cache/OrmunFnt14_Cmap.lst");

    // The interface form: the count as its result, and four list names.
    unsigned short** names = nullptr;
    const C_SmartPtr<I_Dict> options = withReferences();
    ASSERT_EQ(ZYRSetDirListAndCacheFileList(options, list, names), 8);
    EXPECT_EQ(takeList(list, 8), expected);
    ASSERT_NE(names, nullptr);
    EXPECT_EQ(names[4], nullptr);
    EXPECT_EQ(
        takeList(names, 4),
        (std::vector<std::u16string>{nthName(2), u"/cache/OrmunFnt14_sys.lst",
                                     u"/cache/OrmunFnt14_com.lst", u"/cache/OrmunFnt14_Cmap.lst"}));
    ASSERT_EQ(ZYRSetDirListAndCacheFileList(C_SmartPtr<I_Dict>(), list, names), 3);
    takeList(list, 3);
    takeList(names, 4);

    // Null or empty texts unset the directories again.
    ZYRSetZYRFontsDir(u"");
    ZYRSetFontCacheDir(nullptr);
    EXPECT_FALSE(ZYRFontCacheDirExist());
    names = nullptr;
    ASSERT_EQ(ZYRSetDirListAndCacheFileList(C_SmartPtr<I_Dict>(), list, names), 3);
    EXPECT_EQ(takeList(list, 3), kRelative);
    EXPECT_EQ(names, nullptr) << "no cache directory, no names";

    // The ICC directory is the caller's text; the temporary directory is a copy.
    EXPECT_FALSE(ZYRGetIccProfileDir().isValid());
    const char16_t icc[] = u"/profiles";
    ZYRSetIccProfileDir(icc);
    EXPECT_EQ(text(ZYRGetIccProfileDir()), u"/profiles");
    ZYRSetTempDirectory(CZYRUniString("/tmp/zyr work"));
    EXPECT_EQ(ZYRGetTempDirectory(), "/tmp/zyr work");
}

TEST(ZYRResourceDirsTest, FirstCacheNamesOfAProcessAre1001And1002) {
    // The death-test child runs only this statement, so its counter is untouched.
    EXPECT_EXIT(
        {
            ZYRSetFontCacheDir(u"/cache");
            unsigned short** list = nullptr;
            unsigned short* cacheFile = nullptr;
            unsigned int count = 0;
            ZYRSetDirListAndCacheFileList(CZYRDict(), list, cacheFile, count);
            takeList(list, count);
            const bool first = takeText(cacheFile) == u"/cache/OrmunFnt14_VELT_1001.lst";
            count = 0;
            ZYRSetDirListAndCacheFileList(CZYRDict(), list, cacheFile, count);
            takeList(list, count);
            const bool second = takeText(cacheFile) == u"/cache/OrmunFnt14_VELT_1002.lst";
            std::exit(first && second ? 0 : 1);
        },
        ::testing::ExitedWithCode(0), "");
}

// Whichever allocation fails, the call either throws or hands out what it built, and
// nothing is lost.
TEST(ZYRResourceDirsTest, EveryAllocationMayFail) {
    zyrtest::FailingHost host;
    tZYRMemMgr record = host.record();
    zyrtest::installFront(1, &record);
    ZYRSetZYRFontsDir(u"/fonts/");
    ZYRSetFontCacheDir(u"/cache");
    {
        const CZYRDict options = withReferences();
        const auto run = [&] {
            unsigned short** list = nullptr;
            unsigned short* cacheFile = nullptr;
            unsigned int count = 0;
            try {
                ZYRSetDirListAndCacheFileList(options, list, cacheFile, count);
            } catch (const CZYRError& e) {
                EXPECT_EQ(list, nullptr) << "a failed call hands nothing out";
                EXPECT_EQ(cacheFile, nullptr);
                EXPECT_EQ(count, 0u);
                return false;
            }
            takeList(list, count);
            ZYRFree(cacheFile);
            return true;
        };
        run();
        const unsigned long long baseline = GetMemUsage();
        host.calls = 0;
        ASSERT_TRUE(run());
        const unsigned int calls = host.calls;
        ASSERT_GT(calls, 5u);
        unsigned int failures = 0;
        for (unsigned int failing = 1; failing <= calls; ++failing) {
            host.calls = 0;
            host.failAt = failing;
            failures += !run();
            host.failAt = 0;
            ASSERT_EQ(GetMemUsage(), baseline) << "allocation " << failing << " failed";
        }
        EXPECT_GT(failures, 0u);

        // The interface form reports the same failures as -1.
        const C_SmartPtr<I_Dict> dict = options;
        for (unsigned int failing = 1; failing <= calls + 6; ++failing) {
            unsigned short** list = nullptr;
            unsigned short** names = nullptr;
            host.calls = 0;
            host.failAt = failing;
            const int32_t stored = ZYRSetDirListAndCacheFileList(dict, list, names);
            host.failAt = 0;
            if (stored < 0) {
                EXPECT_EQ(list, nullptr);
                EXPECT_EQ(names, nullptr);
            } else {
                takeList(list, static_cast<unsigned int>(stored));
                takeList(names, 4);
            }
            ASSERT_EQ(GetMemUsage(), baseline) << "allocation " << failing << " failed";
        }
    }
    ZYRSetZYRFontsDir(nullptr);
    ZYRSetFontCacheDir(nullptr);
    zyrtest::installFront(0);
}
