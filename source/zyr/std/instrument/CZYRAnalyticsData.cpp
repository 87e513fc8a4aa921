// Analytics records: a dictionary of facts that goes to the analytics manager when finalized,
// or nowhere when analytics were inactive at creation.
#include "zyr/std/instrument/CZYRAnalyticsData.h"

#include <type_traits>

#include "zyr/std/config/ZYRStartupOptions.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/ZYRUniqueID.h"
#include "zyr/std/core/internal/ZYRErrorBoundary.h"
#include "zyr/std/instrument/IImpZYRAnalyticsManager.h"
#include "zyr/std/values/CZYRDict.h"

namespace ZYRStd {

namespace {

using namespace ZYRPublic;

constexpr const char* kSource = "source/zyr/std/CZYRAnalyticsData";

[[noreturn]] void raise(eZYRErrorType type, const char* message, int line) {
    throw CZYRError(type, message, kSource, line);
}

class IImp_ZYRAnalyticsData final : public CZYRPublicObject<I_AnalyticsData> {
public:
    explicit IImp_ZYRAnalyticsData(I_Error& err) {
        ZYRErrorBoundaryVoid(err, "Error in IImp_ZYRAnalyticsData constructor", kSource, __LINE__,
                             [&] {
                                 id_ = createUniqueID();
                                 // Captured once: later changes of the setting do not
                                 // reach records already made.
                                 enabled_ = ZYRIsAnalyticsActive();
                                 contents_ = createDict(err);
                             });
    }
    ~IImp_ZYRAnalyticsData() override {
        if (contents_)
            contents_->release();
    }

    uint64_t getUniqueID() const override { return id_; }

    void set(I_UniString* key, I_UniString* value, I_Error& err) override {
        store(key, value, err);
    }
    void set(I_UniString* key, double value, I_Error& err) override { store(key, value, err); }
    void set(I_UniString* key, unsigned int value, I_Error& err) override {
        store(key, value, err);
    }
    void set(I_UniString* key, int32_t value, I_Error& err) override { store(key, value, err); }
    void set(I_UniString* key, bool value, I_Error& err) override { store(key, value, err); }

    bool get(I_UniString* key, I_UniString** out, I_Error& err) override {
        return load(key, out, err);
    }
    bool get(I_UniString* key, double* out, I_Error& err) override { return load(key, out, err); }
    bool get(I_UniString* key, unsigned int* out, I_Error& err) override {
        return load(key, out, err);
    }
    bool get(I_UniString* key, int32_t* out, I_Error& err) override { return load(key, out, err); }
    bool get(I_UniString* key, bool* out, I_Error& err) override { return load(key, out, err); }

    bool isAnalyticsEnabled() override { return enabled_; }

    void finalize(I_Error& err) override {
        ZYRErrorBoundaryVoid(
            err, "Error in IImp_ZYRAnalyticsData::finalize", kSource, __LINE__, [&] {
                if (finalized_)
                    return;
                if (enabled_ && !ZYREnqueueAnalyticsRecord(C_SmartPtr<I_AnalyticsData>(this, true)))
                    raise(kZYRErrorInvalidFuncCall, "Analytics Manager not initialized", __LINE__);
                finalized_ = true;
            });
    }
    bool isFinalized(I_Error& err) override { return !err.errorOccurred() && finalized_; }

private:
    template <class T> void store(I_UniString* key, T value, I_Error& err) {
        ZYRErrorBoundaryVoid(err, "Error in IImp_ZYRAnalyticsData::set", kSource, __LINE__, [&] {
            if (!key)
                raise(kZYRErrorBadParam, "Bad argument to IImp_ZYRAnalyticsData::set", __LINE__);
            if (finalized_)
                raise(kZYRErrorFinalized, "Finalized objects can't be modified", __LINE__);
            if (enabled_ && contents_)
                contents_->set(key, value, err);
        });
    }
    template <class T> bool load(I_UniString* key, T* out, I_Error& err) {
        return ZYRErrorBoundary(
            err, false, "Error in IImp_ZYRAnalyticsData::get", kSource, __LINE__,
            [&] { return enabled_ && contents_ && contents_->get(key, out, err); });
    }

    // The finalized flag is written by the filling thread before the record is queued, and
    // read by the worker only after the queue's lock hands the record over.
    bool finalized_ = false;
    uint64_t id_ = 0;
    bool enabled_ = false;
    I_Dict* contents_ = nullptr; // owned
};

[[noreturn]] void nullObject(int line) {
    raise(kZYRErrorInvalidObject, "Null object", line);
}

} // namespace

I_AnalyticsData* createAnalyticsData(ZYRPublic::I_Error& err) {
    return ZYRErrorBoundary<I_AnalyticsData*>(
        err, nullptr, "Error in IImp_ZYRAnalyticsData::create", kSource, __LINE__,
        [&]() -> I_AnalyticsData* {
            C_SmartPtr<I_AnalyticsData> record(new IImp_ZYRAnalyticsData(err), false);
            return err.errorOccurred() ? nullptr : record.detach();
        });
}

CZYRAnalyticsData::CZYRAnalyticsData()
    : CZYRInterfaceValue(throwing([](C_Error& err) { return createAnalyticsData(err); }), false) {}
CZYRAnalyticsData::~CZYRAnalyticsData() = default;

I_AnalyticsData* CZYRAnalyticsData::valid() const {
    if (!impl_)
        nullObject(__LINE__);
    return impl_;
}

void CZYRAnalyticsData::set(const CZYRUniString& key, const CZYRUniString& value) {
    throwing([&](C_Error& err) { valid()->set(key.getImpl(), value.getImpl(), err); });
}
void CZYRAnalyticsData::set(const CZYRUniString& key, unsigned int value) {
    throwing([&](C_Error& err) { valid()->set(key.getImpl(), value, err); });
}
void CZYRAnalyticsData::set(const CZYRUniString& key, int32_t value) {
    throwing([&](C_Error& err) { valid()->set(key.getImpl(), value, err); });
}
void CZYRAnalyticsData::set(const CZYRUniString& key, double value) {
    throwing([&](C_Error& err) { valid()->set(key.getImpl(), value, err); });
}
void CZYRAnalyticsData::set(const CZYRUniString& key, bool value) {
    throwing([&](C_Error& err) { valid()->set(key.getImpl(), value, err); });
}

void CZYRAnalyticsData::finalize() {
    throwing([&](C_Error& err) { valid()->finalize(err); });
}
bool CZYRAnalyticsData::isFinalized() const {
    return throwing([&](C_Error& err) { return valid()->isFinalized(err); });
}
bool CZYRAnalyticsData::isAnalyticsEnabled() const {
    return valid()->isAnalyticsEnabled();
}
unsigned long long CZYRAnalyticsData::getUniqueID() const {
    return valid()->getUniqueID();
}

} // namespace ZYRStd
