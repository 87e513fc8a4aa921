#include <gtest/gtest.h>

#include "TestSupport.h"
#include "zyr/std/config/ZYRResourceDirs.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/values/CZYRDict.h"
#include "zyr/std/values/CZYRString.h"

using namespace ZYRStd;
using Texts = std::vector<std::u16string>;

namespace {

std::u16string text(const unsigned short* path) {
    std::u16string out = path ? u"" : u"<null>";
    for (; path && *path; ++path)
        out += static_cast<char16_t>(*path);
    return out;
}

std::u16string text(const CZYRUniString& s) {
    const CZYRWString wide(s);
    return std::u16string(wide.c_str(), wide.length());
}

Texts take(unsigned short** list, unsigned int count) {
    Texts out;
    for (unsigned int i = 0; list && i < count; ++i) {
        out.push_back(text(list[i]));
        ZYRFree(list[i]);
    }
    ZYRFree(list);
    return out;
}

std::u16string take(unsigned short* path) {
    std::u16string out = text(path);
    ZYRFree(path);
    return out;
}

struct Listed {
    Texts dirs;
    std::u16string cacheFile;
    unsigned int count;
};
Listed list(const CZYRDict& options, unsigned int start = 0) {
    unsigned short** dirs = nullptr;
    unsigned short* cacheFile = nullptr;
    unsigned int count = start;
    ZYRSetDirListAndCacheFileList(options, dirs, cacheFile, count);
    EXPECT_EQ(ZYRMemSize(dirs), (count - start) * sizeof(unsigned short*)) << "n + 3 slots";
    return {take(dirs, count - start), take(cacheFile), count};
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

const Texts kRelative = {u"ZYRFonts/TUMA/10.0/CMaps", u"ZYRFonts/Fonts/Reqrd/CMaps",
                         u"ZYRFonts/Fonts"};
const Texts kUnderR = {u"C:/R/TUMA/10.0/CMaps", u"C:/R/Fonts/Reqrd/CMaps", u"C:/R/Fonts"};

std::u16string numbered(int n) {
    const std::string digits = std::to_string(n);
    return u"/cache/OrmunFnt14_VELT_" + std::u16string(digits.begin(), digits.end()) + u".lst";
}

} // namespace

TEST(ZYRResourceDirsTest, DirectoryListsAndCacheNames) {
    EXPECT_TRUE(!ZYRFontCacheDirExist() && text(ZYRGetFontCacheDir()).empty());
    const Listed plain = list(CZYRDict(), 5);
    EXPECT_EQ(plain.count, 8u) << "count grows by the entries stored";
    EXPECT_EQ(plain.dirs, kRelative) << "entries start at dirList[0]";
    EXPECT_EQ(plain.cacheFile, u"<null>");
    ZYRSetZYRFontsDir(u"C:/R/");
    EXPECT_EQ(list(CZYRDict()).dirs, kUnderR);

    ZYRSetFontCacheDir(u"/cache");
    EXPECT_TRUE(ZYRFontCacheDirExist() && text(ZYRGetFontCacheDir()) == u"/cache");
    Texts expected = kUnderR;
    expected.insert(expected.end(),
                    {u"/usr/share/fonts", u"<null>", u"/tmp/a b", u"", u"C:/Fonts"});
    const Listed references = list(withReferences());
    EXPECT_EQ(references.dirs, expected);
    ASSERT_TRUE(
        zyrtest::startsWith(std::string(references.cacheFile.begin(), references.cacheFile.end()),
                            "/cache/OrmunFnt14_VELT_"));
    const int first =
        std::stoi(std::string(references.cacheFile.begin() + 23, references.cacheFile.end() - 4));
    EXPECT_EQ(references.cacheFile, numbered(first));
    EXPECT_EQ(list(CZYRDict()).cacheFile, numbered(first + 1));
    EXPECT_EQ(text(ZYRGetSystemCacheFile()) + text(ZYRGetCommonCacheFile()) +
                  text(ZYRGetCmapCacheFile()),
              u"/cache/OrmunFnt14_sys.lst/cache/OrmunFnt14_com.lst/cache/OrmunFnt14_Cmap.lst");

    unsigned short** dirs = nullptr;
    unsigned short** names = nullptr;
    ASSERT_EQ(ZYRSetDirListAndCacheFileList(C_SmartPtr<I_Dict>(withReferences()), dirs, names), 8);
    EXPECT_EQ(take(dirs, 8), expected);
    ASSERT_TRUE(names && !names[4]);
    EXPECT_EQ(take(names, 4), (Texts{numbered(first + 2), u"/cache/OrmunFnt14_sys.lst",
                                     u"/cache/OrmunFnt14_com.lst", u"/cache/OrmunFnt14_Cmap.lst"}));

    ZYRSetZYRFontsDir(u"");
    ZYRSetFontCacheDir(nullptr);
    EXPECT_FALSE(ZYRFontCacheDirExist());
    names = nullptr;
    ASSERT_EQ(ZYRSetDirListAndCacheFileList(C_SmartPtr<I_Dict>(), dirs, names), 3);
    EXPECT_EQ(take(dirs, 3), kRelative);
    EXPECT_EQ(names, nullptr) << "no cache directory, no names";

    EXPECT_FALSE(ZYRGetIccProfileDir().isValid());
}

TEST(ZYRResourceDirsTest, FirstCacheNamesOfAProcessAre1001And1002) {
    EXPECT_EXIT(
        {
            ZYRSetFontCacheDir(u"/cache");
            const bool first = list(CZYRDict()).cacheFile == numbered(1001);
            std::exit(first && list(CZYRDict()).cacheFile == numbered(1002) ? 0 : 1);
        },
        ::testing::ExitedWithCode(0), "");
}

TEST(ZYRResourceDirsTest, EveryAllocationMayFail) {
    zyrtest::FailingHost host;
    tZYRMemMgr record = host.record();
    zyrtest::installFront(1, &record);
    ZYRSetZYRFontsDir(u"/fonts/");
    ZYRSetFontCacheDir(u"/cache");
    {
        const CZYRDict options = withReferences();
        unsigned int own = 0;
        const auto run = [&] {
            unsigned short** dirs = nullptr;
            unsigned short* cacheFile = nullptr;
            unsigned int count = 0;
            const std::string error = zyrtest::thrown(
                [&] { ZYRSetDirListAndCacheFileList(options, dirs, cacheFile, count); });
            if (error != "no error") {
                EXPECT_TRUE(zyrtest::startsWith(error, "7: ")) << error;
                own += error == "7: ZYRSetDirListAndCacheFileList out of memory "
                                "(source/zyr/std/ZYRStartupOptions:970)";
                EXPECT_TRUE(!dirs && !cacheFile && count == 0) << "a failed call hands nothing out";
            }
            take(dirs, count);
            ZYRFree(cacheFile);
            return error == "no error";
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
        EXPECT_TRUE(own > 0 && failures > own) << own << " of " << failures;

        unsigned short** dirs = nullptr;
        unsigned short** names = nullptr;
        host.failAll = true;
        EXPECT_EQ(ZYRSetDirListAndCacheFileList(C_SmartPtr<I_Dict>(options), dirs, names), -1);
        host.failAll = false;
        EXPECT_TRUE(!dirs && !names && GetMemUsage() == baseline);
    }
    ZYRSetZYRFontsDir(nullptr);
    ZYRSetFontCacheDir(nullptr);
    zyrtest::installFront(0);
}
