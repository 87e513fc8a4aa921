/// \file
/// Enumeration callbacks that print a dictionary as indented text, or copy it into another.
#pragma once

#include <sstream>

#include "I_Dict.h"
#include "ZYRStdExport.h"
#include "zyr/std/values/CZYRDict.h"

namespace ZYRStd {

/// Pass to I_Dict::enumerate. To print n levels, build it with depth n + 1.
class ZYRSTD_API ZYRDictEnumProcs : public ZYRPublic::I_DictEnumProcs {
public:
    /// Prints into `out`, borrowed for the callbacks' life: one level, no indent, or `depth`
    /// levels from `indent` spaces in. One thread at a time.
    ///@{
    explicit ZYRDictEnumProcs(std::ostringstream& out) : ZYRDictEnumProcs(out, 1, 0) {}
    ZYRDictEnumProcs(std::ostringstream& out, unsigned int depth, unsigned int indent)
        : depth_(depth), indent_(indent), out_(out) {}
    ///@}
    /// Prints into the same stream, at the same place in the walk.
    ZYRDictEnumProcs(const ZYRDictEnumProcs&) = default;
    virtual ~ZYRDictEnumProcs();

    bool enumProc(I_UniString* key, ZYRPublic::I_DataBuffer* value, I_Error& err) override;
    bool enumProc(I_UniString* key, I_Array* value, I_Error& err) override;
    bool enumProc(I_UniString* key, I_Dict* value, I_Error& err) override;
    bool enumProc(I_UniString* key, I_UniString* value, I_Error& err) override;
    bool enumProc(I_UniString* key, bool value, I_Error& err) override;
    bool enumProc(I_UniString* key, double value, I_Error& err) override;
    bool enumProc(I_UniString* key, unsigned int value, I_Error& err) override;
    bool enumProc(I_UniString* key, int32_t value, I_Error& err) override;

    /// Containers nested deeper than this below the printed one are shown as "...".
    static constexpr unsigned int kMaxNesting = 256;

private:
    template <class Write> bool entry(I_UniString* key, Write write);
    /// The callbacks for `container`, one level further in (the depth never wraps below 0).
    ZYRDictEnumProcs nested(const void* container) const;
    /// Writes "<cycle>" or "..." in place of `container` when it must not be walked; true
    /// when it was written.
    bool refuseToDescend(const void* container);
    void printKey(I_UniString* text, I_Error& err);
    void printIndent();
    void printArrayContents(ZYRDictEnumProcs* procs, I_Array* array, I_Error& err);
    void printDataBufferContents(ZYRPublic::I_DataBuffer* buffer, I_Error& err);

    unsigned int depth_;
    unsigned int indent_;
    std::ostringstream& out_;
    /// The walk so far: the callbacks one level out and the container these ones walk (both
    /// null for the outermost), and how many containers deep this is.
    const ZYRDictEnumProcs* parent_ = nullptr;
    const void* container_ = nullptr;
    unsigned int level_ = 0;
};

/// Copies every entry it is shown into the target dictionary (objects shared).
class ZYRSTD_API TracingEnumProcs : public CZYRDictEnumProcs {
public:
    /// Copies into `target`, which it shares.
    explicit TracingEnumProcs(const CZYRDict& target) : target_(target) {}
    ~TracingEnumProcs() override;

    bool enumProc(const CZYRUniString& key, const CZYRDataBuffer& value) override;
    bool enumProc(const CZYRUniString& key, const CZYRArray& value) override;
    bool enumProc(const CZYRUniString& key, const CZYRDict& value) override;
    bool enumProc(const CZYRUniString& key, const CZYRUniString& value) override;
    bool enumProc(const CZYRUniString& key, bool value) override;
    bool enumProc(const CZYRUniString& key, double value) override;
    bool enumProc(const CZYRUniString& key, unsigned int value) override;
    bool enumProc(const CZYRUniString& key, int32_t value) override;

private:
    CZYRDict target_;
};

} // namespace ZYRStd
