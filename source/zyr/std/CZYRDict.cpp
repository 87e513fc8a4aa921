// Dictionaries (chained hash tables keyed by string text) and arrays of typed values.
#include "zyr/std/CZYRDict.h"

#include <algorithm>
#include <array>
#include <utility>
#include <vector>

#include "zyr/std/CZYRError.h"
#include "zyr/std/ZYRUniqueID.h"
#include "zyr/std/CZYRSmartPtr.h"
#include "zyr/std/CZYRStdAllocator.h"
#include "zyr/std/ZYRErrorBoundary.h"

namespace ZYRStd {

namespace {

using ZYRPublic::I_DataBuffer;
using ZYRPublic::I_Error;
using ZYRPublic::I_UniString;
using namespace ZYRPublic;

constexpr const char* kSource = "source/zyr/std/CZYRDict";

[[noreturn]] void raise(ZYRPublic::eZYRErrorType type, const char* message, int line) {
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
            as<I_Dict*>()->release();
            break;
        case kZYRValTypeArray:
            as<I_Array*>()->release();
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
bool dispatch(I_DictEnumProcs* procs, I_UniString* key, const CZYRValue& value, I_Error& err) {
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
thread_local constinit WalkPath walkPath{};

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
void finalizeNested(const CZYRValue& value, I_Error& err) {
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

// ---- dictionary ---------------------------------------------------------------------------

constexpr std::array<uint32_t, 28> kBucketPrimes{
    53u,        97u,        193u,       389u,       769u,        1543u,       3079u,
    6151u,      12289u,     24593u,     49157u,     98317u,      196613u,     393241u,
    786433u,    1572869u,   3145739u,   6291469u,   12582917u,   25165843u,   50331653u,
    100663319u, 201326611u, 402653189u, 805306457u, 1610612741u, 3221225473u, 4294967291u};

uint32_t bucketCountFor(uint64_t needed) {
    const auto found = std::lower_bound(kBucketPrimes.begin(), kBucketPrimes.end(), needed);
    return found == kBucketPrimes.end() ? kBucketPrimes.back() : *found;
}

class IImp_ZYRDict final : public ContainerBase<I_Dict> {
public:
    IImp_ZYRDict() : buckets_(193, nullptr) {}
    ~IImp_ZYRDict() override {
        for (Node*& head : buckets_)
            while (head)
                destroy(std::exchange(head, head->next));
    }

    void enumerate(I_DictEnumProcs* procs, I_Error& err) override {
        ZYRErrorBoundaryVoid(err, "Error in IImp_ZYRDict::enumerate", kSource, __LINE__, [&] {
            if (!procs)
                raise(kZYRErrorBadParam, "Bad argument to IImp_ZYRDict::enumerate", __LINE__);
            bool goOn = true;
            for (Node* head : buckets_) {
                for (Node* node = head; node && goOn && !err.errorOccurred(); node = node->next) {
                    const C_SmartPtr<I_UniString> key(node->key, true); // held for the call
                    goOn = dispatch(procs, key.get(), node->value, err);
                }
                if (!goOn || err.errorOccurred())
                    break;
            }
        });
    }

    eZYRValType getType(I_UniString* key) override {
        const Node* node = key ? find(key, key->hashCode()) : nullptr;
        return node ? node->value.tag() : kZYRValTypeNone;
    }

    void set(I_UniString* key, I_DataBuffer* value, I_Error& err) override {
        store(key, value, err);
    }
    void set(I_UniString* key, I_Array* value, I_Error& err) override { store(key, value, err); }
    void set(I_UniString* key, I_Dict* value, I_Error& err) override { store(key, value, err); }
    void set(I_UniString* key, I_UniString* value, I_Error& err) override {
        store(key, value, err);
    }
    void set(I_UniString* key, double value, I_Error& err) override { store(key, value, err); }
    void set(I_UniString* key, unsigned int value, I_Error& err) override {
        store(key, value, err);
    }
    void set(I_UniString* key, int32_t value, I_Error& err) override { store(key, value, err); }
    void set(I_UniString* key, bool value, I_Error& err) override { store(key, value, err); }

    void remove(I_UniString* key, I_Error& err) override {
        ZYRErrorBoundaryVoid(err, "Error in IImp_ZYRDict::remove", kSource, __LINE__, [&] {
            if (!key)
                raise(kZYRErrorBadParam, "Bad argument to IImp_ZYRDict::remove", __LINE__);
            refuseIfFinalized();
            const uint32_t hash = key->hashCode();
            for (Node** link = &buckets_[hash % buckets_.size()]; *link; link = &(*link)->next) {
                if (matches(*link, key, hash)) {
                    destroy(std::exchange(*link, (*link)->next));
                    --count_;
                    return;
                }
            }
        });
    }

    bool get(I_UniString* key, I_DataBuffer** out, I_Error& err) override {
        return load(key, out, err);
    }
    bool get(I_UniString* key, I_Array** out, I_Error& err) override { return load(key, out, err); }
    bool get(I_UniString* key, I_Dict** out, I_Error& err) override { return load(key, out, err); }
    bool get(I_UniString* key, I_UniString** out, I_Error& err) override {
        return load(key, out, err);
    }
    bool get(I_UniString* key, double* out, I_Error& err) override { return load(key, out, err); }
    bool get(I_UniString* key, unsigned int* out, I_Error& err) override {
        return load(key, out, err);
    }
    bool get(I_UniString* key, int32_t* out, I_Error& err) override { return load(key, out, err); }
    bool get(I_UniString* key, bool* out, I_Error& err) override { return load(key, out, err); }

    void finalize(I_Error& err) override {
        ZYRErrorBoundaryVoid(err, "Error in IImp_ZYRDict::finalize", kSource, __LINE__, [&] {
            if (finalized_)
                return;
            const WalkStep step(static_cast<I_Dict*>(this));
            forEach([&](const Node& node) {
                finalizeNested(node.value, err);
                return !err.errorOccurred();
            });
            // A walk that failed (a cycle, too deep) leaves the container open, so that its
            // owner can still break the cycle and nothing is frozen half done.
            if (!err.errorOccurred())
                finalized_ = true;
        });
    }

    bool isFinalized(I_Error& err) override { return !err.errorOccurred() && finalized_; }

    unsigned int getSize(I_Error& err) override {
        return ZYRErrorBoundary(err, 0u, "Error in IImp_ZYRDict::getSize", kSource, __LINE__,
                                [&] { return count_; });
    }

    I_Dict* clone(I_Error& err) override {
        return ZYRErrorBoundary<I_Dict*>(
            err, nullptr, "Error in IImp_ZYRDict::clone", kSource, __LINE__, [&]() -> I_Dict* {
                const WalkStep step(static_cast<I_Dict*>(this));
                C_SmartPtr<IImp_ZYRDict> copy(new IImp_ZYRDict, false);
                forEach([&](const Node& node) {
                    cloneValue(node.value, err,
                               [&](const CZYRValue& v) { copy->insertOrAssign(node.key, v); });
                    return !err.errorOccurred();
                });
                // A partial copy is of no use to anyone; it goes with the error.
                return err.errorOccurred() ? nullptr : copy.detach();
            });
    }

private:
    struct Node : CZYRClientBase {
        Node(I_UniString* k, uint32_t h, CZYRValue v) : key(k), hash(h), value(std::move(v)) {
            key->addRef();
        }
        ~Node() override { key->release(); }
        Node* next = nullptr;
        I_UniString* key;
        uint32_t hash; // the key's hash, kept so that rehashing asks no string again
        CZYRValue value;
    };

    static void destroy(Node* node) { delete node; }

    static bool matches(const Node* node, I_UniString* key, uint32_t hash) {
        return node->hash == hash && (node->key == key || node->key->equals(key));
    }

    Node* find(I_UniString* key, uint32_t hash) const {
        for (Node* node = buckets_[hash % buckets_.size()]; node; node = node->next)
            if (matches(node, key, hash))
                return node;
        return nullptr;
    }

    template <class Visit> void forEach(Visit visit) const {
        for (Node* head : buckets_)
            for (Node* node = head; node; node = node->next)
                if (!visit(*node))
                    return;
    }

    void reserveFor(uint64_t needed) {
        if (needed <= buckets_.size())
            return;
        const uint32_t newCount = bucketCountFor(needed);
        if (newCount <= buckets_.size())
            return;
        Buckets fresh(newCount, nullptr);
        for (Node* head : buckets_) {
            while (head) {
                Node* node = std::exchange(head, head->next);
                Node*& slot = fresh[node->hash % newCount];
                node->next = slot;
                slot = node;
            }
        }
        buckets_.swap(fresh);
    }

    void insertOrAssign(I_UniString* key, const CZYRValue& value) {
        reserveFor(uint64_t{count_} + 1);
        const uint32_t hash = key->hashCode();
        if (Node* node = find(key, hash)) {
            node->value = value; // the node keeps the key object it was first stored with
            return;
        }
        Node*& head = buckets_[hash % buckets_.size()];
        Node* node = new Node(key, hash, value);
        node->next = head;
        head = node;
        ++count_;
    }

    template <class T> void store(I_UniString* key, T value, I_Error& err) {
        ZYRErrorBoundaryVoid(err, "Error in IImp_ZYRDict::set", kSource, __LINE__, [&] {
            if (!key)
                raise(kZYRErrorBadParam, "Bad argument to IImp_ZYRDict::set", __LINE__);
            refuseIfFinalized();
            insertOrAssign(key, CZYRValue::of(value));
        });
    }

    template <class T> bool load(I_UniString* key, T* out, I_Error& err) {
        return ZYRErrorBoundary(err, false, "Error in IImp_ZYRDict::get", kSource, __LINE__, [&] {
            if (!key || !out)
                raise(kZYRErrorBadParam, "Bad argument to IImp_ZYRDict::get", __LINE__);
            const Node* node = find(key, key->hashCode());
            if (!node)
                return false;
            readValue(node->value, out);
            return !err.errorOccurred();
        });
    }

    using Buckets = std::vector<Node*, CZYRStdAllocator<Node*>>;
    Buckets buckets_;
    unsigned int count_ = 0;
};

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

// ---- the adapter from interface callbacks to wrapper callbacks ----------------------------

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

// ---- wrapper helpers ----------------------------------------------------------------------

[[noreturn]] void nullObject(int line) {
    raise(kZYRErrorInvalidObject, "Null object", line);
}

// Runs `call` with a local status and throws what it recorded.
template <class Call> auto throwing(Call call) {
    C_Error err;
    if constexpr (std::is_void_v<decltype(call(err))>) {
        call(err);
        throwCZYRErrorIfErrorOccurred(err);
    } else {
        auto result = call(err);
        throwCZYRErrorIfErrorOccurred(err);
        return result;
    }
}

bool missing(bool found, bool throwIfMissing) {
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

} // namespace

// ---- factories ----------------------------------------------------------------------------

I_Dict* createDict(ZYRPublic::I_Error& err) {
    return ZYRErrorBoundary<I_Dict*>(err, nullptr, "Error in ZYRStd::createDict", kSource, __LINE__,
                                     []() -> I_Dict* { return new IImp_ZYRDict; });
}

I_Array* createArray(ZYRPublic::I_Error& err) {
    return ZYRErrorBoundary<I_Array*>(err, nullptr, "Error in ZYRStd::createArray", kSource,
                                      __LINE__, []() -> I_Array* { return new IImp_ZYRArray; });
}

// ---- CZYRDict -----------------------------------------------------------------------------

CZYRDict::CZYRDict()
    : CZYRInterfaceValue(throwing([](C_Error& err) { return createDict(err); }), false) {}
CZYRDict::~CZYRDict() = default;

I_Dict* CZYRDict::valid() const {
    if (!impl_)
        nullObject(__LINE__);
    return impl_;
}

void CZYRDict::set(const CZYRUniString& key, const CZYRUniString& value) {
    throwing([&](C_Error& err) { valid()->set(key.getImpl(), value.getImpl(), err); });
}
void CZYRDict::set(const CZYRUniString& key, const CZYRDict& value) {
    throwing([&](C_Error& err) { valid()->set(key.getImpl(), value.getImpl(), err); });
}
void CZYRDict::set(const CZYRUniString& key, const CZYRArray& value) {
    throwing([&](C_Error& err) { valid()->set(key.getImpl(), value.getImpl(), err); });
}
void CZYRDict::set(const CZYRUniString& key, const CZYRDataBuffer& value) {
    throwing([&](C_Error& err) { valid()->set(key.getImpl(), value.getImpl(), err); });
}
void CZYRDict::set(const CZYRUniString& key, unsigned int value) {
    throwing([&](C_Error& err) { valid()->set(key.getImpl(), value, err); });
}
void CZYRDict::set(const CZYRUniString& key, int32_t value) {
    throwing([&](C_Error& err) { valid()->set(key.getImpl(), value, err); });
}
void CZYRDict::set(const CZYRUniString& key, double value) {
    throwing([&](C_Error& err) { valid()->set(key.getImpl(), value, err); });
}
void CZYRDict::set(const CZYRUniString& key, bool value) {
    throwing([&](C_Error& err) { valid()->set(key.getImpl(), value, err); });
}
void CZYRDict::remove(const CZYRUniString& key) {
    throwing([&](C_Error& err) { valid()->remove(key.getImpl(), err); });
}

bool CZYRDict::get(const CZYRUniString& key, CZYRDict& out, bool throwIfMissing) const {
    return getObject<CZYRDict, I_Dict>(valid(), key.getImpl(), out, throwIfMissing);
}
bool CZYRDict::get(const CZYRUniString& key, CZYRUniString& out, bool throwIfMissing) const {
    return getObject<CZYRUniString, I_UniString>(valid(), key.getImpl(), out, throwIfMissing);
}
bool CZYRDict::get(const CZYRUniString& key, CZYRArray& out, bool throwIfMissing) const {
    return getObject<CZYRArray, I_Array>(valid(), key.getImpl(), out, throwIfMissing);
}
bool CZYRDict::get(const CZYRUniString& key, CZYRDataBuffer& out, bool throwIfMissing) const {
    return getObject<CZYRDataBuffer, I_DataBuffer>(valid(), key.getImpl(), out, throwIfMissing);
}
bool CZYRDict::get(const CZYRUniString& key, unsigned int* out, bool throwIfMissing) const {
    return getScalar(valid(), key.getImpl(), out, throwIfMissing);
}
bool CZYRDict::get(const CZYRUniString& key, int32_t* out, bool throwIfMissing) const {
    return getScalar(valid(), key.getImpl(), out, throwIfMissing);
}
bool CZYRDict::get(const CZYRUniString& key, double* out, bool throwIfMissing) const {
    return getScalar(valid(), key.getImpl(), out, throwIfMissing);
}
bool CZYRDict::get(const CZYRUniString& key, bool* out, bool throwIfMissing) const {
    return getScalar(valid(), key.getImpl(), out, throwIfMissing);
}

eZYRValType CZYRDict::getType(const CZYRUniString& key) const {
    return valid()->getType(key.getImpl());
}
unsigned int CZYRDict::getSize() const {
    return throwing([&](C_Error& err) { return valid()->getSize(err); });
}
void CZYRDict::enumerate(CZYRDictEnumProcs* procs) const {
    IImpDictEnumProcs adapter(procs);
    throwing([&](C_Error& err) { valid()->enumerate(&adapter, err); });
}
void CZYRDict::finalize() {
    throwing([&](C_Error& err) { valid()->finalize(err); });
}
bool CZYRDict::isFinalized() const {
    return throwing([&](C_Error& err) { return valid()->isFinalized(err); });
}
CZYRDict CZYRDict::clone() const {
    return CZYRDict(throwing([&](C_Error& err) { return valid()->clone(err); }), false);
}
unsigned long long CZYRDict::getUniqueID() const {
    return valid()->getUniqueID();
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
