// Arrays of typed values, and their value wrapper.
#include "zyr/std/values/CZYRArray.h"

#include <utility>
#include <vector>

#include "zyr/std/core/CZYRSmartPtr.h"
#include "zyr/std/core/internal/ZYRErrorBoundary.h"
#include "zyr/std/memory/CZYRStdAllocator.h"
#include "zyr/std/values/internal/CZYRValue.h"

namespace ZYRStd {

namespace {
using namespace value_detail;

// ---- array --------------------------------------------------------------------------------

class IImp_ZYRArray final : public ContainerBase<I_Array> {
public:
    void set(unsigned int i, I_DataBuffer* value, I_Error& err) override { store(i, value, err); }
    void set(unsigned int i, I_Array* value, I_Error& err) override { store(i, value, err); }
    void set(unsigned int i, I_Dict* value, I_Error& err) override { store(i, value, err); }
    void set(unsigned int i, I_UniString* value, I_Error& err) override { store(i, value, err); }
    void set(unsigned int i, double value, I_Error& err) override { store(i, value, err); }
    void set(unsigned int i, unsigned int value, I_Error& err) override { store(i, value, err); }
    void set(unsigned int i, int32_t value, I_Error& err) override { store(i, value, err); }
    void set(unsigned int i, bool value, I_Error& err) override { store(i, value, err); }

    bool get(unsigned int i, I_DataBuffer** out, I_Error& err) override {
        return load(i, out, err);
    }
    bool get(unsigned int i, I_Array** out, I_Error& err) override { return load(i, out, err); }
    bool get(unsigned int i, I_Dict** out, I_Error& err) override { return load(i, out, err); }
    bool get(unsigned int i, I_UniString** out, I_Error& err) override { return load(i, out, err); }
    bool get(unsigned int i, double* out, I_Error& err) override { return load(i, out, err); }
    bool get(unsigned int i, unsigned int* out, I_Error& err) override { return load(i, out, err); }
    bool get(unsigned int i, int32_t* out, I_Error& err) override { return load(i, out, err); }
    bool get(unsigned int i, bool* out, I_Error& err) override { return load(i, out, err); }

    void insert(unsigned int index, I_Error& err) override {
        ZYRErrorBoundaryVoid(err, "Error in IImp_ZYRArray::insert", kSource, __LINE__, [&] {
            refuseIfFinalized();
            checkIndex(index);
            elements_.insert(elements_.begin() + index, CZYRValue::of(int32_t{0}));
        });
    }

    void remove(unsigned int index, I_Error& err) override {
        ZYRErrorBoundaryVoid(err, "Error in IImp_ZYRArray::remove", kSource, __LINE__, [&] {
            refuseIfFinalized();
            checkIndex(index);
            elements_.erase(elements_.begin() + index);
        });
    }

    unsigned int getLength(I_Error& err) override {
        return err.errorOccurred() ? 0u : static_cast<unsigned int>(elements_.size());
    }

    eZYRValType getType(unsigned int index) override {
        return index < elements_.size() ? elements_[index].tag() : kZYRValTypeNone;
    }

    void finalize(I_Error& err) override {
        ZYRErrorBoundaryVoid(err, "Error in IImp_ZYRArray::finalize", kSource, __LINE__, [&] {
            if (finalized_)
                return;
            const WalkStep step(static_cast<I_Array*>(this));
            for (const CZYRValue& value : elements_) {
                finalizeNested(value, err);
                if (err.errorOccurred())
                    break;
            }
            if (!err.errorOccurred()) // as for dictionaries
                finalized_ = true;
        });
    }

    bool isFinalized(I_Error& err) override { return !err.errorOccurred() && finalized_; }

    I_Array* clone(I_Error& err) override {
        return ZYRErrorBoundary<I_Array*>(
            err, nullptr, "Error in IImp_ZYRArray::clone", kSource, __LINE__, [&]() -> I_Array* {
                const WalkStep step(static_cast<I_Array*>(this));
                C_SmartPtr<IImp_ZYRArray> copy(new IImp_ZYRArray, false);
                for (size_t i = 0; i < elements_.size() && !err.errorOccurred(); ++i)
                    cloneValue(elements_[i], err, [&](const CZYRValue& v) {
                        copy->put(static_cast<unsigned int>(i), v);
                    });
                return err.errorOccurred() ? nullptr : copy.detach();
            });
    }

private:
    void checkIndex(unsigned int index) const {
        if (index >= elements_.size())
            raise(kZYRErrorLimitCheck, "Index is out of range", __LINE__);
    }

    void put(unsigned int index, const CZYRValue& value) {
        if (index >= elements_.size())
            elements_.resize(size_t{index} + 1);
        elements_[index] = value;
    }

    template <class T> void store(unsigned int index, T value, I_Error& err) {
        ZYRErrorBoundaryVoid(err, "Error in IImp_ZYRArray::set", kSource, __LINE__, [&] {
            refuseIfFinalized();
            put(index, CZYRValue::of(value));
        });
    }

    template <class T> bool load(unsigned int index, T* out, I_Error& err) {
        return ZYRErrorBoundary(err, false, "Error in IImp_ZYRArray::get", kSource, __LINE__, [&] {
            if (!out)
                raise(kZYRErrorBadParam, "Bad argument to IImp_ZYRArray::get", __LINE__);
            if (index >= elements_.size() || elements_[index].tag() == kZYRValTypeNone)
                return false;
            readValue(elements_[index], out);
            return !err.errorOccurred();
        });
    }

    std::vector<CZYRValue, CZYRStdAllocator<CZYRValue>> elements_;
};

} // namespace

I_Array* createArray(ZYRPublic::I_Error& err) {
    return ZYRErrorBoundary<I_Array*>(err, nullptr, "Error in ZYRStd::createArray", kSource,
                                      __LINE__, []() -> I_Array* { return new IImp_ZYRArray; });
}

// ---- CZYRArray ----------------------------------------------------------------------------

CZYRArray::CZYRArray()
    : CZYRInterfaceValue(throwing([](C_Error& err) { return createArray(err); }), false) {}
CZYRArray::~CZYRArray() = default;

I_Array* CZYRArray::valid() const {
    if (!impl_)
        nullObject(__LINE__);
    return impl_;
}

void CZYRArray::set(unsigned int index, const CZYRUniString& value) {
    throwing([&](C_Error& err) { valid()->set(index, value.getImpl(), err); });
}
void CZYRArray::set(unsigned int index, const CZYRDict& value) {
    throwing([&](C_Error& err) { valid()->set(index, value.getImpl(), err); });
}
void CZYRArray::set(unsigned int index, const CZYRArray& value) {
    throwing([&](C_Error& err) { valid()->set(index, value.getImpl(), err); });
}
void CZYRArray::set(unsigned int index, const CZYRDataBuffer& value) {
    throwing([&](C_Error& err) { valid()->set(index, value.getImpl(), err); });
}
void CZYRArray::set(unsigned int index, unsigned int value) {
    throwing([&](C_Error& err) { valid()->set(index, value, err); });
}
void CZYRArray::set(unsigned int index, int32_t value) {
    throwing([&](C_Error& err) { valid()->set(index, value, err); });
}
void CZYRArray::set(unsigned int index, double value) {
    throwing([&](C_Error& err) { valid()->set(index, value, err); });
}
void CZYRArray::set(unsigned int index, bool value) {
    throwing([&](C_Error& err) { valid()->set(index, value, err); });
}
void CZYRArray::insert(unsigned int index) {
    throwing([&](C_Error& err) { valid()->insert(index, err); });
}
void CZYRArray::remove(unsigned int index) {
    throwing([&](C_Error& err) { valid()->remove(index, err); });
}

bool CZYRArray::get(unsigned int index, CZYRDict& out, bool throwIfMissing) const {
    return getObject<CZYRDict, I_Dict>(valid(), index, out, throwIfMissing);
}
bool CZYRArray::get(unsigned int index, CZYRUniString& out, bool throwIfMissing) const {
    return getObject<CZYRUniString, I_UniString>(valid(), index, out, throwIfMissing);
}
bool CZYRArray::get(unsigned int index, CZYRArray& out, bool throwIfMissing) const {
    return getObject<CZYRArray, I_Array>(valid(), index, out, throwIfMissing);
}
bool CZYRArray::get(unsigned int index, CZYRDataBuffer& out, bool throwIfMissing) const {
    return getObject<CZYRDataBuffer, I_DataBuffer>(valid(), index, out, throwIfMissing);
}
bool CZYRArray::get(unsigned int index, unsigned int* out, bool throwIfMissing) const {
    return getScalar(valid(), index, out, throwIfMissing);
}
bool CZYRArray::get(unsigned int index, int32_t* out, bool throwIfMissing) const {
    return getScalar(valid(), index, out, throwIfMissing);
}
bool CZYRArray::get(unsigned int index, double* out, bool throwIfMissing) const {
    return getScalar(valid(), index, out, throwIfMissing);
}
bool CZYRArray::get(unsigned int index, bool* out, bool throwIfMissing) const {
    return getScalar(valid(), index, out, throwIfMissing);
}

unsigned int CZYRArray::getLength() const {
    return throwing([&](C_Error& err) { return valid()->getLength(err); });
}
eZYRValType CZYRArray::getType(unsigned int index) const {
    return valid()->getType(index);
}
void CZYRArray::finalize() {
    throwing([&](C_Error& err) { valid()->finalize(err); });
}
bool CZYRArray::isFinalized() const {
    return throwing([&](C_Error& err) { return valid()->isFinalized(err); });
}
CZYRArray CZYRArray::clone() const {
    return CZYRArray(throwing([&](C_Error& err) { return valid()->clone(err); }), false);
}
unsigned long long CZYRArray::getUniqueID() const {
    return valid()->getUniqueID();
}

CZYRDictEnumProcs::~CZYRDictEnumProcs() = default;

} // namespace ZYRStd
