/// \file
/// The description of one surface to render: its device, its surface and job, the flags of
/// the surface and of rendering, and the host interfaces that render it.
#pragma once

#include <cstdint>

#include "C_SmartPtr.h"
#include "I_Job.h"
#include "I_Surface.h"
#include "ZYRStdExport.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/engine/CZYRRasterDeviceAttributes.h"
#include "zyr/std/values/CZYRInterfaceRegistry.h"

namespace ZYRStd {

using ZYRPublic::C_SmartPtr;

/// The registry IDs the surface constructor looks up. Their items are
/// CZYRCRegisterItem<I_OEMRasterInterface*> and CZYRCRegisterItem<I_OEMProgressInterface*>.
///@{
constexpr int kZYRRasterInterfaceID = 33;
constexpr int kZYRProgressInterfaceID = 1;
///@}

/// Bits of the surface flag word and of the render flag word.
///@{
constexpr unsigned int kZYRFirstSurface = 1u << 0;
constexpr unsigned int kZYRLastSurface = 1u << 1;
constexpr unsigned int kZYRFrontSurface = 1u << 2;
constexpr unsigned int kZYRUseDocumentTransfers = 1u << 0;
constexpr unsigned int kZYRTrapInEmulatedColorSpace = 1u << 1;
///@}

/// What the renderer needs about one surface: its device, surface and job, their identifiers, the
/// surface and render flags and the host's raster and progress interfaces, plus a registry for
/// resources that live with the surface. Holds one reference to each interface; a plain value type,
/// one thread at a time.
class ZYRSTD_API CZYRSurfaceRenderAttributes : public CZYRClientBase {
public:
    /// A default device and no surface, job or interfaces.
    CZYRSurfaceRenderAttributes();
    /// The end of a job: default device, both identifiers the job's, the last-surface flag.
    CZYRSurfaceRenderAttributes(const C_SmartPtr<ZYRPublic::I_Job>& job,
                                const C_SmartPtr<ZYRPublic::I_OEMProgressInterface>& progress,
                                const C_Error& err);
    /// Finds the job through the surface (kZYRErrorInvalidData "miss job" when a step is
    /// missing) and the raster and progress interfaces in `interfaces`
    /// (kZYRErrorInvalidData "missing interface" when one is not there).
    CZYRSurfaceRenderAttributes(const CZYRRasterDeviceAttributes& device,
                                const C_SmartPtr<ZYRPublic::I_Surface>& surface,
                                unsigned int surfaceFlags, unsigned int renderFlags,
                                const CZYRInterfaceRegistry& interfaces,
                                const unsigned long long& jobID);
    /// Copies every member; the interfaces gain a reference each.
    ///@{
    CZYRSurfaceRenderAttributes(const CZYRSurfaceRenderAttributes&) = default;
    CZYRSurfaceRenderAttributes& operator=(const CZYRSurfaceRenderAttributes&) = default;
    ///@}
    ~CZYRSurfaceRenderAttributes() override;

    /// Device, surface, job and interfaces (as pointers), identifiers and flags; not the
    /// error status nor the resource holder.
    bool operator==(const CZYRSurfaceRenderAttributes& other) const;

    /// The getters return borrowed references, valid for the object's life. getZYRSurface is
    /// another name for getSurface; getError is the status the job constructor was given.
    ///@{
    const CZYRRasterDeviceAttributes& getRasterDeviceAttributes() const { return device_; }
    const C_SmartPtr<ZYRPublic::I_Surface>& getSurface() const { return surface_; }
    const C_SmartPtr<ZYRPublic::I_Surface>& getZYRSurface() const { return surface_; }
    const C_SmartPtr<ZYRPublic::I_Job>& getJob() const { return job_; }
    unsigned long long getJobID() const { return jobID_; }
    unsigned long long getSurfaceID() const { return surfaceID_; }
    const C_SmartPtr<ZYRPublic::I_OEMRasterInterface>& getOEMRasterInterface() const {
        return raster_;
    }
    const C_SmartPtr<ZYRPublic::I_OEMProgressInterface>& getOEMProgessInterface() const {
        return progress_;
    }
    const C_Error& getError() const { return error_; }
    CZYRInterfaceRegistry& getResourceHolder() { return resources_; }
    ///@}

    /// Tests of the surface flags (endOfJob is isLastSurface) and of the render flags.
    ///@{
    bool isFirstSurface() const { return (surfaceFlags_ & kZYRFirstSurface) != 0; }
    bool isLastSurface() const { return (surfaceFlags_ & kZYRLastSurface) != 0; }
    bool endOfJob() const { return (surfaceFlags_ & kZYRLastSurface) != 0; }
    bool isFrontSurface() const { return (surfaceFlags_ & kZYRFrontSurface) != 0; }
    bool useDocumentTransfers() const { return (renderFlags_ & kZYRUseDocumentTransfers) != 0; }
    bool trapInEmulatedColorSpace() const {
        return (renderFlags_ & kZYRTrapInEmulatedColorSpace) != 0;
        ///@}
    }

    /// The device extent in pixels, rounded up (saturating at the ends of int).
    ///@{
    int getWidth() const;
    int getHeight() const;
    ///@}

private:
    void findJob();
    void findInterfaces(const CZYRInterfaceRegistry& interfaces);

    CZYRRasterDeviceAttributes device_;
    C_SmartPtr<ZYRPublic::I_Surface> surface_;
    unsigned long long jobID_ = 0;
    unsigned long long surfaceID_ = 0;
    unsigned int surfaceFlags_ = 0;
    unsigned int renderFlags_ = 0;
    C_SmartPtr<ZYRPublic::I_OEMRasterInterface> raster_;
    C_SmartPtr<ZYRPublic::I_OEMProgressInterface> progress_;
    C_SmartPtr<ZYRPublic::I_Job> job_;
    C_Error error_;
    CZYRInterfaceRegistry resources_;
};

} // namespace ZYRStd
