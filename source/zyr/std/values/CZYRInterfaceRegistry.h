/// \file
/// A shareable table from interface IDs to registered items, which it may own.
#pragma once

#include <map>

#include "ZYRStdExport.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/core/CZYRSmartPtr.h"

namespace ZYRStd {

/// An entry of a registry: the interface ID it is registered under.
class ZYRSTD_API CZYRRegisterItemBase : public CZYRClientBase {
public:
    /// Made with the ID the item is registered under; getInterfaceID returns it.
    ///@{
    explicit CZYRRegisterItemBase(int interfaceID) : interfaceID_(interfaceID) {}
    ~CZYRRegisterItemBase() override;
    virtual int getInterfaceID() const { return interfaceID_; }
    ///@}

private:
    int interfaceID_;
};

/// Holds one value, typically an interface pointer, with an optional release function.
template <class T> class CZYRCRegisterItem : public CZYRRegisterItemBase {
public:
    /// Called on the value when the item is destroyed.
    using ReleaseProc = void (*)(T*);
    /// Holds `value` under `interfaceID`.
    CZYRCRegisterItem(int interfaceID, T value, ReleaseProc releaseProc = nullptr)
        : CZYRRegisterItemBase(interfaceID), value_(value), releaseProc_(releaseProc) {}
    ~CZYRCRegisterItem() override {
        if (releaseProc_)
            releaseProc_(&value_);
    }
    /// The held value, borrowed for the item's life.
    virtual T* getInterface() { return &value_; }

private:
    T value_;
    ReleaseProc releaseProc_;
};

/// How a registry that owns an item destroys it.
using ZYRRegisterDeleteProc = void (*)(CZYRRegisterItemBase*);
/// Destroys the item through its virtual destructor.
ZYRSTD_API void ZYRRegisterInterfaceDefaultDeleteProc(CZYRRegisterItemBase* item);

class IImpZYRInterfaceRegistry;

/// A table from interface IDs to items, shared between copies (assignment shares too; clone makes a
/// table of its own). One thread at a time.
class ZYRSTD_API CZYRInterfaceRegistry : public CZYRClientBase {
public:
    CZYRInterfaceRegistry();
    /// Shares the other's table.
    ///@{
    CZYRInterfaceRegistry(const CZYRInterfaceRegistry& other);
    CZYRInterfaceRegistry& operator=(const CZYRInterfaceRegistry& other);
    ///@}
    ~CZYRInterfaceRegistry() override;

    /// A null item, or a registered ID without `replace`, throws kZYRErrorBadParam and
    /// leaves the table as it was.
    void registerInterface(CZYRRegisterItemBase* item, ZYRRegisterDeleteProc deleteProc,
                           bool replace);
    /// Removes the item and calls its delete function, if it was given one; an unknown ID is
    /// ignored.
    void deleteInterface(int id);
    /// The item, borrowed, or null.
    CZYRRegisterItemBase* queryInterface(int id) const;
    /// True when an item is registered under `id`.
    bool hasInterface(int id) const;
    /// The number of items.
    int getNumInterfaces() const;
    /// True when other registries share the table.
    bool isShared() const;
    /// Shares the items but owns none of them.
    CZYRInterfaceRegistry clone() const;

private:
    explicit CZYRInterfaceRegistry(CZYRSmartZYRRefPtr<IImpZYRInterfaceRegistry> table);

    CZYRSmartZYRRefPtr<IImpZYRInterfaceRegistry> table_;
};

} // namespace ZYRStd
