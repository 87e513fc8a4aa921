// The generic hash cache: construction, entry life cycle, sweeping and traversal.
#include "zyr/std/caches/IZYRCache.h"

#include <algorithm>
#include <cstring>
#include <iterator>

#include "zyr/std/core/ZYRMem.h"

namespace ZYRStd {

namespace {

constexpr const char* kSource = "source/zyr/std/ZYRCache";
// The source lines that the assertion records of the cache have always carried.
constexpr int kBadArgumentsLine = 92;
constexpr int kNoHeadTableLine = 94;
constexpr int kBadRelocationLine = 172;
constexpr int kInsertIntoFullChainLine = 533;
constexpr int kUpdateSizeOfBrokenTableLine = 539;
constexpr int kLinkIntoFullChainLine = 551;
constexpr int kUpdateQuotaOfBrokenTableLine = 561;

// Head counts are primes so that `hash mod H` spreads hashes with common factors.
constexpr unsigned int kHeadCounts[] = {3,   5,    11,   17,   37,   67,    131,  257,
                                        521, 1031, 2053, 4099, 8209, 16411, 32771};
// A chain may hold six times the target average before it counts as overlong.
constexpr uint64_t kChainLimitFactor = 6;
// hcGetEntry measures the chains once the cache holds this many times L entries, and
// refuses when the longest chain is nearly at its 8-bit limit.
constexpr int32_t kCrowdedFactor = 8;
constexpr unsigned int kNearlyFullChain = 250;

unsigned int headCountFor(int32_t numEntries, unsigned char chainLength) {
    const unsigned int wanted = static_cast<unsigned int>(
        (static_cast<int64_t>(numEntries) + chainLength - 1) / chainLength);
    for (const unsigned int heads : kHeadCounts)
        if (heads >= wanted)
            return heads;
    return kHeadCounts[std::size(kHeadCounts) - 1];
}

} // namespace

IZYRCache::IZYRCache(int32_t, int32_t numEntries, int32_t releaseQuota, unsigned char chainLength)
    : numEntries_(numEntries), howManyToRelease_(releaseQuota), chainLength_(chainLength) {
    // A zero chain length would divide by zero below: refused with the other bad arguments.
    if (chainLength == 0 || numEntries < chainLength || numEntries < releaseQuota ||
        chainLength * kChainLimitFactor >= 256)
        throwAssertionFailed(kSource, kBadArgumentsLine);
    const unsigned int heads = headCountFor(numEntries, chainLength);
    top_ = static_cast<_t_HashHead*>(ZYRSureCalloc(heads, sizeof(_t_HashHead)));
    if (!top_)
        throwAssertionFailed(kSource, kNoHeadTableLine);
    numHeads_ = static_cast<int32_t>(heads);
    bot_ = top_ + (heads - 1);
    toBeCleaned_ = top_;
    const auto limit = static_cast<unsigned char>(std::min<uint64_t>(
        (kChainLimitFactor * static_cast<uint64_t>(numEntries) + heads - 1) / heads, kFullChain));
    for (_t_HashHead* head = top_; head <= bot_; ++head) {
        head->next = head;
        head->chainLimit = limit;
    }
}

IZYRCache::~IZYRCache() {
    // Only the table: the pool belongs to the derived cache and may be gone already.
    ZYRFree(top_);
}

bool IZYRCache::HCFlushEntry(_t_Nlink*, void*) {
    return false;
}

bool IZYRCache::HCReportFlush(void*) {
    return false;
}

void IZYRCache::releaseToStore(_t_Nlink* entry) {
    if (HCReportFlush(nullptr)) {
        entry->next = recycler_;
        recycler_ = entry;
    } else if (pool_) {
        pool_->Free(entry);
    }
}

void IZYRCache::reportAndRecycle(int32_t dropped, void* ctx) {
    if (dropped <= 0)
        return;
    HCReportFlush(ctx);
    hcEmptyRecycler();
}

void IZYRCache::hcEmptyRecycler() {
    while (_t_Nlink* entry = recycler_) {
        recycler_ = entry->next;
        if (pool_)
            pool_->Free(entry);
    }
}

_t_Nlink* IZYRCache::hcGetEntry(void* key, bool force) {
    if (!top_ || !pool_)
        throwAssertionFailed(kSource, __LINE__);
    if (currEntries_ >= numEntries_) {
        if (skipCount_ > 0) {
            --skipCount_;
        } else if (hcScavenger(howManyToRelease_, key) == 0) {
            // Nothing could be dropped: let the next requests grow the cache instead of
            // sweeping it again in vain.
            skipCount_ = howManyToRelease_;
            const int32_t crowded = kCrowdedFactor * chainLength_;
            if (currEntries_ > crowded) {
                const int32_t longest = hcGetMaxChainLength();
                if (longest > static_cast<int32_t>(kNearlyFullChain))
                    return nullptr;
                if (longest > crowded && !force)
                    return nullptr;
            }
        }
    }
    void* memory = pool_->Alloc();
    if (!memory && recycler_) {
        // Entries dropped one by one still wait in the recycler: they are free to take.
        hcEmptyRecycler();
        memory = pool_->Alloc();
    }
    if (!memory) {
        int32_t dropped = hcScavenger(howManyToRelease_, key);
        if (dropped == 0)
            dropped = hcRemoveLastEntries(howManyToRelease_, key);
        if (dropped == 0 && !force)
            return nullptr;
        memory = pool_->Alloc();
        if (!memory)
            return nullptr;
    }
    ++currEntries_;
    maxEntries_ = std::max(maxEntries_, currEntries_);
    auto* entry = static_cast<_t_Nlink*>(memory);
    entry->next = nullptr;
    return entry;
}

void IZYRCache::hcInsertEntry(void* key, _t_Nlink* entry) {
    _t_HashHead* const head = hcGetHashHead(key);
    // A 256th entry cannot be counted in 8 bits: refused before anything changes.
    if (head->count >= kFullChain)
        throwAssertionFailed(kHeaderSource, kInsertIntoFullChainLine);
    linkFront(head, entry);
    ++currEntries_;
    maxEntries_ = std::max(maxEntries_, currEntries_);
    if (head->count >= kFullChain)
        throwAssertionFailed(kHeaderSource, kInsertIntoFullChainLine);
}

void IZYRCache::hcLinkEntry(_t_HashHead* head, _t_Nlink* entry) {
    if (head->count >= kFullChain)
        throwAssertionFailed(kHeaderSource, kLinkIntoFullChainLine);
    linkFront(head, entry);
    if (head->count >= kFullChain)
        throwAssertionFailed(kHeaderSource, kLinkIntoFullChainLine);
}

void IZYRCache::linkFront(_t_HashHead* head, _t_Nlink* entry) {
    entry->next = head->next;
    head->next = entry;
    ++head->count;
    ++head->touched;
}

bool IZYRCache::hcRemoveEntry(void* key, void* ctx) {
    _t_HashHead* head;
    _t_Nlink* const entry = hcLookup(key, &head);
    if (!entry || HCFlushEntry(entry, ctx))
        return false;
    // The look-up moved the entry to the front, into the touched prefix.
    head->next = entry->next;
    --head->count;
    if (head->touched > 0)
        --head->touched;
    --currEntries_;
    releaseToStore(entry);
    return true;
}

void IZYRCache::hcReleaseEntry(_t_HashHead* head, bool wasTouched, _t_Nlink* previous,
                               _t_Nlink* entry) {
    previous->next = entry->next;
    --head->count;
    if (wasTouched && head->touched > 0)
        --head->touched;
    // A caller that misjudged `wasTouched` must not leave more touched than present.
    head->touched = std::min(head->touched, head->count);
    --currEntries_;
    releaseToStore(entry);
}

void IZYRCache::hcReturnUnlinkedEntry(_t_Nlink* entry, void* ctx) {
    if (!entry)
        return;
    HCFlushEntry(entry, ctx);
    if (pool_)
        pool_->Free(entry);
    --currEntries_;
}

RetCode IZYRCache::hcTraverse(HCTraverseProc callback, void* ctx) {
    if (!top_)
        return kHCSuccess;
    for (_t_HashHead* head = top_; head <= bot_; ++head) {
        _t_Nlink* previous = head;
        unsigned int position = 1;
        while (position <= head->count) {
            const unsigned int before = head->count;
            const RetCode result = callback(head, position <= head->touched, previous, ctx);
            if (result == kHCStayOnPrevious && head->count < before)
                continue; // the entry is gone; its successor now follows `previous`
            // A callback that asks to stay but removed nothing would never get further.
            if (result != kHCSuccess && result != kHCStayOnPrevious)
                return result;
            previous = previous->next;
            ++position;
        }
    }
    return kHCSuccess;
}

int32_t IZYRCache::CleanupUnTouched(_t_HashHead* head, void* ctx) {
    unsigned int dropped = 0;
    if (head->count > head->touched) {
        _t_Nlink* previous = head;
        for (unsigned int i = 0; i < head->touched; ++i)
            previous = previous->next;
        _t_Nlink* entry = previous->next;
        for (unsigned int i = head->touched; i < head->count; ++i) {
            _t_Nlink* const following = entry->next;
            if (HCFlushEntry(entry, ctx)) {
                previous = entry;
            } else {
                previous->next = following;
                releaseToStore(entry);
                ++dropped;
            }
            entry = following;
        }
        head->count = static_cast<unsigned char>(head->count - dropped);
        currEntries_ -= static_cast<int32_t>(dropped);
    }
    // Every survivor has to be used again to stay protected.
    head->touched = 0;
    return static_cast<int32_t>(dropped);
}

int32_t IZYRCache::hcScavenger(int32_t count, void* ctx) {
    if (!top_)
        return 0;
    _t_HashHead* const first = toBeCleaned_;
    _t_HashHead* head = first;
    int32_t dropped = 0;
    do {
        // A chain used all over keeps only L entries protected.
        if (head->touched == head->count && head->touched > chainLength_)
            head->touched = chainLength_;
        if (head->count > head->touched)
            dropped += CleanupUnTouched(head, ctx);
        else
            head->touched = 0;
        head = nextHead(head);
    } while (dropped < count && head != first);
    // The next sweep goes on with the first chain this one did not reach, so every chain's
    // survivors get a whole round to be used again.
    toBeCleaned_ = head;
    reportAndRecycle(dropped, ctx);
    return dropped;
}

int32_t IZYRCache::hcRemoveLastEntries(int32_t count, void* ctx) {
    const int32_t target = std::min(count, currEntries_);
    if (target < 1 || !top_)
        return 0;
    int32_t dropped = 0;
    for (;;) {
        int32_t droppedThisPass = 0;
        for (_t_HashHead* head = top_; head <= bot_ && dropped + droppedThisPass < target; ++head) {
            if (head->count == 0)
                continue;
            head->touched = static_cast<unsigned char>(head->count - 1);
            droppedThisPass += CleanupUnTouched(head, ctx);
        }
        dropped += droppedThisPass;
        if (dropped >= target || droppedThisPass == 0)
            break;
    }
    reportAndRecycle(dropped, ctx);
    return dropped;
}

void IZYRCache::requireValidTable(int line) const {
    if (!ValidateHashCtrl())
        throwAssertionFailed(kHeaderSource, line);
}

RetCode IZYRCache::hcUpdateCacheSize(unsigned int numEntries, unsigned char chainLength) {
    requireValidTable(kUpdateSizeOfBrokenTableLine);
    if (numEntries == static_cast<unsigned int>(numEntries_) && chainLength == chainLength_)
        return kHCSuccess;
    for (_t_HashHead* head = top_; head <= bot_; ++head)
        head->chainLimit = kFullChain;
    numEntries_ = static_cast<int32_t>(numEntries);
    chainLength_ = chainLength;
    skipCount_ = 0;
    return kHCSuccess;
}

RetCode IZYRCache::hcUpdateHowManyToRelease(unsigned int releaseQuota) {
    requireValidTable(kUpdateQuotaOfBrokenTableLine);
    howManyToRelease_ = static_cast<int32_t>(releaseQuota);
    skipCount_ = 0;
    return kHCSuccess;
}

RetCode IZYRCache::hcFreeCacheControl() {
    if (!ValidateHashCtrl())
        throwAssertionFailed(kSource, __LINE__);
    hcRemoveLastEntries(currEntries_, nullptr);
    if (hcCountEntries() > 0)
        return kHCEntriesRemain;
    // Entries removed one by one may still wait in the recycler.
    hcEmptyRecycler();
    ZYRFree(top_);
    top_ = bot_ = toBeCleaned_ = nullptr;
    numHeads_ = 0;
    return kHCSuccess;
}

int32_t IZYRCache::hcCountEntries() const {
    int32_t entries = 0;
    if (top_)
        for (const _t_HashHead* head = top_; head <= bot_; ++head)
            entries += head->count;
    return entries;
}

int32_t IZYRCache::hcGetMaxChainLength() const {
    unsigned int longest = 0;
    if (top_)
        for (const _t_HashHead* head = top_; head <= bot_; ++head)
            longest = std::max<unsigned int>(longest, head->count);
    return static_cast<int32_t>(longest);
}

bool IZYRCache::ValidateHashCtrl() const {
    return top_ && numHeads_ > 0 && bot_ == top_ + (numHeads_ - 1);
}

unsigned int IZYRCache::hcMemUsed() const {
    return static_cast<unsigned int>(numHeads_) * sizeof(_t_HashHead) + sizeof(IZYRCache);
}

void IZYRCache::hcRelocateEntry(_t_Nlink* from, _t_Nlink* to, int32_t size) {
    if (!from || !from->next || !to || size <= 0)
        throwAssertionFailed(kSource, kBadRelocationLine);
    if (from == to)
        return;
    // The chain is a circle through its head: going round from the entry finds the link
    // that points at it.
    _t_Nlink* previous = from->next;
    while (previous->next != from)
        previous = previous->next;
    std::memmove(to, from, static_cast<size_t>(size));
    previous->next = to;
}

bool IZYRCache::checkInvariants() const {
    if (!top_)
        return bot_ == nullptr && numHeads_ == 0;
    if (!ValidateHashCtrl() || toBeCleaned_ < top_ || toBeCleaned_ > bot_)
        return false;
    int64_t linked = 0;
    for (const _t_HashHead* head = top_; head <= bot_; ++head) {
        if (head->touched > head->count)
            return false;
        const _t_Nlink* entry = head->next;
        for (unsigned int i = 0; i < head->count; ++i) {
            if (entry == head || !entry)
                return false; // the chain closes early
            entry = entry->next;
        }
        if (entry != head)
            return false; // longer than its count, or not closing on its head
        linked += head->count;
    }
    return linked == currEntries_;
}

} // namespace ZYRStd
