// Immutable byte buffers.
#include "zyr/std/values/CZYRDataBuffer.h"

#include <utility>

#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/CZYRSmartPtr.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/ZYRUniqueID.h"
#include "zyr/std/core/internal/ZYRErrorBoundary.h"

namespace ZYRStd {

namespace {

constexpr const char* kSource = "source/zyr/std/CZYRDataBuffer";

class IImp_ZYRDataBuffer final : public CZYRPublicObject<I_DataBuffer> {
public:
    IImp_ZYRDataBuffer(const char* data, unsigned int length, ZYRPublic::I_Error& err)
        : id_(createUniqueID()) {
        ZYRErrorBoundaryVoid(err, "Error in IImp_ZYRDataBuffer constructor", kSource, __LINE__,
                             [&] {
                                 if (!data || length == 0)
                                     return;
                                 data_ = static_cast<char*>(ZYRSureMalloc(length));
                                 Memcpy(data_, data, length);
                                 length_ = length;
                             });
    }
    ~IImp_ZYRDataBuffer() override { ZYRFree(data_); }

    uint64_t getUniqueID() const override { return id_; }
    const char* getBuffer() const override { return data_; }
    unsigned int getLength() const override { return length_; }

private:
    uint64_t id_;
    char* data_ = nullptr;
    unsigned int length_ = 0;
};

} // namespace

I_DataBuffer* createDataBuffer(const char* data, unsigned int length, ZYRPublic::I_Error& err) {
    return ZYRErrorBoundary<I_DataBuffer*>(
        err, nullptr, "Error in IImp_ZYRDataBuffer::create", kSource, __LINE__,
        [&]() -> I_DataBuffer* { return new IImp_ZYRDataBuffer(data, length, err); });
}

CZYRDataBuffer::CZYRDataBuffer(const char* data, unsigned int length) {
    C_Error err;
    adopt(createDataBuffer(data, length, err));
    if (err.errorOccurred()) {
        adopt(nullptr);
        throwCZYRErrorIfErrorOccurred(err);
    }
}

CZYRDataBuffer::~CZYRDataBuffer() = default;

unsigned long long CZYRDataBuffer::getUniqueID() const {
    if (!impl_)
        throw CZYRError(ZYRPublic::kZYRErrorInvalidObject,
                        "CZYRDataBuffer::getUniqueID invalid object", kSource, __LINE__);
    return impl_->getUniqueID();
}

} // namespace ZYRStd
