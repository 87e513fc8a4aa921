/// \file
/// Analytics records: the factory behind I_AnalyticsData and the value wrapper CZYRAnalyticsData.
#pragma once

#include <cstdint>

#include "C_SmartPtr.h"
#include "I_AnalyticsData.h"
#include "ZYRStdExport.h"
#include "zyr/std/values/CZYRPublicObject.h"
#include "zyr/std/values/CZYRUniString.h"

namespace ZYRStd {

using ZYRPublic::I_AnalyticsData;

/// A new, empty record with one reference for the caller; enabled when analytics are active
/// now. Null when `err` already holds an error or the record cannot be made.
[[nodiscard]] ZYRSTD_API I_AnalyticsData* createAnalyticsData(ZYRPublic::I_Error& err);

/// A shared analytics record; copies share it. Failures are thrown as CZYRError.
class ZYRSTD_API CZYRAnalyticsData : public CZYRInterfaceValue<I_AnalyticsData> {
public:
    CZYRAnalyticsData(); ///< a new record
    CZYRAnalyticsData(const CZYRAnalyticsData& other) = default;
    CZYRAnalyticsData(CZYRAnalyticsData&& other) noexcept = default;
    CZYRAnalyticsData(const C_SmartPtr<I_AnalyticsData>& record)
        : CZYRInterfaceValue(record.get(), true) {}
    CZYRAnalyticsData(I_AnalyticsData* record, bool addRef) : CZYRInterfaceValue(record, addRef) {}
    CZYRAnalyticsData& operator=(const CZYRAnalyticsData& other) = default;
    CZYRAnalyticsData& operator=(CZYRAnalyticsData&& other) noexcept = default;
    ~CZYRAnalyticsData() override;

    void set(const CZYRUniString& key, const CZYRUniString& value);
    void set(const CZYRUniString& key, unsigned int value);
    void set(const CZYRUniString& key, int32_t value);
    void set(const CZYRUniString& key, double value);
    void set(const CZYRUniString& key, bool value);

    void finalize();
    bool isFinalized() const;
    bool isAnalyticsEnabled() const;
    unsigned long long getUniqueID() const;

private:
    I_AnalyticsData* valid() const;
};

} // namespace ZYRStd
