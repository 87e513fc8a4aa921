/// \file
/// The raster device a surface is rendered for (CZYRRasterDeviceAttributes) and its colorant
/// order (CZYRColorantOrderArray). The library stores, copies and compares these values;
/// their meanings belong to the engine's modules.
#pragma once

#include <cstdint>
#include <vector>

#include "ZYRStdExport.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/geometry/CZYRRect.h"
#include "zyr/std/memory/CZYRStdAllocator.h"
#include "zyr/std/values/CZYRDict.h"
#include "zyr/std/values/CZYRString.h"

namespace ZYRStd {

/// The device's colorants in output order, each a name and a number, with one extra value; a plain
/// value type, one thread at a time.
class ZYRSTD_API CZYRColorantOrderArray : public CZYRClientBase {
public:
    /// One colorant.
    struct Entry {
        CZYRString name; ///< the colorant's name
        int32_t number;  ///< the engine's number for it
    };

    CZYRColorantOrderArray() = default;
    /// Copies the entries and the value.
    ///@{
    CZYRColorantOrderArray(const CZYRColorantOrderArray&) = default;
    CZYRColorantOrderArray& operator=(const CZYRColorantOrderArray&) = default;
    ///@}
    ~CZYRColorantOrderArray() override;

    /// Appends a colorant.
    void add(const CZYRString& name, int32_t number) { entries_.push_back({name, number}); }
    /// The number of colorants.
    unsigned int getCount() const { return static_cast<unsigned int>(entries_.size()); }
    /// Throws kZYRErrorBadParam past the end.
    const Entry& getEntry(unsigned int index) const;
    /// The extra value, 0 until set.
    int32_t getValue() const { return value_; }
    /// Sets the extra value.
    void setValue(int32_t value) { value_ = value; }

    /// Entry by entry (name and number), and the extra value.
    bool operator==(const CZYRColorantOrderArray& other) const;

private:
    std::vector<Entry, CZYRStdAllocator<Entry>> entries_;
    int32_t value_ = 0;
};

/// Four 32-bit values the device carries as one block, {2, 1, 512, 0} by default.
struct sZYRDeviceValueBlock {
    /// The four values, in the device's order.
    int32_t value[4];
    /// All four equal.
    bool operator==(const sZYRDeviceValueBlock&) const = default;
};

/// The raster device one surface is rendered for: component count, page rectangle, resolutions,
/// colorant order and the engine's further values and flags, which the library only keeps. A plain
/// value type, one thread at a time.
class ZYRSTD_API CZYRRasterDeviceAttributes : public CZYRClientBase {
public:
    /// 0 components, 612 by 792 at 300 by 300, further values 8, 1, 1, 1, block {2, 1, 512,
    /// 0}, flags clear, no colorants, an empty array.
    CZYRRasterDeviceAttributes();
    /// Throws kZYRErrorBadParam "invalid num components in colorant array" when the number of
    /// components differs from the colorant count and `thirdFlag` is false.
    CZYRRasterDeviceAttributes(unsigned int numComponents, unsigned int firstValue,
                               double horizontalResolution, double verticalResolution,
                               const CZYRRect& rect, unsigned int fourthValue,
                               const sZYRDeviceValueBlock& block, bool firstFlag,
                               const CZYRColorantOrderArray& colorantOrder,
                               unsigned int secondValue, unsigned int thirdValue, bool secondFlag,
                               bool thirdFlag, CZYRArray array);
    /// Copies every value; the array is shared (one more reference).
    ///@{
    CZYRRasterDeviceAttributes(const CZYRRasterDeviceAttributes&) = default;
    CZYRRasterDeviceAttributes& operator=(const CZYRRasterDeviceAttributes&) = default;
    ///@}
    ~CZYRRasterDeviceAttributes() override;

    /// The getters return what the constructor was given, borrowed for the object's life where a
    /// reference.
    ///@{
    unsigned int getNumComponents() const { return numComponents_; }
    const CZYRRect& getRect() const { return rect_; }
    unsigned int getFirstValue() const { return firstValue_; }
    unsigned int getSecondValue() const { return secondValue_; }
    unsigned int getThirdValue() const { return thirdValue_; }
    double getHorizontalResolution() const { return horizontalResolution_; }
    double getVerticalResolution() const { return verticalResolution_; }
    unsigned int getFourthValue() const { return fourthValue_; }
    const sZYRDeviceValueBlock& getValueBlock() const { return block_; }
    bool getFirstFlag() const { return firstFlag_; }
    bool getSecondFlag() const { return secondFlag_; }
    const CZYRColorantOrderArray& getColorantOrder() const { return colorantOrder_; }
    bool getThirdFlag() const { return thirdFlag_; }
    const CZYRArray& getArray() const { return array_; }
    ///@}

    /// Every value, the colorant order, and arrays of the same length.
    bool operator==(const CZYRRasterDeviceAttributes& other) const;

private:
    unsigned int numComponents_ = 0;
    CZYRRect rect_;
    unsigned int firstValue_ = 8;
    unsigned int secondValue_ = 1;
    unsigned int thirdValue_ = 1;
    double horizontalResolution_ = 300.0;
    double verticalResolution_ = 300.0;
    unsigned int fourthValue_ = 1;
    sZYRDeviceValueBlock block_{2, 1, 512, 0};
    bool firstFlag_ = false;
    bool secondFlag_ = false;
    CZYRColorantOrderArray colorantOrder_;
    bool thirdFlag_ = false;
    CZYRArray array_;
};

} // namespace ZYRStd
