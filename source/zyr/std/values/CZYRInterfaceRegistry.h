// A shareable table from interface IDs to registered items, which it may own.
#pragma once

#include <map>

#include "ZYRStdExport.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/core/CZYRSmartPtr.h"

namespace ZYRStd {

class ZYRSTD_API CZYRRegisterItemBase : public CZYRClientBase {
public:
    explicit CZYRRegisterItemBase(int interfaceID) : interfaceID_(interfaceID) {}
    ~CZYRRegisterItemBase() override;
    virtual int getInterfaceID() const { return interfaceID_; }

private:
    int interfaceID_;
};

// Holds one value, typically an interface pointer, with an optional release function.
template <class T> class CZYRCRegisterItem : public CZYRRegisterItemBase {
public:
    using ReleaseProc = void (*)(T*);
    CZYRCRegisterItem(int interfaceID, T value, ReleaseProc releaseProc = nullptr)
        : CZYRRegisterItemBase(interfaceID), value_(value), releaseProc_(releaseProc) {}
    ~CZYRCRegisterItem() override {
        if (releaseProc_)
            releaseProc_(&value_);
    }
    virtual T* getInterface() { return &value_; }

private:
    T value_;
    ReleaseProc releaseProc_;
};

using ZYRRegisterDeleteProc = void (*)(CZYRRegisterItemBase*);
// Destroys the item through its virtual destructor.
ZYRSTD_API void ZYRRegisterInterfaceDefaultDeleteProc(CZYRRegisterItemBase* item);

class IImpZYRInterfaceRegistry;

class ZYRSTD_API CZYRInterfaceRegistry : public CZYRClientBase {
public:
    CZYRInterfaceRegistry();
    CZYRInterfaceRegistry(const CZYRInterfaceRegistry& other);
    CZYRInterfaceRegistry& operator=(const CZYRInterfaceRegistry& other);
    ~CZYRInterfaceRegistry() override;

    // A null item, or a registered ID without `replace`, throws kZYRErrorBadParam and
    // leaves the table as it was.
    void registerInterface(CZYRRegisterItemBase* item, ZYRRegisterDeleteProc deleteProc,
                           bool replace);
    void deleteInterface(int id);
    CZYRRegisterItemBase* queryInterface(int id) const;
    bool hasInterface(int id) const;
    int getNumInterfaces() const;
    bool isShared() const;
    // Shares the items but owns none of them.
    CZYRInterfaceRegistry clone() const;

private:
    explicit CZYRInterfaceRegistry(CZYRSmartZYRRefPtr<IImpZYRInterfaceRegistry> table);

    CZYRSmartZYRRefPtr<IImpZYRInterfaceRegistry> table_;
};

} // namespace ZYRStd
