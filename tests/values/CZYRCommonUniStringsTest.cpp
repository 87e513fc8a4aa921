// The common strings table and the dynamic string cache.
#include <gtest/gtest.h>

#include <string>

#include "zyr/std/values/CZYRCommonUniStrings.h"
#include "zyr/std/values/CZYRUniString.h"

using namespace ZYRStd;

namespace {
C_SmartPtr<I_UniString> fresh(const std::u16string& text) {
    C_Error err;
    return C_SmartPtr<I_UniString>(createUniString(text.c_str(), err), false);
}
std::u16string textOf(const C_SmartPtr<I_UniString>& s) {
    unsigned int bytes = 0;
    const char* data = s->getUTF16LEBuffer(&bytes);
    return std::u16string(reinterpret_cast<const char16_t*>(data), bytes / 2);
}
} // namespace

TEST(CZYRCommonUniStringsTest, RowsAccessorsAndLookup) {
    IZYRCommonUniStrings* table = GetCommonUniStrings();
    EXPECT_EQ(textOf(table->GetCachedCommonUniString(0)), u"a");
    EXPECT_EQ(textOf(table->GetCachedCommonUniString(625)), u"TagPrivateData");
    EXPECT_EQ(table->str_TagPrivateData().get(), table->GetCachedCommonUniString(625).get());
    EXPECT_EQ(table->str_ALL().get(), table->GetCachedCommonUniString(36).get());
    EXPECT_NE(table->str_ALL().get(), table->str_All().get());
    try {
        table->GetCachedCommonUniString(626);
        ADD_FAILURE() << "626 has no index";
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), ZYRPublic::kZYRErrorBadParam);
        EXPECT_STREQ(e.getMessage(), "String constant invalid in GetCachedCommonUniString");
    }
    // Every indexed row is found by its own text, and the last rows only by text.
    for (unsigned int row = 0; row < kCommonUniStringAccessors; ++row) {
        const C_SmartPtr<I_UniString> s = table->GetCachedCommonUniString(row);
        ASSERT_EQ(table->findCommonUniString(fresh(textOf(s))).get(), s.get()) << row;
    }
    const C_SmartPtr<I_UniString> slash = fresh(u"/");
    EXPECT_NE(table->findCommonUniString(slash).get(), slash.get());
    const C_SmartPtr<I_UniString> other = fresh(u"not in the table");
    EXPECT_EQ(table->findCommonUniString(other).get(), other.get());
    EXPECT_STREQ(CommonUniStringText(641), "ZYRTemp\\trap");
    EXPECT_STREQ(CommonUniStringText(693), "*");
}

TEST(CZYRCommonUniStringsTest, EveryAccessorAnswersItsOwnRowAndText) {
    IZYRCommonUniStrings* table = GetCommonUniStrings();
    unsigned int row = 0;
    auto check = [&](C_SmartPtr<I_UniString> s, const char* name) {
        EXPECT_EQ(s.get(), table->GetCachedCommonUniString(row).get()) << name << " at row " << row;
        EXPECT_STREQ(CommonUniStringText(row), name);
        const std::string text(name);
        EXPECT_EQ(textOf(s), std::u16string(text.begin(), text.end())) << row;
        ++row;
    };
#define ZYR_COMMON_STRING(Name) check(table->str_##Name(), #Name);
#include "zyr/std/values/CZYRCommonUniStrings.def"
    EXPECT_EQ(row, kCommonUniStringAccessors);
}

TEST(CZYRCommonUniStringsTest, CacheIsBoundedAndLeastRecentlyUsedGoesFirst) {
    ReleaseDynamicUniStringCache();
    InitDynamicUniStringCache();
    std::vector<C_SmartPtr<I_UniString>> first;
    for (int i = 0; i < 101; ++i) {
        first.push_back(fresh(u"entry " + std::u16string(1, char16_t(u'A' + i))));
        EXPECT_EQ(GetUniStringFromDynamicCache(first.back()).get(), first.back().get());
    }
    // Touch entry 0, so that entry 1 is now the least recently used.
    EXPECT_EQ(GetUniStringFromDynamicCache(fresh(textOf(first[0]))).get(), first[0].get());
    GetUniStringFromDynamicCache(fresh(u"the 102nd text"));
    EXPECT_EQ(GetUniStringFromDynamicCache(fresh(textOf(first[0]))).get(), first[0].get());
    const C_SmartPtr<I_UniString> again = fresh(textOf(first[1]));
    EXPECT_EQ(GetUniStringFromDynamicCache(again).get(), again.get()) << "entry 1 was dropped";

    const C_SmartPtr<I_UniString> longText = fresh(std::u16string(261, u'x'));
    GetUniStringFromDynamicCache(longText);
    EXPECT_NE(GetUniStringFromDynamicCache(fresh(textOf(longText))).get(), longText.get());
    const C_SmartPtr<I_UniString> temp = fresh(u"x.tmp");
    GetUniStringFromDynamicCache(temp);
    EXPECT_NE(GetUniStringFromDynamicCache(fresh(u"x.tmp")).get(), temp.get());
    const C_SmartPtr<I_UniString> bare = fresh(u".tmp");
    GetUniStringFromDynamicCache(bare);
    EXPECT_EQ(GetUniStringFromDynamicCache(fresh(u".tmp")).get(), bare.get());

    ReleaseDynamicUniStringCache();
    const C_SmartPtr<I_UniString> uncached = fresh(u".tmp");
    EXPECT_EQ(GetUniStringFromDynamicCache(uncached).get(), uncached.get());
    InitDynamicUniStringCache();
}

TEST(CZYRCommonUniStringsTest, TextConstructorsNeedTheTable) {
    ReleaseCommonUniStrings();
    try {
        CZYRUniString("anything");
        ADD_FAILURE() << "no table yet";
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), ZYRPublic::kZYRErrorInvalidFuncCall);
        EXPECT_STREQ(e.getMessage(), "CommonUniString singleton not initialized");
    }
    InitCommonUniStrings();
    EXPECT_NO_THROW(CZYRUniString("anything"));
}
