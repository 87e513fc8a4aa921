// Raster device attributes and colorant order: defaults, validation and comparison.
#include "zyr/std/engine/CZYRRasterDeviceAttributes.h"

#include "zyr/std/core/CZYRError.h"

namespace ZYRStd {

namespace {
constexpr const char* kSource = "source/zyr/std/CZYRRasterDeviceAttributes";
// The line the component check has always reported.
constexpr int kComponentCheckLine = 113;
} // namespace

CZYRColorantOrderArray::~CZYRColorantOrderArray() = default;

const CZYRColorantOrderArray::Entry& CZYRColorantOrderArray::getEntry(unsigned int index) const {
    if (index >= entries_.size())
        throw CZYRError(ZYRPublic::kZYRErrorBadParam, "invalid colorant index", kSource, __LINE__);
    return entries_[index];
}

bool CZYRColorantOrderArray::operator==(const CZYRColorantOrderArray& other) const {
    if (value_ != other.value_ || entries_.size() != other.entries_.size())
        return false;
    for (size_t i = 0; i < entries_.size(); ++i)
        if (!(entries_[i].name == other.entries_[i].name) ||
            entries_[i].number != other.entries_[i].number)
            return false;
    return true;
}

CZYRRasterDeviceAttributes::CZYRRasterDeviceAttributes() : rect_(0.0, 0.0, 612.0, 792.0) {}

CZYRRasterDeviceAttributes::CZYRRasterDeviceAttributes(
    unsigned int numComponents, unsigned int firstValue, double horizontalResolution,
    double verticalResolution, const CZYRRect& rect, unsigned int fourthValue,
    const sZYRDeviceValueBlock& block, bool firstFlag, const CZYRColorantOrderArray& colorantOrder,
    unsigned int secondValue, unsigned int thirdValue, bool secondFlag, bool thirdFlag,
    CZYRArray array)
    : numComponents_(numComponents), rect_(rect), firstValue_(firstValue),
      secondValue_(secondValue), thirdValue_(thirdValue),
      horizontalResolution_(horizontalResolution), verticalResolution_(verticalResolution),
      fourthValue_(fourthValue), block_(block), firstFlag_(firstFlag), secondFlag_(secondFlag),
      colorantOrder_(colorantOrder), thirdFlag_(thirdFlag), array_(std::move(array)) {
    if (numComponents_ != colorantOrder_.getCount() && !thirdFlag_)
        throw CZYRError(ZYRPublic::kZYRErrorBadParam, "invalid num components in colorant array",
                        kSource, kComponentCheckLine);
}

CZYRRasterDeviceAttributes::~CZYRRasterDeviceAttributes() = default;

bool CZYRRasterDeviceAttributes::operator==(const CZYRRasterDeviceAttributes& other) const {
    const unsigned int length = array_.isValid() ? array_.getLength() : 0;
    const unsigned int otherLength = other.array_.isValid() ? other.array_.getLength() : 0;
    // The component count is compared too: with the third flag set it need not follow from
    // the colorant order, and devices of different counts are not the same device.
    return numComponents_ == other.numComponents_ && rect_ == other.rect_ &&
           horizontalResolution_ == other.horizontalResolution_ &&
           verticalResolution_ == other.verticalResolution_ && firstValue_ == other.firstValue_ &&
           secondValue_ == other.secondValue_ && thirdValue_ == other.thirdValue_ &&
           fourthValue_ == other.fourthValue_ && block_ == other.block_ &&
           firstFlag_ == other.firstFlag_ && secondFlag_ == other.secondFlag_ &&
           thirdFlag_ == other.thirdFlag_ && colorantOrder_ == other.colorantOrder_ &&
           length == otherLength;
}

} // namespace ZYRStd
