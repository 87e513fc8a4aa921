/// \file
/// The parameters of a stroke: width, miter limit, dashes, caps and joins, and a matrix.
#pragma once

#include <cstdint>

#include "ZYRStdExport.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/geometry/CZYRMatrix.h"
#include "zyr/std/memory/CZYRMemBuffer.h"

namespace ZYRStd {

/// The engine's values; the library only stores, copies and compares them.
///@{
enum eZYRLineCapType : int32_t { kZYRLineCapDefault = 2 };
enum eZYRLineJoinType : int32_t { kZYRLineJoinDefault = 0 };
///@}

/// The stroke values as one record, for code that takes them whole.
struct sStrokeParams {
    float lineWidth;           ///< never below 0
    float miterLimit;          ///< at least 1
    float dashOffset;          ///< where the dash pattern starts
    int32_t dashCount;         ///< entries in dashArray
    float* dashArray;          ///< into the owning CZYRStrokeParams' dash storage, or null
    bool strokeAdjust;         ///< stroke adjustment on
    eZYRLineCapType lineCap;   ///< cap of open ends
    eZYRLineJoinType lineJoin; ///< join of segments
    int32_t extra;             ///< a further value no setter changes; 0
};

/// The parameters of one stroke, with dash storage of its own: width 1, miter limit 10, no dashes
/// by default. A plain value type, one thread at a time.
class ZYRSTD_API CZYRStrokeParams : public CZYRClientBase {
public:
    CZYRStrokeParams() = default;
    /// The copy gets dash storage of its own.
    ///@{
    CZYRStrokeParams(const CZYRStrokeParams& other);
    CZYRStrokeParams& operator=(const CZYRStrokeParams& other);
    ///@}
    ~CZYRStrokeParams() override;

    /// The values as one record, borrowed; its dash pointer lives until the dashes change.
    const sStrokeParams& getStrokeParams() const { return params_; }
    /// The stroke's matrix, borrowed.
    const CZYRMatrix& getMatrix() const { return matrix_; }
    /// Sets the stroke's matrix.
    void setMatrix(const CZYRMatrix& matrix) { matrix_ = matrix; }

    /// A width not above 0 (or not a number) stores 0.
    void setLineWidth(float width);
    /// A limit not above 1 (or not a number) stores 1.
    void setMiterLimit(float limit);
    /// Sets where the dash pattern starts.
    void setDashedOffset(float offset) { params_.dashOffset = offset; }
    /// Copies `count` values into the dash storage, which grows but never shrinks. A negative
    /// count, or values missing for a positive one, throws kZYRErrorBadParam.
    void setDashedArray(const float* values, int count);
    /// Turns stroke adjustment on or off.
    void setStrokeAdjust(bool adjust) { params_.strokeAdjust = adjust; }
    /// Sets the cap of open ends.
    void setLineCap(eZYRLineCapType cap) { params_.lineCap = cap; }
    /// Sets the join of segments.
    void setLineJoin(eZYRLineJoinType join) { params_.lineJoin = join; }

    /// Width, miter limit, offset, adjust, count, cap, join, and the dash values when both
    /// have some in different storage.
    bool operator==(const CZYRStrokeParams& other) const;

private:
    CZYRMemBuffer<float> dashStorage_;
    sStrokeParams params_{
        1.0f, 10.0f, 0.0f, 0, nullptr, false, kZYRLineCapDefault, kZYRLineJoinDefault, 0};
    CZYRMatrix matrix_;
};

} // namespace ZYRStd
