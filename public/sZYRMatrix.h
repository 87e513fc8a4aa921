/// \file
/// The affine transform record that crosses module boundaries (PDF row-vector order).
#pragma once

namespace ZYRPublic {

/// A point (x, y) maps to (a x + c y + tx, b x + d y + ty).
struct sZYRMatrix {
    double a;  ///< x scale and rotation
    double b;  ///< rotation and skew of y by x
    double c;  ///< rotation and skew of x by y
    double d;  ///< y scale and rotation
    double tx; ///< horizontal translation
    double ty; ///< vertical translation
};

} // namespace ZYRPublic
