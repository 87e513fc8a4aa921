// Dictionaries: chained hash tables keyed by string text, and their value wrapper.
#include "zyr/std/values/CZYRDict.h"

#include <algorithm>
#include <utility>
#include <vector>

#include "zyr/std/core/CZYRSmartPtr.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/internal/ZYRErrorBoundary.h"
#include "zyr/std/memory/CZYRStdAllocator.h"
#include "zyr/std/values/internal/CZYRValue.h"
#include "zyr/std/values/internal/IImpDictEnumProcs.h"
#include "zyr/std/values/internal/ZYRDictChanges.h"

namespace ZYRStd {

namespace {
using namespace value_detail;

// ---- dictionary ---------------------------------------------------------------------------

constexpr std::array<uint32_t, 28> kBucketPrimes{
    53u,        97u,        193u,       389u,       769u,        1543u,       3079u,
    6151u,      12289u,     24593u,     49157u,     98317u,      196613u,     393241u,
    786433u,    1572869u,   3145739u,   6291469u,   12582917u,   25165843u,   50331653u,
    100663319u, 201326611u, 402653189u, 805306457u, 1610612741u, 3221225473u, 4294967291u};

// A new dictionary starts with this many buckets; growth then follows the prime table, and
// enumeration order follows the buckets, so hosts see both.
constexpr uint32_t kInitialBuckets = 193;

// hash % count without a division: Lemire's fastmod, exact for every 32-bit hash and count.
// A look-up otherwise spends a good part of its time in the divider.
class BucketIndex {
public:
    explicit BucketIndex(uint32_t count) : count_(count), inverse_(~uint64_t{0} / count + 1) {}
    uint32_t operator()(uint32_t hash) const {
        const uint64_t low = inverse_ * hash;
        return static_cast<uint32_t>((static_cast<unsigned __int128>(low) * count_) >> 64);
    }

private:
    uint64_t count_;
    uint64_t inverse_;
};

uint32_t bucketCountFor(uint64_t needed) {
    const auto found = std::lower_bound(kBucketPrimes.begin(), kBucketPrimes.end(), needed);
    return found == kBucketPrimes.end() ? kBucketPrimes.back() : *found;
}

class IImp_ZYRDict final : public ContainerBase<I_Dict> {
public:
    IImp_ZYRDict() : buckets_(kInitialBuckets, nullptr), bucketOf_(kInitialBuckets) {}
    ~IImp_ZYRDict() override {
        // The node store releases every entry when it goes.
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
            for (Node** link = &buckets_[bucketOf_(hash)]; *link; link = &(*link)->next) {
                if (matches(*link, key, hash)) {
                    destroy(std::exchange(*link, (*link)->next));
                    --count_;
                    counted();
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

    const std::atomic<uint32_t>& changes() const { return changes_; }

private:
    // Changes come from the dictionary's one writer at a time, so a load and a store do;
    // relaxed is enough because the count only tells a reader that its answers may be stale,
    // and the reader sees the change itself through whatever ordered it after the writer.
    void counted() {
        changes_.store(changes_.load(std::memory_order_relaxed) + 1, std::memory_order_relaxed);
    }

    struct Node {
        Node(I_UniString* k, uint32_t h, const CZYRValue& v) noexcept : key(k), hash(h), value(v) {
            key->addRef();
        }
        ~Node() { key->release(); }
        Node* next = nullptr;
        I_UniString* key; // null while the node waits on the free list
        uint32_t hash;    // the key's hash, kept so that rehashing asks no string again
        CZYRValue value;
    };

    // The nodes live in slabs from the front, growing from a few nodes for the many small
    // dictionaries to a thousand for large ones: one allocation per slab instead of one per
    // entry, and a destructor that walks memory in order instead of chasing chains.
    class NodeStore {
    public:
        NodeStore() = default;
        NodeStore(const NodeStore&) = delete;
        NodeStore& operator=(const NodeStore&) = delete;
        ~NodeStore() {
            while (Slab* slab = slabs_) {
                for (unsigned int i = 0; i < slab->used; ++i)
                    if (slab->nodes()[i].key)
                        slab->nodes()[i].~Node();
                slabs_ = slab->next;
                ZYRFree(slab);
            }
        }

        Node* make(I_UniString* key, uint32_t hash, const CZYRValue& value) {
            static_assert(
                std::is_nothrow_constructible_v<Node, I_UniString*, uint32_t, const CZYRValue&>,
                "a node is built in place and must not fail half way");
            if (free_)
                return ::new (std::exchange(free_, free_->next)) Node(key, hash, value);
            if (!slabs_ || slabs_->used == slabs_->capacity)
                addSlab();
            return ::new (&slabs_->nodes()[slabs_->used++]) Node(key, hash, value);
        }
        void destroy(Node* node) noexcept {
            node->~Node();
            giveBack(node);
        }

    private:
        struct Slab {
            Slab* next;
            unsigned int used;
            unsigned int capacity;
            Node* nodes() { return reinterpret_cast<Node*>(this + 1); }
        };
        static_assert(sizeof(Slab) % alignof(Node) == 0);

        static constexpr unsigned int kFirstSlabNodes = 4;
        static constexpr unsigned int kLargestSlabNodes = 1024;

        // A node on the free list keeps only its link; a null key marks it unused.
        void giveBack(Node* node) noexcept {
            node->key = nullptr;
            node->next = free_;
            free_ = node;
        }
        void addSlab() {
            const unsigned int capacity =
                slabs_ ? std::min(slabs_->capacity * 2, kLargestSlabNodes) : kFirstSlabNodes;
            void* memory =
                ZYRMalloc(static_cast<unsigned int>(sizeof(Slab) + capacity * sizeof(Node)));
            if (!memory)
                throw ZYROutOfMemoryError(kSource, __LINE__);
            slabs_ = ::new (memory) Slab{slabs_, 0, capacity};
        }

        Slab* slabs_ = nullptr;
        Node* free_ = nullptr;
    };

    void destroy(Node* node) noexcept { nodes_.destroy(node); }

    static bool matches(const Node* node, I_UniString* key, uint32_t hash) {
        return node->hash == hash && (node->key == key || node->key->equals(key));
    }

    Node* find(I_UniString* key, uint32_t hash) const {
        for (Node* node = buckets_[bucketOf_(hash)]; node; node = node->next)
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
        const BucketIndex freshOf(newCount);
        for (Node* head : buckets_) {
            while (head) {
                Node* node = std::exchange(head, head->next);
                Node*& slot = fresh[freshOf(node->hash)];
                node->next = slot;
                slot = node;
            }
        }
        buckets_.swap(fresh);
        bucketOf_ = freshOf;
    }

    void insertOrAssign(I_UniString* key, const CZYRValue& value) {
        reserveFor(uint64_t{count_} + 1);
        const uint32_t hash = key->hashCode();
        if (Node* node = find(key, hash)) {
            node->value = value; // the node keeps the key object it was first stored with
            return;
        }
        Node*& head = buckets_[bucketOf_(hash)];
        Node* node = nodes_.make(key, hash, value);
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
            counted();
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
    NodeStore nodes_; // before the buckets that point into it
    Buckets buckets_;
    BucketIndex bucketOf_;
    unsigned int count_ = 0;
    std::atomic<uint32_t> changes_{0};
};

} // namespace

const std::atomic<uint32_t>* dictChangeCount(I_Dict* dict) {
    const auto* ours = dynamic_cast<const IImp_ZYRDict*>(dict);
    return ours ? &ours->changes() : nullptr;
}

namespace value_detail {

namespace {
using PendingContainers =
    std::vector<std::pair<eZYRValType, void*>, CZYRStdAllocator<std::pair<eZYRValType, void*>>>;
// The outermost release's list on this thread, null while no container is being released.
thread_local constinit PendingContainers* pendingContainers = nullptr;

void dropReference(eZYRValType tag, void* container) noexcept {
    if (tag == kZYRValTypeDict)
        static_cast<I_Dict*>(container)->release();
    else
        static_cast<I_Array*>(container)->release();
}
} // namespace

void releaseContainer(eZYRValType tag, void* container) noexcept {
    if (PendingContainers* pending = pendingContainers) {
        try {
            pending->emplace_back(tag, container);
            return;
        } catch (...) {
            // No room to wait: released at once, one level deeper.
        }
        dropReference(tag, container);
        return;
    }
    PendingContainers pending;
    pendingContainers = &pending;
    dropReference(tag, container);
    while (!pending.empty()) {
        const auto [nestedTag, nested] = pending.back();
        pending.pop_back();
        dropReference(nestedTag, nested);
    }
    pendingContainers = nullptr;
}

} // namespace value_detail

I_Dict* createDict(ZYRPublic::I_Error& err) {
    return ZYRErrorBoundary<I_Dict*>(err, nullptr, "Error in ZYRStd::createDict", kSource, __LINE__,
                                     []() -> I_Dict* { return new IImp_ZYRDict; });
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

} // namespace ZYRStd
