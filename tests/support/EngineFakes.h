#pragma once

#include <string>
#include <utility>
#include <vector>

#include "C_SmartPtr.h"
#include "I_Job.h"
#include "I_Surface.h"
#include "ZYRHostKit.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/values/CZYRDict.h"

namespace zyrtest {

using ZYRPublic::C_SmartPtr;
using ZYRPublic::eZYRErrorType;
using ZYRPublic::I_Error;

template <class Interface> using RefCounted = ZYRHostKit::Counted<Interface>;

template <class T, class... Args> C_SmartPtr<T> make(Args&&... args) {
    return C_SmartPtr<T>(new T(std::forward<Args>(args)...), false);
}

template <class Interface> class FakeOEM : public RefCounted<Interface> {};

template <class Interface> class FakeHolder : public RefCounted<Interface> {
public:
    eZYRErrorType failWith = ZYRPublic::kZYRErrorNoError;

protected:
    template <class I> I* share(const C_SmartPtr<I>& held, I_Error& err) {
        if (failWith != ZYRPublic::kZYRErrorNoError)
            err.setError(failWith, "getter failed", "fake", 1);
        if (held)
            held->addRef();
        return held.get();
    }
};

inline std::string utf8(ZYRPublic::I_UniString* s) {
    unsigned int bytes = 0;
    const char* buffer = s ? s->getUTF16LEBuffer(&bytes) : nullptr;
    std::string out;
    for (unsigned int i = 0; i + 1 < bytes; i += 2)
        out += buffer[i];
    return out;
}

class FakeProgress : public RefCounted<ZYRPublic::I_OEMProgressInterface> {
public:
    using Msg = ZYRPublic::sZYRTraceMsg;
    using Detail = ZYRPublic::sZYRTraceMsgDetail;
    using Text = ZYRPublic::I_UniString;

    void traceMsg(const Msg* msg, I_Error& err) override { record("text: " + textOf(msg), err); }
    void traceMsg(ZYRPublic::I_Job*, ZYRPublic::I_Surface*, Text* area, Text* category,
                  const Msg* msg, const Detail* detail, I_Error& err) override {
        record("whole " + head(area, category, detail) + textOf(msg), err);
    }
    void beginTraceMsg(ZYRPublic::I_Job*, ZYRPublic::I_Surface*, Text* area, Text* category,
                       const Msg* msg, const Detail* detail, I_Error& err) override {
        record("begin " + head(area, category, detail) + textOf(msg), err);
    }
    void endTraceMsg(I_Error& err) override { record("end", err); }
    std::string lastText() const { return calls.back().substr(calls.back().find(": ") + 2); }

    std::vector<std::string> calls;
    eZYRErrorType failWith = ZYRPublic::kZYRErrorNoError;
    bool throwForeign = false;

private:
    static std::string head(Text* area, Text* category, const Detail* detail) {
        return utf8(area) + "/" + utf8(category) + " L" + std::to_string(detail->level) + ": ";
    }
    static std::string textOf(const Msg* msg) {
        std::string out = msg && msg->text ? msg->text : "";
        for (const char16_t* p = msg ? msg->wtext : nullptr; p && *p; ++p)
            out += static_cast<char>(*p);
        return out;
    }
    void record(std::string call, I_Error& err) {
        if (throwForeign)
            throw 42;
        calls.push_back(std::move(call));
        if (failWith != ZYRPublic::kZYRErrorNoError)
            err.setError(failWith, "host failed", "fake", 1);
    }
};

class FakeInterfaceSet : public RefCounted<ZYRPublic::I_OEMInterfaceSet> {
public:
#define ZYRTEST_SLOT(Name, member)                                                                 \
    C_SmartPtr<ZYRPublic::I_OEM##Name> member;                                                     \
    bool getOEM##Name(ZYRPublic::I_OEM##Name** o, I_Error&) override {                             \
        return give(member, o);                                                                    \
    }
    ZYRTEST_SLOT(CuttingInfoMgr, cutting)
    ZYRTEST_SLOT(PDFPreProcessor, preProcessor)
    ZYRTEST_SLOT(TagEvaluatorInterface, tagEvaluator)
    ZYRTEST_SLOT(XObjectResolver, xobjectResolver)
    ZYRTEST_SLOT(XObjMgr, xobjMgr)
    ZYRTEST_SLOT(DeviceColorAdjustment, colorAdjustment)
    ZYRTEST_SLOT(ScreenMgr, screenMgr)
    ZYRTEST_SLOT(FrameMarkerFactory, frameMarker)
    ZYRTEST_SLOT(RasterInterface, raster)
    ZYRTEST_SLOT(RasterBufferMgr, rasterBuffer)
    ZYRTEST_SLOT(ProgressInterface, progress)
    ZYRTEST_SLOT(CalibrationMgr, calibration)
#undef ZYRTEST_SLOT
    bool claimFound = false; // getters answer "found" even when they hand out nothing
    bool denyFound = false;  // getters answer "not found" even when they hand out an object

private:
    template <class I> bool give(const C_SmartPtr<I>& held, I** out) {
        *out = held.get();
        if (*out)
            (*out)->addRef();
        return !denyFound && (*out != nullptr || claimFound);
    }
};

class FakeJob : public FakeHolder<ZYRPublic::I_Job> {
public:
    uint64_t id = 1;
    C_SmartPtr<ZYRPublic::I_Dict> dict;
    C_SmartPtr<ZYRPublic::I_OEMInterfaceSet> interfaces;

    uint64_t getJobID() const override { return id; }
    ZYRPublic::I_Dict* getJobDict(I_Error& err) override { return share(dict, err); }
    ZYRPublic::I_OEMInterfaceSet* getOEMInterfaces(I_Error&) override {
        ZYRStd::C_Error ignored; // only the parameters' getter fails
        return share(interfaces, ignored);
    }
};

class FakeParent : public FakeHolder<ZYRPublic::I_SurfaceOwnerParent> {
public:
    C_SmartPtr<ZYRPublic::I_Job> job;
    ZYRPublic::I_Job* getJob(I_Error& err) override { return share(job, err); }
};

class FakeOwner : public FakeHolder<ZYRPublic::I_SurfaceOwner> {
public:
    C_SmartPtr<FakeParent> parent;
    ZYRPublic::I_SurfaceOwnerParent* getOwner(I_Error& err) override {
        return share(C_SmartPtr<ZYRPublic::I_SurfaceOwnerParent>(parent), err);
    }
};

class FakeSurface : public FakeHolder<ZYRPublic::I_Surface> {
public:
    uint64_t id = 0;
    C_SmartPtr<FakeOwner> owner;
    uint64_t getSurfaceID() const override { return id; }
    ZYRPublic::I_SurfaceOwner* getOwner(I_Error& err) override {
        return share(C_SmartPtr<ZYRPublic::I_SurfaceOwner>(owner), err);
    }
};

inline C_SmartPtr<ZYRPublic::I_Job> makeJob(const ZYRStd::CZYRDict& params,
                                            FakeProgress** progress = nullptr) {
    auto set = make<FakeInterfaceSet>();
    auto host = make<FakeProgress>();
    if (progress)
        *progress = host.get();
    set->progress = host;
    auto job = make<FakeJob>();
    job->dict = params;
    job->interfaces = set;
    return job;
}

inline C_SmartPtr<FakeSurface> makeSurface(uint64_t id, const C_SmartPtr<ZYRPublic::I_Job>& job) {
    auto surface = make<FakeSurface>();
    surface->id = id;
    surface->owner = make<FakeOwner>();
    surface->owner->parent = make<FakeParent>();
    surface->owner->parent->job = job;
    return surface;
}

} // namespace zyrtest
