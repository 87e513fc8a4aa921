#include <gtest/gtest.h>

#include <optional>

#include "TestSupport.h"
#include "zyr/std/config/ZYRStartupOptions.h"
#include "zyr/std/instrument/CZYRAnalyticsData.h"
#include "zyr/std/instrument/IImpZYRAnalyticsManager.h"

using namespace ZYRStd;
using namespace ZYRPublic;

namespace {

// The error without its line: "TYPE: MESSAGE (SOURCE".
template <class Call> std::string thrown(Call call) {
    const std::string error = zyrtest::thrown(call);
    return error.substr(0, error.rfind(':'));
}
std::string error(int type, const std::string& message) {
    return std::to_string(type) + ": " + message + " (source/zyr/std/CZYRAnalyticsData";
}

} // namespace

// Without a manager: a disabled record drops its values and finalizes; an enabled one keeps
// typed values and cannot be finalized. Whether a record is enabled is fixed at creation.
TEST(CZYRAnalyticsDataTest, RecordsWithoutAManager) {
    ASSERT_EQ(GetZYRAnalyticsManager(), nullptr);
    ZYRSetAnalyticsActive(false);
    std::optional<CZYRAnalyticsData> disabled(std::in_place);
    ZYRSetAnalyticsActive(true);
    CZYRAnalyticsData enabled;
    ZYRSetAnalyticsActive(false);
    EXPECT_TRUE(!disabled->isAnalyticsEnabled() && enabled.isAnalyticsEnabled());
    C_Error err;
    unsigned int count = 12345;
    for (CZYRAnalyticsData* record : {&*disabled, &enabled}) {
        record->set(CZYRUniString("Count"), 7u);
        record->set(CZYRUniString("Name"), CZYRUniString("Acme"));
    }
    I_AnalyticsData* const impl = enabled.getImpl();
    EXPECT_TRUE(!disabled->getImpl()->get(CZYRUniString("Count").getImpl(), &count, err) &&
                impl->get(CZYRUniString("Count").getImpl(), &count, err) && count == 7u);
    I_UniString* name = nullptr;
    int32_t delta = 0;
    double time = 0;
    EXPECT_TRUE(impl->get(CZYRUniString("Name").getImpl(), &name, err) &&
                CZYRUniString(name, false) == CZYRUniString("Acme"));
    EXPECT_TRUE(!impl->get(CZYRUniString("Missing").getImpl(), &delta, err) &&
                !err.errorOccurred());
    EXPECT_FALSE(impl->get(CZYRUniString("Count").getImpl(), &time, err));
    EXPECT_TRUE(err.getError() == kZYRErrorTypeCheck &&
                !impl->get(CZYRUniString("Count").getImpl(), &count, err))
        << "a status holding an error gets nothing";
    EXPECT_EQ(createAnalyticsData(err), nullptr);

    disabled->finalize();
    disabled->finalize();
    EXPECT_TRUE(disabled->isFinalized()) << "a second finalize is harmless";
    EXPECT_EQ(thrown([&] { disabled->set(CZYRUniString("Count"), 4u); }),
              error(kZYRErrorFinalized, "Finalized objects can't be modified"));
    EXPECT_EQ(thrown([&] { enabled.finalize(); }),
              error(kZYRErrorInvalidFuncCall, "Analytics Manager not initialized"));
    EXPECT_FALSE(enabled.isFinalized());
    enabled.set(CZYRUniString("Count"), 2u);
    C_Error fresh;
    impl->set(nullptr, 1u, fresh);
    const std::string bad = zyrtest::describe(fresh);
    EXPECT_EQ(bad.substr(0, bad.rfind(':')),
              error(kZYRErrorBadParam, "Bad argument to IImp_ZYRAnalyticsData::set"));
}

TEST(CZYRAnalyticsDataTest, NullWrapperAndSharing) {
    const CZYRAnalyticsData record;
    CZYRAnalyticsData invalid(nullptr, false);
    const std::string null = error(kZYRErrorInvalidObject, "Null object");
    EXPECT_EQ(thrown([&] { invalid.set(CZYRUniString("k"), 1u); }), null);
    EXPECT_EQ(thrown([&] { (void)invalid.getUniqueID(); }), null);
    EXPECT_TRUE(CZYRAnalyticsData(C_SmartPtr<I_AnalyticsData>(record)).getImpl() ==
                    record.getImpl() &&
                CZYRAnalyticsData().getUniqueID() != record.getUniqueID());
}
