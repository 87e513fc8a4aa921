#include <gtest/gtest.h>

#include <optional>

#include "TestSupport.h"
#include "zyr/std/config/ZYRStartupOptions.h"
#include "zyr/std/instrument/CZYRAnalyticsData.h"
#include "zyr/std/instrument/IImpZYRAnalyticsManager.h"

using namespace ZYRStd;
using namespace ZYRPublic;

namespace {

struct ActiveSetting {
    const bool saved = ZYRIsAnalyticsActive();
    explicit ActiveSetting(bool active) { ZYRSetAnalyticsActive(active); }
    ~ActiveSetting() { ZYRSetAnalyticsActive(saved); }
};

std::string upToLine(const std::string& error) {
    return error.substr(0, error.rfind(':'));
}
template <class Call> std::string thrown(Call call) {
    return upToLine(zyrtest::thrown(call));
}
std::string error(int type, const std::string& message) {
    return std::to_string(type) + ": " + message + " (source/zyr/std/CZYRAnalyticsData";
}

unsigned int count(I_AnalyticsData* record, C_Error& err) {
    unsigned int value = 12345;
    return record->get(CZYRUniString("Count").getImpl(), &value, err) ? value : 0;
}

} // namespace

TEST(CZYRAnalyticsDataTest, DisabledRecordAcceptsAndDropsValues) {
    const ActiveSetting inactive(false);
    ASSERT_EQ(GetZYRAnalyticsManager(), nullptr);
    CZYRAnalyticsData record;
    EXPECT_FALSE(record.isAnalyticsEnabled());
    record.set(CZYRUniString("Count"), 3u);
    record.set(CZYRUniString("Name"), CZYRUniString("value"));
    C_Error err;
    EXPECT_TRUE(count(record.getImpl(), err) == 0 && !err.errorOccurred());
    record.finalize();
    EXPECT_EQ(thrown([&] { record.set(CZYRUniString("Count"), 4u); }),
              error(kZYRErrorFinalized, "Finalized objects can't be modified"));
    record.finalize();
    EXPECT_TRUE(record.isFinalized()) << "a second finalize is harmless";
}

TEST(CZYRAnalyticsDataTest, EnabledRecordKeepsTypedValuesUntilFinalizeFails) {
    const ActiveSetting active(true);
    ASSERT_EQ(GetZYRAnalyticsManager(), nullptr);
    CZYRAnalyticsData record;
    EXPECT_TRUE(record.isAnalyticsEnabled());
    record.set(CZYRUniString("Count"), 7u);
    record.set(CZYRUniString("Name"), CZYRUniString("Acme"));
    I_AnalyticsData* impl = record.getImpl();
    C_Error err;
    EXPECT_EQ(count(impl, err), 7u);
    I_UniString* name = nullptr;
    int32_t delta = 0;
    double time = 0;
    EXPECT_TRUE(impl->get(CZYRUniString("Name").getImpl(), &name, err));
    EXPECT_TRUE(CZYRUniString(name, false) == CZYRUniString("Acme") &&
                !impl->get(CZYRUniString("Missing").getImpl(), &delta, err) &&
                !err.errorOccurred());
    EXPECT_FALSE(impl->get(CZYRUniString("Count").getImpl(), &time, err));
    EXPECT_TRUE(err.getError() == kZYRErrorTypeCheck && count(impl, err) == 0u);
    impl->set(CZYRUniString("Other").getImpl(), 1u, err);
    C_Error fresh;
    EXPECT_FALSE(impl->get(CZYRUniString("Other").getImpl(), &delta, fresh));

    EXPECT_EQ(thrown([&] { record.finalize(); }),
              error(kZYRErrorInvalidFuncCall, "Analytics Manager not initialized"));
    EXPECT_FALSE(record.isFinalized());
    record.set(CZYRUniString("Count"), 2u);
    impl->finalize(fresh);
    EXPECT_TRUE(fresh.getError() == kZYRErrorInvalidFuncCall && !impl->isFinalized(fresh));
}

TEST(CZYRAnalyticsDataTest, EnabledFlagIsCapturedAtCreation) {
    std::optional<CZYRAnalyticsData> before;
    {
        const ActiveSetting inactive(false);
        before.emplace();
        const ActiveSetting active(true);
        EXPECT_FALSE(before->isAnalyticsEnabled()) << "activating later does not enable it";
        CZYRAnalyticsData after;
        ZYRSetAnalyticsActive(false);
        EXPECT_TRUE(after.isAnalyticsEnabled()) << "deactivating later does not disable it";
    }
    before->finalize(); // disabled: no manager needed
}

TEST(CZYRAnalyticsDataTest, BadArgumentsAndInvalidWrappers) {
    const ActiveSetting active(true);
    CZYRAnalyticsData record;
    C_Error err;
    record.getImpl()->set(nullptr, 1u, err);
    EXPECT_EQ(upToLine(zyrtest::describe(err)),
              error(kZYRErrorBadParam, "Bad argument to IImp_ZYRAnalyticsData::set"));
    EXPECT_EQ(createAnalyticsData(err), nullptr) << "a status holding an error gets no record";

    CZYRAnalyticsData invalid(nullptr, false);
    const std::string null = error(kZYRErrorInvalidObject, "Null object");
    EXPECT_EQ(thrown([&] { invalid.set(CZYRUniString("k"), 1u); }), null);
    EXPECT_EQ(thrown([&] { invalid.finalize(); }), null);
    EXPECT_EQ(thrown([&] { (void)invalid.isFinalized(); }), null);
    EXPECT_EQ(thrown([&] { (void)invalid.getUniqueID(); }), null);

    CZYRAnalyticsData copy = record;
    EXPECT_TRUE(copy.getImpl() == record.getImpl() && record.getImpl()->debugGetRefCount() == 2u &&
                CZYRAnalyticsData().getUniqueID() != record.getUniqueID());
    EXPECT_EQ(CZYRAnalyticsData(C_SmartPtr<I_AnalyticsData>(record)).getImpl(), record.getImpl());
}
