// The affine transform record that crosses module boundaries (PDF row-vector order).
#pragma once

namespace ZYRPublic {

// A point (x, y) maps to (a x + c y + tx, b x + d y + ty).
struct sZYRMatrix {
    double a;
    double b;
    double c;
    double d;
    double tx;
    double ty;
};

} // namespace ZYRPublic
