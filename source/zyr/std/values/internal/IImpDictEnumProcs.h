// The adapter that hands an interface enumeration to the wrapper callbacks of
// CZYRDictEnumProcs. Internal to the dictionary sources.
#pragma once

#include "zyr/std/core/internal/ZYRErrorBoundary.h"
#include "zyr/std/values/internal/CZYRValue.h"

namespace ZYRStd::value_detail {

class IImpDictEnumProcs final : public I_DictEnumProcs {
public:
    explicit IImpDictEnumProcs(CZYRDictEnumProcs* procs) : procs_(procs) {}

    bool enumProc(I_UniString* key, I_DataBuffer* value, I_Error& err) override {
        return complex(key, err,
                       [&] { return procs_->enumProc(wrap(key), CZYRDataBuffer(value, true)); });
    }
    bool enumProc(I_UniString* key, I_Array* value, I_Error& err) override {
        return complex(key, err,
                       [&] { return procs_->enumProc(wrap(key), CZYRArray(value, true)); });
    }
    bool enumProc(I_UniString* key, I_Dict* value, I_Error& err) override {
        return complex(key, err,
                       [&] { return procs_->enumProc(wrap(key), CZYRDict(value, true)); });
    }
    bool enumProc(I_UniString* key, I_UniString* value, I_Error& err) override {
        return complex(key, err,
                       [&] { return procs_->enumProc(wrap(key), CZYRUniString(value, true)); });
    }
    bool enumProc(I_UniString* key, bool value, I_Error& err) override {
        return simple(key, err, [&] { return procs_->enumProc(wrap(key), value); });
    }
    bool enumProc(I_UniString* key, double value, I_Error& err) override {
        return simple(key, err, [&] { return procs_->enumProc(wrap(key), value); });
    }
    bool enumProc(I_UniString* key, unsigned int value, I_Error& err) override {
        return simple(key, err, [&] { return procs_->enumProc(wrap(key), value); });
    }
    bool enumProc(I_UniString* key, int32_t value, I_Error& err) override {
        return simple(key, err, [&] { return procs_->enumProc(wrap(key), value); });
    }

private:
    static CZYRUniString wrap(I_UniString* key) { return CZYRUniString(key, true); }

    template <class Call> bool simple(I_UniString* key, I_Error& err, Call call) {
        return ZYRErrorBoundary(
            err, false, "Error in IImpDictEnumProcs::enumProcSimple", kSource, __LINE__, [&] {
                if (!key)
                    raise(kZYRErrorBadParam, "IImpDictEnumProcs::enumProcSimple - Key is NULL",
                          __LINE__);
                if (!procs_)
                    raise(kZYRErrorBadParam,
                          "IImpDictEnumProcs::enumProcSimple - callbacks are "
                          "Null",
                          __LINE__);
                return call();
            });
    }

    template <class Call> bool complex(I_UniString* key, I_Error& err, Call call) {
        return ZYRErrorBoundary(
            err, false, "Error in IImpDictEnumProcs::enumProcComplex", kSource, __LINE__, [&] {
                if (!key)
                    raise(kZYRErrorBadParam, "IImpDictEnumProcs::enumProcComplex - Key is NULL",
                          __LINE__);
                if (!procs_)
                    raise(kZYRErrorBadParam,
                          "IImpDictEnumProcs::enumProcComplex - callbacks are "
                          "Null",
                          __LINE__);
                return call();
            });
    }

    CZYRDictEnumProcs* procs_;
};

} // namespace ZYRStd::value_detail
