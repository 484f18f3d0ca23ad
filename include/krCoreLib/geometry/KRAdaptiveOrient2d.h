// orient2d: the exact orientation of three points in the plane, evaluated
// with adaptive precision.
//
// The sign of the determinant (ax - cx)(by - cy) - (ay - cy)(bx - cx) is
// exact for all finite inputs that neither overflow nor underflow on the
// way (magnitudes between about 1e-140 and 1e150 are safe; a difference of
// two coordinates that is not zero must not be subnormal). The value is the
// plain floating-point determinant when its sign is certain, else a closer
// approximation from exact expansion arithmetic: only the sign is exact.
// Non-finite input gives an unspecified value (possibly NaN), never a
// fault.
//
// Most calls cost one rounded determinant and one error-bound test; nearly
// collinear points take one to three further, increasingly exact stages.
// Pure function: callable from any thread.
#pragma once

#include <krCoreLib/core/KRExport.h>

namespace krPolygonTriangulation {

// Positive when a, b, c turn counter-clockwise, negative when they turn
// clockwise, zero when they are collinear (or two of them coincide).
KRCORELIB_API double orient2d(double ax, double ay, double bx, double by, double cx, double cy) noexcept;

}  // namespace krPolygonTriangulation
