// The small host's job: a dictionary, an identifier and a progress interface, each object
// counted as the interfaces ask.
#include <utility>

#include "I_OEMInterfaceSet.h"
#include "I_OEMInterfaces.h"
#include "ZYRHostKit.h"

namespace ZYRHostKit {

namespace {

using namespace ZYRPublic;

class HostProgress : public Counted<I_OEMProgressInterface> {
public:
    explicit HostProgress(TraceSink onTrace) : onTrace_(std::move(onTrace)) {}

    void traceMsg(const sZYRTraceMsg*, I_Error&) override {}
    void traceMsg(I_Job*, I_Surface*, I_UniString*, I_UniString*, const sZYRTraceMsg* message,
                  const sZYRTraceMsgDetail* detail, I_Error&) override {
        if (onTrace_ && message && detail)
            onTrace_(*message, *detail);
    }
    void beginTraceMsg(I_Job*, I_Surface*, I_UniString*, I_UniString*, const sZYRTraceMsg*,
                       const sZYRTraceMsgDetail*, I_Error&) override {}
    void endTraceMsg(I_Error&) override {}

private:
    TraceSink onTrace_;
};

class HostInterfaces : public Counted<I_OEMInterfaceSet> {
public:
    explicit HostInterfaces(TraceSink onTrace) : onTrace_(std::move(onTrace)) {}

    bool getOEMCuttingInfoMgr(I_OEMCuttingInfoMgr**, I_Error&) override { return false; }
    bool getOEMPDFPreProcessor(I_OEMPDFPreProcessor**, I_Error&) override { return false; }
    bool getOEMTagEvaluatorInterface(I_OEMTagEvaluatorInterface**, I_Error&) override {
        return false;
    }
    bool getOEMXObjectResolver(I_OEMXObjectResolver**, I_Error&) override { return false; }
    bool getOEMXObjMgr(I_OEMXObjMgr**, I_Error&) override { return false; }
    bool getOEMDeviceColorAdjustment(I_OEMDeviceColorAdjustment**, I_Error&) override {
        return false;
    }
    bool getOEMScreenMgr(I_OEMScreenMgr**, I_Error&) override { return false; }
    bool getOEMFrameMarkerFactory(I_OEMFrameMarkerFactory**, I_Error&) override { return false; }
    bool getOEMRasterInterface(I_OEMRasterInterface**, I_Error&) override { return false; }
    bool getOEMRasterBufferMgr(I_OEMRasterBufferMgr**, I_Error&) override { return false; }
    bool getOEMProgressInterface(I_OEMProgressInterface** out, I_Error&) override {
        *out = new HostProgress(onTrace_);
        return true;
    }
    bool getOEMCalibrationMgr(I_OEMCalibrationMgr**, I_Error&) override { return false; }

private:
    TraceSink onTrace_;
};

class HostJob : public Counted<I_Job> {
public:
    HostJob(uint64_t jobID, I_Dict* params, TraceSink onTrace)
        : jobID_(jobID), params_(params, true), onTrace_(std::move(onTrace)) {}

    uint64_t getJobID() const override { return jobID_; }
    // The caller owns the reference it is given, as the interface asks.
    I_Dict* getJobDict(I_Error&) override {
        if (params_)
            params_->addRef();
        return params_.get();
    }
    I_OEMInterfaceSet* getOEMInterfaces(I_Error&) override { return new HostInterfaces(onTrace_); }

private:
    uint64_t jobID_;
    C_SmartPtr<I_Dict> params_;
    TraceSink onTrace_;
};

} // namespace

C_SmartPtr<I_Job> makeHostJob(uint64_t jobID, I_Dict* params, TraceSink onTrace) {
    return C_SmartPtr<I_Job>(new HostJob(jobID, params, std::move(onTrace)), false);
}

} // namespace ZYRHostKit
