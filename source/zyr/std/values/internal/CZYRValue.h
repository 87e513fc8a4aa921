// The value model's shared parts: the stored value variant, the base of both containers,
// the walk guard of finalize and clone, and the helpers of the value wrappers. Internal to
// the dictionary and array sources.
#pragma once

#include <array>
#include <cstdint>
#include <type_traits>
#include <utility>

#include "I_Dict.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/ZYRUniqueID.h"
#include "zyr/std/values/CZYRDataBuffer.h"
#include "zyr/std/values/CZYRDict.h"
#include "zyr/std/values/CZYRPublicObject.h"
#include "zyr/std/values/CZYRUniString.h"

namespace ZYRStd::value_detail {

using ZYRPublic::I_DataBuffer;
using ZYRPublic::I_Error;
using ZYRPublic::I_UniString;
using namespace ZYRPublic;

constexpr const char* kSource = "source/zyr/std/CZYRDict";

[[noreturn]] inline void raise(ZYRPublic::eZYRErrorType type, const char* message, int line) {
    throw CZYRError(type, message, kSource, line);
}

// The type tag and mismatch text of each storable value type.
template <class T> struct ValueKind;
template <> struct ValueKind<bool> {
    static constexpr eZYRValType tag = kZYRValTypeBool;
    static constexpr const char* mismatch = "Value is not a bool";
};
template <> struct ValueKind<int32_t> {
    static constexpr eZYRValType tag = kZYRValTypeInt;
    static constexpr const char* mismatch = "Value is not a int";
};
template <> struct ValueKind<unsigned int> {
    static constexpr eZYRValType tag = kZYRValTypeUInt;
    static constexpr const char* mismatch = "Value is not an unsigned int";
};
template <> struct ValueKind<double> {
    static constexpr eZYRValType tag = kZYRValTypeDouble;
    static constexpr const char* mismatch = "Value is not a double";
};
template <> struct ValueKind<I_UniString*> {
    static constexpr eZYRValType tag = kZYRValTypeString;
    static constexpr const char* mismatch = "Value is not a string";
};
template <> struct ValueKind<I_Dict*> {
    static constexpr eZYRValType tag = kZYRValTypeDict;
    static constexpr const char* mismatch = "Value is not a dict";
};
template <> struct ValueKind<I_Array*> {
    static constexpr eZYRValType tag = kZYRValTypeArray;
    static constexpr const char* mismatch = "Value is not a array";
};
template <> struct ValueKind<I_DataBuffer*> {
    static constexpr eZYRValType tag = kZYRValTypeDataBuffer;
    static constexpr const char* mismatch = "Value is not a data buffer";
};

// Drops one reference of a nested dictionary or array. A container whose last reference
// goes while another one is being torn down on this thread waits until that one is done,
// so a chain of nested containers is freed in a loop instead of one stack frame per level.
void releaseContainer(eZYRValType tag, void* container) noexcept;

// One stored value: a tag and the scalar or the owning object reference it names.
class CZYRValue {
public:
    CZYRValue() = default;
    template <class T> static CZYRValue of(T value) {
        CZYRValue v;
        v.tag_ = ValueKind<T>::tag;
        v.put(value);
        v.addRef();
        return v;
    }
    CZYRValue(const CZYRValue& other) : tag_(other.tag_), data_(other.data_) { addRef(); }
    CZYRValue(CZYRValue&& other) noexcept
        : tag_(std::exchange(other.tag_, kZYRValTypeNone)), data_(other.data_) {}
    CZYRValue& operator=(CZYRValue other) noexcept {
        std::swap(tag_, other.tag_);
        std::swap(data_, other.data_);
        return *this;
    }
    ~CZYRValue() { releaseObject(); }

    eZYRValType tag() const { return tag_; }
    template <class T> T as() const {
        if constexpr (std::is_same_v<T, bool>)
            return data_.b;
        else if constexpr (std::is_same_v<T, int32_t>)
            return data_.i;
        else if constexpr (std::is_same_v<T, unsigned int>)
            return data_.u;
        else if constexpr (std::is_same_v<T, double>)
            return data_.d;
        else
            return static_cast<T>(data_.object);
    }

private:
    template <class T> void put(T value) {
        if constexpr (std::is_same_v<T, bool>)
            data_.b = value;
        else if constexpr (std::is_same_v<T, int32_t>)
            data_.i = value;
        else if constexpr (std::is_same_v<T, unsigned int>)
            data_.u = value;
        else if constexpr (std::is_same_v<T, double>)
            data_.d = value;
        else
            data_.object = value;
    }
    void addRef() const {
        if (!data_.object)
            return;
        switch (tag_) {
        case kZYRValTypeString:
            as<I_UniString*>()->addRef();
            break;
        case kZYRValTypeDict:
            as<I_Dict*>()->addRef();
            break;
        case kZYRValTypeArray:
            as<I_Array*>()->addRef();
            break;
        case kZYRValTypeDataBuffer:
            as<I_DataBuffer*>()->addRef();
            break;
        default:
            break;
        }
    }
    void releaseObject() {
        if (!data_.object)
            return;
        switch (tag_) {
        case kZYRValTypeString:
            as<I_UniString*>()->release();
            break;
        case kZYRValTypeDict:
        case kZYRValTypeArray:
            releaseContainer(tag_, data_.object);
            break;
        case kZYRValTypeDataBuffer:
            as<I_DataBuffer*>()->release();
            break;
        default:
            break;
        }
    }

    eZYRValType tag_ = kZYRValTypeNone;
    union Data {
        bool b;
        int32_t i;
        unsigned int u;
        double d;
        void* object;
    } data_{.object = nullptr};
};

// Reads a stored value as T: a mismatch is a type-check error; objects gain a reference.
template <class T> void readValue(const CZYRValue& value, T* out) {
    if (value.tag() != ValueKind<T>::tag)
        raise(kZYRErrorTypeCheck, ValueKind<T>::mismatch, __LINE__);
    *out = value.as<T>();
    if constexpr (std::is_pointer_v<T>)
        if (*out)
            (*out)->addRef();
}

// Calls the enumProc overload of the value's type; an empty value calls nothing.
inline bool dispatch(I_DictEnumProcs* procs, I_UniString* key, const CZYRValue& value,
                     I_Error& err) {
    switch (value.tag()) {
    case kZYRValTypeBool:
        return procs->enumProc(key, value.as<bool>(), err);
    case kZYRValTypeInt:
        return procs->enumProc(key, value.as<int32_t>(), err);
    case kZYRValTypeUInt:
        return procs->enumProc(key, value.as<unsigned int>(), err);
    case kZYRValTypeDouble:
        return procs->enumProc(key, value.as<double>(), err);
    case kZYRValTypeString:
        return procs->enumProc(key, value.as<I_UniString*>(), err);
    case kZYRValTypeDict:
        return procs->enumProc(key, value.as<I_Dict*>(), err);
    case kZYRValTypeArray:
        return procs->enumProc(key, value.as<I_Array*>(), err);
    case kZYRValTypeDataBuffer:
        return procs->enumProc(key, value.as<I_DataBuffer*>(), err);
    default:
        return true;
    }
}

// The count, identity and finalized flag every container has.
template <class Interface> class ContainerBase : public CZYRPublicObject<Interface> {
public:
    uint64_t getUniqueID() const override { return id_; }

protected:
    void refuseIfFinalized() const {
        if (finalized_)
            raise(kZYRErrorFinalized, "Finalized objects can't be modified", __LINE__);
    }

    uint64_t id_ = createUniqueID();
    bool finalized_ = false;
};

// The containers whose finalize or clone is running on this thread, outermost first. A
// container met again inside its own walk is a cycle, which would recurse for ever; and the
// walk goes at most kMaxNesting levels deep, so deeply nested input cannot exhaust the stack.
constexpr size_t kMaxNesting = 256;

struct WalkPath {
    std::array<const void*, kMaxNesting + 1> containers{};
    size_t count = 0;
};
inline thread_local constinit WalkPath walkPath{};

// One container's place on the path for the time of its walk.
class WalkStep {
public:
    explicit WalkStep(const void* container) {
        WalkPath& path = walkPath;
        for (size_t i = 0; i < path.count; ++i)
            if (path.containers[i] == container)
                raise(ZYRPublic::kZYRErrorInvalidData, "Cyclic container", __LINE__);
        if (path.count > kMaxNesting)
            raise(ZYRPublic::kZYRErrorInvalidData, "Container nesting too deep", __LINE__);
        path.containers[path.count++] = container;
    }
    ~WalkStep() { --walkPath.count; }
    WalkStep(const WalkStep&) = delete;
    WalkStep& operator=(const WalkStep&) = delete;
};

// Finalizes nested containers; stops at the first recorded error.
inline void finalizeNested(const CZYRValue& value, I_Error& err) {
    if (value.tag() == kZYRValTypeDict && value.as<I_Dict*>())
        value.as<I_Dict*>()->finalize(err);
    else if (value.tag() == kZYRValTypeArray && value.as<I_Array*>())
        value.as<I_Array*>()->finalize(err);
}

// Deep copy of one value for a clone: containers are cloned, strings and buffers shared.
template <class Store> void cloneValue(const CZYRValue& value, I_Error& err, Store store) {
    switch (value.tag()) {
    case kZYRValTypeDict:
        if (I_Dict* nested = value.as<I_Dict*>()) {
            const C_SmartPtr<I_Dict> copy(nested->clone(err), false);
            if (copy)
                store(CZYRValue::of(copy.get()));
        } else {
            store(value);
        }
        break;
    case kZYRValTypeArray:
        if (I_Array* nested = value.as<I_Array*>()) {
            const C_SmartPtr<I_Array> copy(nested->clone(err), false);
            if (copy)
                store(CZYRValue::of(copy.get()));
        } else {
            store(value);
        }
        break;
    case kZYRValTypeNone:
        break;
    default:
        store(value);
        break;
    }
}

// ---- what the value wrappers share ---------------------------------------------------------

[[noreturn]] inline void nullObject(int line) {
    raise(kZYRErrorInvalidObject, "Null object", line);
}

inline bool missing(bool found, bool throwIfMissing) {
    if (!found && throwIfMissing)
        raise(kZYRErrorKeyNotFound, "Key not found", __LINE__);
    return found;
}

// Object gets: the wrapper always takes what the slot returned (null when missing).
template <class Wrapper, class Raw, class Container, class Where>
bool getObject(Container* impl, Where where, Wrapper& out, bool throwIfMissing) {
    Raw* raw = nullptr;
    C_Error err;
    const bool found = impl->get(where, &raw, err);
    out = Wrapper(raw, false);
    throwCZYRErrorIfErrorOccurred(err);
    return missing(found, throwIfMissing);
}

template <class T, class Container, class Where>
bool getScalar(Container* impl, Where where, T* out, bool throwIfMissing) {
    const bool found = throwing([&](C_Error& err) { return impl->get(where, out, err); });
    return missing(found, throwIfMissing);
}

} // namespace ZYRStd::value_detail
