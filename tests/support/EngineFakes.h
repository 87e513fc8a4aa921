// A small engine of the tests' own: a job, its interface set, a progress interface that
// records what it is sent, and the chain from a surface to its job.
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

// The count protocol for any interface; the last release deletes.
template <class Interface> using RefCounted = ZYRHostKit::Counted<Interface>;

// A new object with its creator's reference adopted.
template <class T, class... Args> C_SmartPtr<T> make(Args&&... args) {
    return C_SmartPtr<T>(new T(std::forward<Args>(args)...), false);
}

template <class Interface> class FakeOEM : public RefCounted<Interface> {};

inline std::string utf8(ZYRPublic::I_UniString* s) {
    if (!s)
        return "<null>";
    unsigned int bytes = 0;
    const char* buffer = s->getUTF16LEBuffer(&bytes);
    std::string out;
    for (unsigned int i = 0; i + 1 < bytes; i += 2)
        out += buffer[i]; // the tests' texts are ASCII
    return out;
}

// Records every call; `failWith` makes each call record that error.
class FakeProgress : public RefCounted<ZYRPublic::I_OEMProgressInterface> {
public:
    struct Call {
        std::string kind; // "whole", "begin", "text", "end"
        std::string area;
        std::string category;
        std::string text;
        int32_t level = -1;
    };

    void traceMsg(const ZYRPublic::sZYRTraceMsg* msg, ZYRPublic::I_Error& err) override {
        record({"text", "", "", textOf(msg), -1}, err);
    }
    void traceMsg(ZYRPublic::I_Job*, ZYRPublic::I_Surface*, ZYRPublic::I_UniString* area,
                  ZYRPublic::I_UniString* category, const ZYRPublic::sZYRTraceMsg* msg,
                  const ZYRPublic::sZYRTraceMsgDetail* detail, ZYRPublic::I_Error& err) override {
        record({"whole", utf8(area), utf8(category), textOf(msg), detail->level}, err);
    }
    void beginTraceMsg(ZYRPublic::I_Job*, ZYRPublic::I_Surface*, ZYRPublic::I_UniString* area,
                       ZYRPublic::I_UniString* category, const ZYRPublic::sZYRTraceMsg* msg,
                       const ZYRPublic::sZYRTraceMsgDetail* detail,
                       ZYRPublic::I_Error& err) override {
        record({"begin", utf8(area), utf8(category), textOf(msg), detail->level}, err);
    }
    void endTraceMsg(ZYRPublic::I_Error& err) override { record({"end", "", "", "", -1}, err); }

    std::vector<Call> calls;
    ZYRPublic::eZYRErrorType failWith = ZYRPublic::kZYRErrorNoError;
    bool throwForeign = false;

private:
    static std::string textOf(const ZYRPublic::sZYRTraceMsg* msg) {
        if (!msg)
            return "<null>";
        if (msg->text)
            return msg->text;
        std::string out;
        for (const char16_t* p = msg->wtext; p && *p; ++p)
            out += static_cast<char>(*p);
        return out;
    }
    void record(Call call, ZYRPublic::I_Error& err) {
        if (throwForeign)
            throw 42;
        calls.push_back(std::move(call));
        if (failWith != ZYRPublic::kZYRErrorNoError)
            err.setError(failWith, "host failed", "fake", 1);
    }
};

// Every getter hands out what its member holds; a null member means "not there".
class FakeInterfaceSet : public RefCounted<ZYRPublic::I_OEMInterfaceSet> {
public:
    C_SmartPtr<ZYRPublic::I_OEMCuttingInfoMgr> cutting;
    C_SmartPtr<ZYRPublic::I_OEMPDFPreProcessor> preProcessor;
    C_SmartPtr<ZYRPublic::I_OEMTagEvaluatorInterface> tagEvaluator;
    C_SmartPtr<ZYRPublic::I_OEMXObjectResolver> xobjectResolver;
    C_SmartPtr<ZYRPublic::I_OEMXObjMgr> xobjMgr;
    C_SmartPtr<ZYRPublic::I_OEMDeviceColorAdjustment> colorAdjustment;
    C_SmartPtr<ZYRPublic::I_OEMScreenMgr> screenMgr;
    C_SmartPtr<ZYRPublic::I_OEMFrameMarkerFactory> frameMarker;
    C_SmartPtr<ZYRPublic::I_OEMRasterInterface> raster;
    C_SmartPtr<ZYRPublic::I_OEMRasterBufferMgr> rasterBuffer;
    C_SmartPtr<ZYRPublic::I_OEMProgressInterface> progress;
    C_SmartPtr<ZYRPublic::I_OEMCalibrationMgr> calibration;
    // A getter that answers "found" but hands out nothing.
    bool claimFound = false;

    bool getOEMCuttingInfoMgr(ZYRPublic::I_OEMCuttingInfoMgr** out, ZYRPublic::I_Error&) override {
        return give(cutting, out);
    }
    bool getOEMPDFPreProcessor(ZYRPublic::I_OEMPDFPreProcessor** out,
                               ZYRPublic::I_Error&) override {
        return give(preProcessor, out);
    }
    bool getOEMTagEvaluatorInterface(ZYRPublic::I_OEMTagEvaluatorInterface** out,
                                     ZYRPublic::I_Error&) override {
        return give(tagEvaluator, out);
    }
    bool getOEMXObjectResolver(ZYRPublic::I_OEMXObjectResolver** out,
                               ZYRPublic::I_Error&) override {
        return give(xobjectResolver, out);
    }
    bool getOEMXObjMgr(ZYRPublic::I_OEMXObjMgr** out, ZYRPublic::I_Error&) override {
        return give(xobjMgr, out);
    }
    bool getOEMDeviceColorAdjustment(ZYRPublic::I_OEMDeviceColorAdjustment** out,
                                     ZYRPublic::I_Error&) override {
        return give(colorAdjustment, out);
    }
    bool getOEMScreenMgr(ZYRPublic::I_OEMScreenMgr** out, ZYRPublic::I_Error&) override {
        return give(screenMgr, out);
    }
    bool getOEMFrameMarkerFactory(ZYRPublic::I_OEMFrameMarkerFactory** out,
                                  ZYRPublic::I_Error&) override {
        return give(frameMarker, out);
    }
    bool getOEMRasterInterface(ZYRPublic::I_OEMRasterInterface** out,
                               ZYRPublic::I_Error&) override {
        return give(raster, out);
    }
    bool getOEMRasterBufferMgr(ZYRPublic::I_OEMRasterBufferMgr** out,
                               ZYRPublic::I_Error&) override {
        return give(rasterBuffer, out);
    }
    bool getOEMProgressInterface(ZYRPublic::I_OEMProgressInterface** out,
                                 ZYRPublic::I_Error&) override {
        return give(progress, out);
    }
    bool getOEMCalibrationMgr(ZYRPublic::I_OEMCalibrationMgr** out, ZYRPublic::I_Error&) override {
        return give(calibration, out);
    }

private:
    template <class I> bool give(const C_SmartPtr<I>& held, I** out) {
        *out = held.get();
        if (*out)
            (*out)->addRef();
        return *out != nullptr || claimFound;
    }
};

class FakeJob : public RefCounted<ZYRPublic::I_Job> {
public:
    uint64_t id = 1;
    C_SmartPtr<ZYRPublic::I_Dict> dict;
    C_SmartPtr<ZYRPublic::I_OEMInterfaceSet> interfaces;

    uint64_t getJobID() const override { return id; }
    ZYRPublic::I_Dict* getJobDict(ZYRPublic::I_Error&) override { return share(dict); }
    ZYRPublic::I_OEMInterfaceSet* getOEMInterfaces(ZYRPublic::I_Error&) override {
        return share(interfaces);
    }

private:
    template <class I> static I* share(const C_SmartPtr<I>& p) {
        if (p)
            p->addRef();
        return p.get();
    }
};

class FakeParent : public RefCounted<ZYRPublic::I_SurfaceOwnerParent> {
public:
    C_SmartPtr<ZYRPublic::I_Job> job;
    ZYRPublic::I_Job* getJob(ZYRPublic::I_Error&) override {
        if (job)
            job->addRef();
        return job.get();
    }
};

class FakeOwner : public RefCounted<ZYRPublic::I_SurfaceOwner> {
public:
    C_SmartPtr<ZYRPublic::I_SurfaceOwnerParent> parent;
    ZYRPublic::I_SurfaceOwnerParent* getOwner(ZYRPublic::I_Error&) override {
        if (parent)
            parent->addRef();
        return parent.get();
    }
};

class FakeSurface : public RefCounted<ZYRPublic::I_Surface> {
public:
    uint64_t id = 0;
    C_SmartPtr<ZYRPublic::I_SurfaceOwner> owner;
    uint64_t getSurfaceID() const override { return id; }
    ZYRPublic::I_SurfaceOwner* getOwner(ZYRPublic::I_Error&) override {
        if (owner)
            owner->addRef();
        return owner.get();
    }
};

// A job with a progress interface and the given parameters; `progress` receives the fake.
inline C_SmartPtr<ZYRPublic::I_Job> makeJob(const ZYRStd::CZYRDict& params,
                                            FakeProgress** progress = nullptr) {
    auto set = make<FakeInterfaceSet>();
    auto host = make<FakeProgress>();
    if (progress)
        *progress = static_cast<FakeProgress*>(host.get());
    static_cast<FakeInterfaceSet*>(set.get())->progress = host;
    auto job = make<FakeJob>();
    auto* fake = static_cast<FakeJob*>(job.get());
    fake->dict = params;
    fake->interfaces = set;
    return job;
}

// A surface whose owner, parent and job are all there; `job` may be null to break the walk.
inline C_SmartPtr<ZYRPublic::I_Surface> makeSurface(uint64_t id,
                                                    const C_SmartPtr<ZYRPublic::I_Job>& job) {
    auto parent = make<FakeParent>();
    static_cast<FakeParent*>(parent.get())->job = job;
    auto owner = make<FakeOwner>();
    static_cast<FakeOwner*>(owner.get())->parent = parent;
    auto surface = make<FakeSurface>();
    static_cast<FakeSurface*>(surface.get())->id = id;
    static_cast<FakeSurface*>(surface.get())->owner = owner;
    return surface;
}

} // namespace zyrtest
