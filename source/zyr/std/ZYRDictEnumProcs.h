// Enumeration callbacks that print a dictionary as indented text, or copy it into another.
#pragma once

#include <sstream>

#include "I_Dict.h"
#include "ZYRStdExport.h"
#include "zyr/std/CZYRDict.h"

namespace ZYRStd {

// Pass to I_Dict::enumerate. To print n levels, build it with depth n + 1.
class ZYRSTD_API ZYRDictEnumProcs : public ZYRPublic::I_DictEnumProcs {
public:
    explicit ZYRDictEnumProcs(std::ostringstream& out) : ZYRDictEnumProcs(out, 1, 0) {}
    ZYRDictEnumProcs(std::ostringstream& out, unsigned int depth, unsigned int indent)
        : depth_(depth), indent_(indent), out_(out) {}
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

private:
    template <class Write> bool entry(I_UniString* key, Write write);
    ZYRDictEnumProcs nested() const { return ZYRDictEnumProcs(out_, depth_ - 1, indent_ + 1); }
    void printKey(I_UniString* text, I_Error& err);
    void printIndent();
    void printArrayContents(ZYRDictEnumProcs* procs, I_Array* array, I_Error& err);
    void printDataBufferContents(ZYRPublic::I_DataBuffer* buffer, I_Error& err);

    unsigned int depth_;
    unsigned int indent_;
    std::ostringstream& out_;
};

// Copies every entry it is shown into the target dictionary (objects shared).
class ZYRSTD_API TracingEnumProcs : public CZYRDictEnumProcs {
public:
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
