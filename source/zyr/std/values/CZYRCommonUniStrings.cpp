// The common strings table and the dynamic string cache.
#include "zyr/std/values/CZYRCommonUniStrings.h"

#include <array>
#include <list>
#include <mutex>
#include <unordered_map>
#include <utility>
#include <vector>

#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/ZYRThreadSafety.h"
#include "zyr/std/values/CZYRUniString.h"

namespace ZYRStd {

namespace {

constexpr const char* kSource = "source/zyr/std/CZYRCommonUniStrings";

constexpr std::array<const char*, kCommonUniStringRows> kRowTexts{{
#define ZYR_COMMON_STRING(Name) #Name,
#define ZYR_COMMON_STRING_TEXT(Text) Text,
#include "zyr/std/values/CZYRCommonUniStrings.def"
}};

// An array with too few initialisers would quietly end in null rows.
constexpr unsigned int kListedRows = 0
#define ZYR_COMMON_STRING(Name) +1
#define ZYR_COMMON_STRING_TEXT(Text) +1
#include "zyr/std/values/CZYRCommonUniStrings.def"
    ;
static_assert(kListedRows == kCommonUniStringRows, "CZYRCommonUniStrings.def lists every row");

// Lookup by text: the string's own hash and byte equality.
struct TextHash {
    size_t operator()(const I_UniString* s) const noexcept { return s->hashCode(); }
};
struct TextEqual {
    bool operator()(const I_UniString* a, const I_UniString* b) const noexcept {
        return a->equals(b);
    }
};

class IImpZYRCommonUniStrings final : public IZYRCommonUniStrings {
public:
    IImpZYRCommonUniStrings() {
        rows_.reserve(kCommonUniStringAccessors);
        byText_.reserve(kCommonUniStringRows);
        for (unsigned int row = 0; row < kCommonUniStringRows; ++row) {
            C_Error err;
            C_SmartPtr<I_UniString> s(createUniString(kRowTexts[row], err), false);
            throwCZYRErrorIfErrorOccurred(err);
            // A text listed twice keeps the object of its first row.
            const auto [found, inserted] = byText_.emplace(s.get(), s.get());
            if (inserted)
                owned_.push_back(s);
            if (row < kCommonUniStringAccessors)
                rows_.push_back(C_SmartPtr<I_UniString>(found->second, true));
        }
    }
    ~IImpZYRCommonUniStrings() override;

    C_SmartPtr<I_UniString> GetCachedCommonUniString(unsigned int index) const override {
        if (index >= rows_.size())
            throw CZYRError(ZYRPublic::kZYRErrorBadParam,
                            "String constant invalid in GetCachedCommonUniString", kSource,
                            __LINE__);
        return rows_[index];
    }

    C_SmartPtr<I_UniString> findCommonUniString(const C_SmartPtr<I_UniString>& s) const override {
        if (!s)
            return s;
        const auto found = byText_.find(s.get());
        return found == byText_.end() ? s : C_SmartPtr<I_UniString>(found->second, true);
    }

private:
    std::vector<C_SmartPtr<I_UniString>> rows_;  // rows 0 to 625
    std::vector<C_SmartPtr<I_UniString>> owned_; // one reference per distinct text
    std::unordered_map<const I_UniString*, I_UniString*, TextHash, TextEqual> byText_;
};

IImpZYRCommonUniStrings::~IImpZYRCommonUniStrings() = default;

// Least recently used texts go first; at most 101 entries.
class DynamicUniStringCache {
public:
    C_SmartPtr<I_UniString> intern(const C_SmartPtr<I_UniString>& s) {
        detail::LockGuard lock(mutex_);
        const auto found = index_.find(s.get());
        if (found != index_.end()) {
            entries_.splice(entries_.begin(), entries_, found->second);
            return *found->second;
        }
        if (!cacheable(*s))
            return s;
        if (entries_.size() > kMaxEntriesBeforeInsert) {
            index_.erase(entries_.back().get());
            entries_.pop_back();
        }
        entries_.push_front(s);
        index_.emplace(s.get(), entries_.begin());
        return s;
    }

private:
    static constexpr size_t kMaxEntriesBeforeInsert = 100;
    static constexpr unsigned int kMaxCachedBytes = 520;

    static bool cacheable(const I_UniString& s) {
        unsigned int bytes = 0;
        const auto* units = reinterpret_cast<const char16_t*>(s.getUTF16LEBuffer(&bytes));
        if (bytes > kMaxCachedBytes)
            return false;
        // Temporary file names come and go; caching them would only push useful texts out.
        if (bytes >= 9) {
            const std::u16string_view text(units, bytes / 2);
            if (text.ends_with(u".tmp"))
                return false;
        }
        return true;
    }

    detail::Mutex mutex_;
    std::list<C_SmartPtr<I_UniString>> entries_ ZYR_GUARDED_BY(mutex_);
    std::unordered_map<const I_UniString*, std::list<C_SmartPtr<I_UniString>>::iterator, TextHash,
                       TextEqual>
        index_ ZYR_GUARDED_BY(mutex_);
};

IImpZYRCommonUniStrings* commonStrings = nullptr;
DynamicUniStringCache* dynamicCache = nullptr;

} // namespace

IZYRCommonUniStrings::~IZYRCommonUniStrings() = default;

const char* CommonUniStringText(unsigned int row) {
    return row < kRowTexts.size() ? kRowTexts[row] : nullptr;
}

void InitCommonUniStrings() {
    if (!commonStrings)
        commonStrings = new IImpZYRCommonUniStrings;
}

void ReleaseCommonUniStrings() {
    delete std::exchange(commonStrings, nullptr);
}

IZYRCommonUniStrings* GetCommonUniStrings() {
    if (!commonStrings)
        throw CZYRError(ZYRPublic::kZYRErrorInvalidFuncCall,
                        "CommonUniString singleton not initialized", kSource, __LINE__);
    return commonStrings;
}

void InitDynamicUniStringCache() {
    if (!dynamicCache)
        dynamicCache = new DynamicUniStringCache;
}

void ReleaseDynamicUniStringCache() {
    delete std::exchange(dynamicCache, nullptr);
}

C_SmartPtr<I_UniString> GetUniStringFromDynamicCache(const C_SmartPtr<I_UniString>& s) {
    if (!s || s->isEmpty() || !dynamicCache)
        return s;
    return dynamicCache->intern(s);
}

} // namespace ZYRStd
