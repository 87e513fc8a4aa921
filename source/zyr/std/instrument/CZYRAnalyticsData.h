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
    /// Shares the record: one more reference.
    CZYRAnalyticsData(const CZYRAnalyticsData& other) = default;
    /// Takes over the other's reference.
    CZYRAnalyticsData(CZYRAnalyticsData&& other) noexcept = default;
    /// Shares `record`: one more reference.
    CZYRAnalyticsData(const C_SmartPtr<I_AnalyticsData>& record)
        : CZYRInterfaceValue(record.get(), true) {}
    /// Wraps `record`; `addRef` false adopts the caller's reference.
    CZYRAnalyticsData(I_AnalyticsData* record, bool addRef) : CZYRInterfaceValue(record, addRef) {}
    /// Shares the other's record and releases the one held before.
    CZYRAnalyticsData& operator=(const CZYRAnalyticsData& other) = default;
    /// Takes over the other's reference and releases the one held before.
    CZYRAnalyticsData& operator=(CZYRAnalyticsData&& other) noexcept = default;
    ~CZYRAnalyticsData() override;

    /// Stores `value` under `key` (I_AnalyticsData::set); throws what it records.
    ///@{
    void set(const CZYRUniString& key, const CZYRUniString& value);
    void set(const CZYRUniString& key, unsigned int value);
    void set(const CZYRUniString& key, int32_t value);
    void set(const CZYRUniString& key, double value);
    void set(const CZYRUniString& key, bool value);
    ///@}

    /// Hands the record to the analytics manager (I_AnalyticsData::finalize); throws what it
    /// records.
    void finalize();
    /// True once finalized.
    bool isFinalized() const;
    /// False when the record was made while analytics were inactive.
    bool isAnalyticsEnabled() const;
    /// The record's process-unique identifier.
    unsigned long long getUniqueID() const;

private:
    I_AnalyticsData* valid() const;
};

} // namespace ZYRStd
