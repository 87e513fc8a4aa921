// The axis-aligned rectangle record that crosses module boundaries.
#pragma once

namespace ZYRPublic {

// The field order is part of the interface: the second pair is top, then right.
struct sZYRRect {
    double left;
    double bottom;
    double top;
    double right;
};

} // namespace ZYRPublic
