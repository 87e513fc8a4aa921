// Surface render attributes: the constructors' walk to the job and the interface look-ups.
#include "zyr/std/engine/CZYRSurfaceRenderAttributes.h"

#include <climits>
#include <cmath>

namespace ZYRStd {

using namespace ZYRPublic;

namespace {

constexpr const char* kSource = "source/zyr/std/CZYRSurfaceRenderAttributes";
// The lines these errors have always reported.
constexpr int kMissJobLine = 46;
constexpr int kMissingRasterLine = 57;
constexpr int kMissingProgressLine = 65;

// The registered value of `id` as an interface with a new reference, or null.
template <class Interface>
C_SmartPtr<Interface> registered(const CZYRInterfaceRegistry& interfaces, int id) {
    // A host may have registered an item of another type under the identifier: treated as
    // missing rather than read as the wrong type.
    auto* item = dynamic_cast<CZYRCRegisterItem<Interface*>*>(interfaces.queryInterface(id));
    if (!item)
        return {};
    return C_SmartPtr<Interface>(*item->getInterface(), true);
}

int pixels(double extent, double resolution) {
    const double value = std::ceil(extent * resolution);
    if (std::isnan(value))
        return 0;
    if (value >= static_cast<double>(INT_MAX))
        return INT_MAX;
    if (value <= static_cast<double>(INT_MIN))
        return INT_MIN;
    return static_cast<int>(value);
}

} // namespace

CZYRSurfaceRenderAttributes::CZYRSurfaceRenderAttributes() = default;

CZYRSurfaceRenderAttributes::CZYRSurfaceRenderAttributes(
    const C_SmartPtr<I_Job>& job, const C_SmartPtr<I_OEMProgressInterface>& progress,
    const C_Error& err)
    : jobID_(job ? job->getJobID() : 0), surfaceID_(jobID_), surfaceFlags_(kZYRLastSurface),
      progress_(progress), job_(job), error_(err) {}

CZYRSurfaceRenderAttributes::CZYRSurfaceRenderAttributes(const CZYRRasterDeviceAttributes& device,
                                                         const C_SmartPtr<I_Surface>& surface,
                                                         unsigned int surfaceFlags,
                                                         unsigned int renderFlags,
                                                         const CZYRInterfaceRegistry& interfaces,
                                                         const unsigned long long& jobID)
    : device_(device), surface_(surface), jobID_(jobID),
      surfaceID_(surface ? surface->getSurfaceID() : 0), surfaceFlags_(surfaceFlags),
      renderFlags_(renderFlags) {
    findJob();
    findInterfaces(interfaces);
}

CZYRSurfaceRenderAttributes::~CZYRSurfaceRenderAttributes() = default;

void CZYRSurfaceRenderAttributes::findJob() {
    C_Error err;
    if (surface_) {
        C_SmartPtr<I_SurfaceOwner> owner(surface_->getOwner(err), false);
        throwCZYRErrorIfErrorOccurred(err);
        if (owner) {
            C_SmartPtr<I_SurfaceOwnerParent> parent(owner->getOwner(err), false);
            throwCZYRErrorIfErrorOccurred(err);
            if (parent) {
                job_ = C_SmartPtr<I_Job>(parent->getJob(err), false);
                throwCZYRErrorIfErrorOccurred(err);
            }
        }
    }
    if (!job_)
        throw CZYRError(kZYRErrorInvalidData, "miss job", kSource, kMissJobLine);
}

void CZYRSurfaceRenderAttributes::findInterfaces(const CZYRInterfaceRegistry& interfaces) {
    raster_ = registered<I_OEMRasterInterface>(interfaces, kZYRRasterInterfaceID);
    if (!raster_)
        throw CZYRError(kZYRErrorInvalidData, "missing interface", kSource, kMissingRasterLine);
    progress_ = registered<I_OEMProgressInterface>(interfaces, kZYRProgressInterfaceID);
    if (!progress_)
        throw CZYRError(kZYRErrorInvalidData, "missing interface", kSource, kMissingProgressLine);
}

bool CZYRSurfaceRenderAttributes::operator==(const CZYRSurfaceRenderAttributes& other) const {
    if (this == &other)
        return true;
    return device_ == other.device_ && surface_.get() == other.surface_.get() &&
           job_.get() == other.job_.get() && raster_.get() == other.raster_.get() &&
           progress_.get() == other.progress_.get() && jobID_ == other.jobID_ &&
           surfaceID_ == other.surfaceID_ && surfaceFlags_ == other.surfaceFlags_ &&
           renderFlags_ == other.renderFlags_;
}

int CZYRSurfaceRenderAttributes::getWidth() const {
    const sZYRRect& r = device_.getRect();
    return pixels(r.right - r.left, device_.getHorizontalResolution());
}

int CZYRSurfaceRenderAttributes::getHeight() const {
    const sZYRRect& r = device_.getRect();
    return pixels(r.top - r.bottom, device_.getVerticalResolution());
}

} // namespace ZYRStd
