// The interface registry.
#include "zyr/std/values/CZYRInterfaceRegistry.h"

#include "zyr/std/core/CZYRError.h"
#include "zyr/std/memory/CZYRStdAllocator.h"

namespace ZYRStd {

namespace {
constexpr const char* kSource = "source/zyr/std/CZYRInterfaceRegistry";
}

struct RegistryEntry {
    int id;
    ZYRRegisterDeleteProc deleteProc;
    CZYRRegisterItemBase* item;
};

class IImpZYRInterfaceRegistry : public CZYRClientBase, public CZYRBaseRefCnt {
public:
    ~IImpZYRInterfaceRegistry() override {
        for (const auto& [id, entry] : entries_)
            if (entry.deleteProc)
                entry.deleteProc(entry.item);
    }

    using Entries = std::map<int, RegistryEntry, std::less<int>,
                             CZYRStdAllocator<std::pair<const int, RegistryEntry>>>;
    Entries entries_;
};

CZYRRegisterItemBase::~CZYRRegisterItemBase() = default;

void ZYRRegisterInterfaceDefaultDeleteProc(CZYRRegisterItemBase* item) {
    delete item;
}

CZYRInterfaceRegistry::CZYRInterfaceRegistry() : table_(new IImpZYRInterfaceRegistry) {}

CZYRInterfaceRegistry::CZYRInterfaceRegistry(CZYRSmartZYRRefPtr<IImpZYRInterfaceRegistry> table)
    : table_(std::move(table)) {}

CZYRInterfaceRegistry::CZYRInterfaceRegistry(const CZYRInterfaceRegistry& other) = default;
CZYRInterfaceRegistry&
CZYRInterfaceRegistry::operator=(const CZYRInterfaceRegistry& other) = default;
CZYRInterfaceRegistry::~CZYRInterfaceRegistry() = default;

void CZYRInterfaceRegistry::registerInterface(CZYRRegisterItemBase* item,
                                              ZYRRegisterDeleteProc deleteProc, bool replace) {
    if (!item)
        throw CZYRError(ZYRPublic::kZYRErrorBadParam,
                        "CZYRInterfaceRegistry::registerInterface - item is NULL", kSource,
                        __LINE__);
    auto& entries = table_->entries_;
    const int id = item->getInterfaceID();
    const auto found = entries.find(id);
    if (found != entries.end()) {
        if (!replace)
            throw CZYRError(ZYRPublic::kZYRErrorBadParam,
                            "CZYRInterfaceRegistry::registerInterface - interface already "
                            "registered",
                            kSource, __LINE__);
        // Registering the same item again must not destroy the item being kept.
        const RegistryEntry old = found->second;
        found->second = RegistryEntry{id, deleteProc, item};
        if (old.deleteProc && old.item != item)
            old.deleteProc(old.item);
        return;
    }
    entries.emplace(id, RegistryEntry{id, deleteProc, item});
}

void CZYRInterfaceRegistry::deleteInterface(int id) {
    auto& entries = table_->entries_;
    const auto found = entries.find(id);
    if (found == entries.end())
        return;
    const RegistryEntry entry = found->second;
    entries.erase(found);
    if (entry.deleteProc)
        entry.deleteProc(entry.item);
}

CZYRRegisterItemBase* CZYRInterfaceRegistry::queryInterface(int id) const {
    const auto found = table_->entries_.find(id);
    return found == table_->entries_.end() ? nullptr : found->second.item;
}

bool CZYRInterfaceRegistry::hasInterface(int id) const {
    return table_->entries_.contains(id);
}

int CZYRInterfaceRegistry::getNumInterfaces() const {
    return static_cast<int>(table_->entries_.size());
}

bool CZYRInterfaceRegistry::isShared() const {
    return table_ && table_->isShared();
}

CZYRInterfaceRegistry CZYRInterfaceRegistry::clone() const {
    CZYRInterfaceRegistry copy;
    for (const auto& [id, entry] : table_->entries_)
        copy.registerInterface(entry.item, nullptr, false);
    return copy;
}

} // namespace ZYRStd
