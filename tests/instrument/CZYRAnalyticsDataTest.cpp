// Analytics records: enabled and disabled records, errors of set and finalize, the wrapper.
#include <gtest/gtest.h>

#include <optional>

#include "zyr/std/config/ZYRStartupOptions.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/instrument/CZYRAnalyticsData.h"
#include "zyr/std/instrument/IImpZYRAnalyticsManager.h"

using namespace ZYRStd;
using namespace ZYRPublic;

namespace {

// Sets the process's analytics setting for one test and puts it back afterwards.
class ActiveSetting {
public:
    explicit ActiveSetting(bool active) : saved_(ZYRIsAnalyticsActive()) {
        ZYRSetAnalyticsActive(active);
    }
    ~ActiveSetting() { ZYRSetAnalyticsActive(saved_); }

private:
    bool saved_;
};

template <class Call> void expectThrow(Call call, eZYRErrorType type, const char* message) {
    try {
        call();
        ADD_FAILURE() << "expected " << message;
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), type);
        EXPECT_STREQ(e.getMessage(), message);
        EXPECT_STREQ(e.getSrcFileName(), "source/zyr/std/CZYRAnalyticsData");
    }
}

} // namespace

TEST(CZYRAnalyticsDataTest, DisabledRecordAcceptsAndDropsValues) {
    const ActiveSetting inactive(false);
    ASSERT_EQ(GetZYRAnalyticsManager(), nullptr);
    CZYRAnalyticsData record;
    EXPECT_FALSE(record.isAnalyticsEnabled());
    record.set(CZYRUniString("Name"), CZYRUniString("value"));
    record.set(CZYRUniString("Count"), 3u);
    record.set(CZYRUniString("Delta"), int32_t{-3});
    record.set(CZYRUniString("Time"), 1.5);
    record.set(CZYRUniString("Flag"), true);

    C_Error err;
    unsigned int count = 0;
    EXPECT_FALSE(record.getImpl()->get(CZYRUniString("Count").getImpl(), &count, err));
    EXPECT_FALSE(err.errorOccurred());

    // Nothing goes to a manager, so none is needed.
    record.finalize();
    EXPECT_TRUE(record.isFinalized());
    expectThrow([&] { record.set(CZYRUniString("Count"), 4u); }, kZYRErrorFinalized,
                "Finalized objects can't be modified");
    record.finalize(); // harmless
    EXPECT_TRUE(record.isFinalized());
}

TEST(CZYRAnalyticsDataTest, EnabledRecordKeepsTypedValues) {
    const ActiveSetting active(true);
    CZYRAnalyticsData record;
    EXPECT_TRUE(record.isAnalyticsEnabled());
    record.set(CZYRUniString("Count"), 7u);
    record.set(CZYRUniString("Name"), CZYRUniString("Acme"));
    I_AnalyticsData* impl = record.getImpl();

    C_Error err;
    unsigned int count = 0;
    EXPECT_TRUE(impl->get(CZYRUniString("Count").getImpl(), &count, err));
    EXPECT_EQ(count, 7u);
    I_UniString* name = nullptr;
    EXPECT_TRUE(impl->get(CZYRUniString("Name").getImpl(), &name, err));
    EXPECT_TRUE(CZYRUniString(name, false) == CZYRUniString("Acme"));
    EXPECT_FALSE(impl->get(CZYRUniString("Missing").getImpl(), &count, err));
    EXPECT_FALSE(err.errorOccurred());

    // The contents' type checks apply.
    double wrong = 0;
    EXPECT_FALSE(impl->get(CZYRUniString("Count").getImpl(), &wrong, err));
    EXPECT_EQ(err.getError(), kZYRErrorTypeCheck);
    // A status that already holds an error makes every slot a no-op.
    EXPECT_FALSE(impl->get(CZYRUniString("Count").getImpl(), &count, err));
    impl->set(CZYRUniString("Other").getImpl(), 1u, err);
    C_Error fresh;
    EXPECT_FALSE(impl->get(CZYRUniString("Other").getImpl(), &count, fresh));
}

TEST(CZYRAnalyticsDataTest, FinalizeWithoutManagerFailsAndLeavesRecordOpen) {
    const ActiveSetting active(true);
    ASSERT_EQ(GetZYRAnalyticsManager(), nullptr);
    CZYRAnalyticsData record;
    record.set(CZYRUniString("Count"), 1u);
    expectThrow([&] { record.finalize(); }, kZYRErrorInvalidFuncCall,
                "Analytics Manager not initialized");
    EXPECT_FALSE(record.isFinalized());
    record.set(CZYRUniString("Count"), 2u); // still open

    C_Error err;
    record.getImpl()->finalize(err);
    EXPECT_EQ(err.getError(), kZYRErrorInvalidFuncCall);
    EXPECT_FALSE(record.getImpl()->isFinalized(err)) << "a failed status reads false";
}

TEST(CZYRAnalyticsDataTest, EnabledFlagIsCapturedAtCreation) {
    std::optional<CZYRAnalyticsData> before;
    {
        const ActiveSetting inactive(false);
        before.emplace();
        const ActiveSetting active(true);
        EXPECT_FALSE(before->isAnalyticsEnabled()) << "activating later does not enable it";
        CZYRAnalyticsData after;
        EXPECT_TRUE(after.isAnalyticsEnabled());
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
    EXPECT_EQ(err.getError(), kZYRErrorBadParam);
    EXPECT_STREQ(err.getMessage(), "Bad argument to IImp_ZYRAnalyticsData::set");

    // A status that already holds an error gets no record.
    EXPECT_EQ(createAnalyticsData(err), nullptr);

    CZYRAnalyticsData invalid(nullptr, false);
    expectThrow([&] { invalid.set(CZYRUniString("k"), 1u); }, kZYRErrorInvalidObject,
                "Null object");
    expectThrow([&] { invalid.finalize(); }, kZYRErrorInvalidObject, "Null object");
    expectThrow([&] { (void)invalid.isFinalized(); }, kZYRErrorInvalidObject, "Null object");
    expectThrow([&] { (void)invalid.getUniqueID(); }, kZYRErrorInvalidObject, "Null object");

    // Copies share one record; each record has its own identity.
    CZYRAnalyticsData copy = record;
    EXPECT_EQ(copy.getImpl(), record.getImpl());
    EXPECT_EQ(record.getImpl()->debugGetRefCount(), 2u);
    EXPECT_NE(CZYRAnalyticsData().getUniqueID(), record.getUniqueID());
    const C_SmartPtr<I_AnalyticsData> shared = record;
    EXPECT_EQ(CZYRAnalyticsData(shared).getImpl(), record.getImpl());
}
