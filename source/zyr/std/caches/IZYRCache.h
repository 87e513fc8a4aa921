/// \file
/// IZYRCache: a chained hash table of pool entries with move-to-front chains and a
/// second-chance sweeper, the base of the engine's glyph, path and image caches.
#pragma once

#include <cstdint>

#include "ZYRStdExport.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/memory/ZYRPool.h"

namespace ZYRStd {

/// An entry: its first word links the next entry of the chain; the rest of the pool element
/// belongs to the derived cache (derive the entry record from this).
struct _t_Nlink {
    _t_Nlink* next; ///< the next entry, or the chain head after the last
};

/// A chain head. Chains are circular: the last entry links back to the head, which is why the
/// head begins with a link of its own (`next` is the chain's first entry, the head itself when
/// the chain is empty). 16 bytes: the 8-byte first-entry pointer, the counts, padding.
struct _t_HashHead : _t_Nlink {
    unsigned char count;      ///< entries in the chain
    unsigned char touched;    ///< the first this many entries were used since the last sweep
    unsigned char unused;     ///< padding
    unsigned char chainLimit; ///< kept for derived caches; not read here
};
static_assert(sizeof(_t_HashHead) == 16);

/// 0: success (a traversal goes on); 1: entries remain; 2: a traversal stays on the same
/// predecessor; anything else from a traversal callback stops it.
using RetCode = int32_t;
/// The results named.
///@{
constexpr RetCode kHCSuccess = 0;
constexpr RetCode kHCEntriesRemain = 1;
constexpr RetCode kHCStayOnPrevious = 2;
///@}

class IZYRCache;
/// Called for each entry as the successor of `previous` (the head for the first entry);
/// `touched` says whether the entry lies in the chain's touched prefix.
using HCTraverseProc = RetCode (*)(_t_HashHead* head, bool touched, _t_Nlink* previous, void* ctx);

/// Not thread-safe: a cache belongs to one thread or is locked by its owner. Entries come from
/// the pool given to hcSetPool, which the derived cache owns and must outlive every use.
class ZYRSTD_API IZYRCache : public CZYRClientBase {
public:
    /// A chain never holds more entries than its 8-bit count can say; linking the 255th is a
    /// caller's fault.
    static constexpr unsigned int kFullChain = 255;

    /// An empty, unusable cache (no head table).
    IZYRCache() = default;
    /// The first argument is accepted and ignored. Requires 1 <= chainLength <= 42,
    /// numEntries >= chainLength and numEntries >= releaseQuota.
    IZYRCache(int32_t, int32_t numEntries, int32_t releaseQuota, unsigned char chainLength);
    ~IZYRCache() override;
    /// The head table is owned: copying would free it twice.
    IZYRCache(const IZYRCache&) = delete;
    IZYRCache& operator=(const IZYRCache&) = delete;

    /// The key's hash; the chain is the hash modulo the number of heads.
    virtual unsigned int hash(void* key) = 0;
    /// True when `entry` holds `key`.
    virtual bool match(_t_Nlink* entry, void* key) = 0;
    /// Asked before an entry is dropped: release what the entry holds and answer false, or
    /// answer true to keep the entry (it is in use).
    virtual bool HCFlushEntry(_t_Nlink* entry, void* ctx);
    /// With a null context while entries are dropped: true sends them to the recycler instead
    /// of the pool. With the caller's context after a sweep that dropped entries: the report,
    /// after which the recycler goes back to the pool.
    virtual bool HCReportFlush(void* ctx);

    /// The pool entries come from, borrowed; set it before the first hcGetEntry.
    void hcSetPool(ZYRFixedSizePool* pool) { pool_ = pool; }

    /// The key's chain head.
    _t_HashHead* hcGetHashHead(void* key) {
        if (!top_)
            throwAssertionFailed(kHeaderSource, __LINE__); // an unusable cache
        return top_ + hash(key) % static_cast<unsigned int>(numHeads_);
    }
    /// The entry for `key` or null; a found entry moves to the front of its chain and joins
    /// the touched prefix. `*head` receives the key's chain head either way.
    _t_Nlink* hcLookup(void* key, _t_HashHead** head) {
        _t_HashHead* const chain = hcGetHashHead(key);
        *head = chain;
        _t_Nlink* previous = chain;
        _t_Nlink* entry = chain->next;
        for (unsigned int position = 1; entry != chain; ++position) {
            if (match(entry, key)) {
                if (position == 1) {
                    if (chain->touched == 0)
                        chain->touched = 1;
                } else {
                    previous->next = entry->next;
                    entry->next = chain->next;
                    chain->next = entry;
                    if (position > chain->touched)
                        ++chain->touched;
                }
                return entry;
            }
            previous = entry;
            entry = entry->next;
        }
        return nullptr;
    }
    /// hcLookup without the chain head.
    _t_Nlink* hcGetCachedEntry(void* key) {
        _t_HashHead* head;
        return hcLookup(key, &head);
    }

    /// A new unlinked entry, already counted in the current entries, or null when the cache
    /// is full beyond rescue or the pool is exhausted. Link it with hcLinkEntry.
    _t_Nlink* hcGetEntry(void* key, bool force);
    /// Links at the front of the key's chain and counts it (entry, touched, current).
    void hcInsertEntry(void* key, _t_Nlink* entry);
    /// Links an entry from hcGetEntry (already counted in the current entries).
    void hcLinkEntry(_t_HashHead* head, _t_Nlink* entry);
    /// False when the key is not cached or HCFlushEntry keeps the entry.
    bool hcRemoveEntry(void* key, void* ctx);
    /// Unlinks `entry`, the successor of `previous`, without asking HCFlushEntry.
    void hcReleaseEntry(_t_HashHead* head, bool wasTouched, _t_Nlink* previous, _t_Nlink* entry);
    /// For an entry from hcGetEntry that was never linked.
    void hcReturnUnlinkedEntry(_t_Nlink* entry, void* ctx);
    /// The result that stopped the traversal, or kHCSuccess when every entry was visited.
    RetCode hcTraverse(HCTraverseProc callback, void* ctx);

    /// Second-chance sweep of one chain: entries past the touched prefix are offered to
    /// HCFlushEntry; afterwards nothing in the chain counts as touched. The number dropped.
    int32_t CleanupUnTouched(_t_HashHead* head, void* ctx);
    /// Sweeps chains from the sweep cursor on until `count` entries were dropped or every
    /// chain was swept once. The number dropped.
    int32_t hcScavenger(int32_t count, void* ctx);
    /// Drops at most the last entry of each chain per pass until `count` entries (at most
    /// all) are gone or a pass drops nothing. The number dropped.
    int32_t hcRemoveLastEntries(int32_t count, void* ctx);
    /// Gives the entries waiting in the recycler back to the pool.
    void hcEmptyRecycler();

    /// Sets the number of entries and the chain length; the head table stays. kHCSuccess; on
    /// an unusable cache, kZYRErrorAssertionFailed.
    RetCode hcUpdateCacheSize(unsigned int numEntries, unsigned char chainLength);
    /// Sets how many entries a sweep tries to drop. kHCSuccess; on an unusable cache,
    /// kZYRErrorAssertionFailed.
    RetCode hcUpdateHowManyToRelease(unsigned int releaseQuota);
    /// kHCEntriesRemain when HCFlushEntry kept entries (the table stays); else the head table
    /// is freed and the cache becomes unusable.
    RetCode hcFreeCacheControl();

    /// The sizes the cache was set up with, its current and maximum entry counts, the release quota
    /// (GetAvailEntries) and its head table (first and last head, sweep cursor).
    ///@{
    int32_t GetNumEntries() const { return numEntries_; }
    unsigned char GetChainLength() const { return chainLength_; }
    int32_t GetCurrEntries() const { return currEntries_; }
    int32_t GetMaxEntries() const { return maxEntries_; }
    void SetMaxEntries(int32_t maxEntries) { maxEntries_ = maxEntries; }
    int32_t GetAvailEntries() const { return howManyToRelease_; }
    void IncrCurrEntries() { ++currEntries_; }
    _t_HashHead* hcGetTopHashTable() const { return top_; }
    _t_HashHead* hcGetBotHashTable() const { return bot_; }
    _t_HashHead* hcGetToBeCleaned() const { return toBeCleaned_; }
    int32_t hcGetNumHeads() const { return numHeads_; }
    ///@}
    /// Entries linked in chains (the sum of the chain counts).
    int32_t hcCountEntries() const;
    /// The longest chain's count.
    int32_t hcGetMaxChainLength() const;
    /// True while the head table is there and its ends agree with the number of heads.
    bool ValidateHashCtrl() const;
    /// True when the chain holds kFullChain entries.
    static bool hcIsChainFull(const _t_HashHead* head) { return head->count >= kFullChain; }
    /// The head table (H heads of 16 bytes) plus this object's own size.
    unsigned int hcMemUsed() const;

    /// Moves the linked entry at `from` to the memory at `to` (`size` bytes, the link
    /// included) and makes its predecessor link `to`, so the chain stays intact.
    static void hcRelocateEntry(_t_Nlink* from, _t_Nlink* to, int32_t size);

    /// Debug check: chain counts equal chain lengths, touched counts stay within them, chains
    /// close on their heads, and the current entries equal the linked ones (so call it while
    /// no entry from hcGetEntry waits to be linked).
    bool checkInvariants() const;

private:
    static constexpr const char* kHeaderSource = "source/zyr/std/IZYRCache";

    /// Unlinks nothing: gives a dropped entry to the recycler or the pool.
    void releaseToStore(_t_Nlink* entry);
    void reportAndRecycle(int32_t dropped, void* ctx);
    _t_HashHead* nextHead(_t_HashHead* head) const { return head == bot_ ? top_ : head + 1; }
    void requireValidTable(int line) const;
    void linkFront(_t_HashHead* head, _t_Nlink* entry);

    int32_t numEntries_ = 0;
    int32_t numHeads_ = 0;
    _t_HashHead* top_ = nullptr;
    _t_HashHead* bot_ = nullptr;
    _t_HashHead* toBeCleaned_ = nullptr;
    int32_t howManyToRelease_ = 0;
    unsigned char chainLength_ = 0;
    int32_t currEntries_ = 0;
    int32_t maxEntries_ = 0;
    int32_t skipCount_ = 0;
    _t_Nlink* recycler_ = nullptr;
    ZYRFixedSizePool* pool_ = nullptr;
};

} // namespace ZYRStd
