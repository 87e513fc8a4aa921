/// \file
/// The axis-aligned rectangle record that crosses module boundaries.
#pragma once

namespace ZYRPublic {

/// The field order is part of the interface: the second pair is top, then right.
struct sZYRRect {
    double left;   ///< smallest x
    double bottom; ///< smallest y
    double top;    ///< largest y
    double right;  ///< largest x
};

} // namespace ZYRPublic
