// CKRMathT: the scalar helpers of the math and geometry classes.
//
// A static-only class over a precision pair: Real is the type stored and
// computed in, Other the library's other precision. Exactly the pairs
// <float, double> and <double, float> exist; both are compiled into the
// library. It gathers the numeric constants, thin wrappers of the C
// runtime's mathematics, rounding and tolerant comparison, pseudo-random
// numbers, special functions, polynomial fast approximations and helpers for
// angles, lines, circles, arcs and polygons in the x-y plane.
//
// The constants are single-precision values in both instantiations: the
// double instantiation carries pi, e, epsilon and the tolerance rounded to
// single precision and widened, so angles computed with them inherit the
// single-precision pi (about 8.7e-8 above pi). INV_TWO_PI holds 2 / pi.
//
// Angles are radians unless a name says degrees. Nothing throws. Functions
// reporting success return 1 or 0; a construction that fails (collinear or
// coincident points, a straight arc, non-finite input) returns 0 and leaves
// its outputs unwritten. Output pointers may be null: nothing is written
// there. Functions taking points read only x and y; where they write a point
// they set its x and y, keep its z and set w to 1. Point arrays may be null
// when their count is 0; a null array counts as empty.
//
// Thread safety: everything may be called from any thread. The random
// functions share one process-wide generator (updated atomically), so
// sequences drawn by several threads interleave.
#pragma once

#include <krCoreLib/core/KRExport.h>

#include <bit>
#include <cfloat>
#include <climits>
#include <cmath>
#include <cstdint>
#include <type_traits>

template <class Real, class Other>
class CKRPoint2T;
template <class Real, class Other>
class CKRPoint4T;

template <class Real, class Other>
class CKRMathT {
  static_assert((std::is_same_v<Real, float> && std::is_same_v<Other, double>) ||
                    (std::is_same_v<Real, double> && std::is_same_v<Other, float>),
                "the precision pairs are <float, double> and <double, float>");

public:
  using Point2 = CKRPoint2T<Real, Other>;
  using Point4 = CKRPoint4T<Real, Other>;

  // ---- constants (single-precision values, widened in the double class) ----
  static constexpr Real EPSILON = Real(FLT_EPSILON);  // 2^-23
  static constexpr Real ZERO_TOLERANCE = Real(1e-6f);
  static constexpr Real MAX_REAL = Real(FLT_MAX);
  static constexpr Real PI = Real(3.14159265358979323846f);
  static constexpr Real TWO_PI = Real(2) * PI;
  static constexpr Real HALF_PI = PI / Real(2);
  static constexpr Real QUARTER_PI = PI / Real(4);
  static constexpr Real INV_PI = Real(1.0f / 3.14159265358979323846f);
  // 2 / pi (not 1 / (2 pi)); callers rely on this value.
  static constexpr Real INV_TWO_PI = Real(2.0f / 3.14159265358979323846f);
  static constexpr Real DEG_TO_RAD = PI / Real(180);
  static constexpr Real RAD_TO_DEG = Real(180) / PI;
  static constexpr Real E = Real(2.71828182845904523536f);
  static constexpr Real ONE_DEGREE = DEG_TO_RAD;
  static constexpr Real TWO_DEGREES = Real(2) * DEG_TO_RAD;
  static constexpr Real THREE_DEGREES = Real(3) * DEG_TO_RAD;
  static constexpr Real FIVE_DEGREES = Real(5) * DEG_TO_RAD;
  static constexpr Real TEN_DEGREES = Real(10) * DEG_TO_RAD;

  CKRMathT& operator=(const CKRMathT&) = default;

  // ---- elementary functions: the runtime's, in Real precision ----
  static Real ATan(Real x) { return std::atan(x); }
  static Real ATan2(Real y, Real x) { return std::atan2(y, x); }
  static Real Ceil(Real x) { return std::ceil(x); }
  static Real Cos(Real x) { return std::cos(x); }
  static Real Exp(Real x) { return std::exp(x); }
  static Real FAbs(Real x) { return std::fabs(x); }
  static Real Floor(Real x) { return std::floor(x); }
  static Real FMod(Real x, Real y) { return std::fmod(x, y); }
  static Real Log(Real x) { return std::log(x); }
  static Real Pow(Real x, Real y) { return std::pow(x, y); }
  static Real Sin(Real x) { return std::sin(x); }
  static Real Sqrt(Real x) { return std::sqrt(x); }
  static Real Tan(Real x) { return std::tan(x); }
  static Real InvSqrt(Real x) { return Real(1) / std::sqrt(x); }
  static Real Sqr(Real x) { return x * x; }
  static void Swap(Real& a, Real& b) {
    const Real kept = a;
    a = b;
    b = kept;
  }
  static Real SimpleABS(Real x) { return x > 0 ? x : -x; }
  // abs(INT_MIN) is not representable: it gives INT_MAX.
  static int Abs(int x) { return x >= 0 ? x : (x == INT_MIN ? INT_MAX : -x); }
  static int Sign(int x) { return x > 0 ? 1 : (x < 0 ? -1 : 0); }
  // 1, -1, or 0 (for both zeros and for a NaN).
  static Real Sign(Real x) { return x > 0 ? Real(1) : (x < 0 ? Real(-1) : Real(0)); }
  // Out-of-range arguments are clamped: ACos gives PI at or below -1 and 0
  // at or above 1; ASin gives -HALF_PI and HALF_PI.
  static Real ACos(Real x) { return x <= Real(-1) ? PI : (x >= Real(1) ? Real(0) : std::acos(x)); }
  static Real ASin(Real x) { return x <= Real(-1) ? -HALF_PI : (x >= Real(1) ? HALF_PI : std::asin(x)); }
  // Use these literal factors, not RAD_TO_DEG / DEG_TO_RAD.
  static Real RadToDeg(const Real& x) { return x * Real(57.29577951308); }
  static Real DegToRad(const Real& x) { return x * Real(0.01745329251994); }
  static void ConvertToDeg(Real& x) { x = RadToDeg(x); }
  static void ConvertToRad(Real& x) { x = DegToRad(x); }

  // ---- rounding and tolerant comparison ----
  // x rounded half-up to the nearest multiple of step: floor(x / step + 0.5)
  // * step. A step of 0 leaves x unchanged; an infinite step gives 0.
  static Real Round(Real x, Real step);
  // x rounded to `decimals` decimal places (negative: to tens, hundreds, ...).
  static Real Round(Real x, int decimals);
  // 1 when both values round to the same grid point, else 0.
  static int Approx_Equal(Real a, Real b, Real step);
  static int Approx_Equal(Real a, Real b, int decimals);

  // ---- pseudo-random numbers (range 0..32767; a non-zero seed reseeds first) ----
  static Real UnitRandom(unsigned int seed = 0);                       // [0, 1]
  static Real SymmetricRandom(unsigned int seed = 0);                  // [-1, 1]
  static Real IntervalRandom(Real min, Real max, unsigned int seed = 0);  // [min, max]

  // ---- special functions ----
  static Real LogGamma(Real x);  // x > 0
  static Real Gamma(Real x);     // exp(LogGamma(x))
  // The regularised lower incomplete gamma function P(a, x). MAX_REAL for
  // x < 0, for a <= 0 or a NaN, and when the evaluation does not converge.
  static Real IncompleteGamma(Real a, Real x);
  static Real Erf(Real x);
  static Real Erfc(Real x);
  static Real ModBessel0(Real x);  // I0
  static Real ModBessel1(Real x);  // I1

  // ---- fast polynomial approximations (the argument is not reduced) ----
  // Sin and cos for x in [0, pi/2]; tan in [0, pi/4]; the inverse sine and
  // cosine in [0, 1]; the inverse tangent in [-1, 1]. Coefficients are the
  // published minimax fits, rounded to Real.
  static Real FastSin0(Real x) {
    const Real s = x * x;
    return x * (Real(1) + s * (Real(-0.16605) + Real(0.00761) * s));
  }
  static Real FastSin1(Real x) {
    const Real s = x * x;
    return x * (Real(1) + s * (Real(-0.1666666664) +
                               s * (Real(0.0083333315) +
                                    s * (Real(-0.000198409) + s * (Real(2.7526e-6) + s * Real(-2.39e-8))))));
  }
  static Real FastCos0(Real x) {
    const Real s = x * x;
    return Real(1) + s * (Real(-0.4967) + Real(0.03705) * s);
  }
  static Real FastCos1(Real x) {
    const Real s = x * x;
    return Real(1) + s * (Real(-0.4999999963) +
                          s * (Real(0.0416666418) +
                               s * (Real(-0.0013888397) + s * (Real(2.47609e-5) + s * Real(-2.605e-7)))));
  }
  static Real FastTan0(Real x) {
    const Real s = x * x;
    return x * (Real(1) + s * (Real(0.31755) + Real(0.2033) * s));
  }
  static Real FastTan1(Real x) {
    const Real s = x * x;
    return x * (Real(1) +
                s * (Real(0.3333314036) +
                     s * (Real(0.1333923995) +
                          s * (Real(0.0533740603) +
                               s * (Real(0.0245650893) + s * (Real(0.002900525) + s * Real(0.0095168091)))))));
  }
  static Real FastInvSin(Real x) { return HALF_PI - FastInvCos(x); }
  static Real FastInvCos(Real x) {
    return std::sqrt(Real(1) - x) *
           (Real(1.5707288) + x * (Real(-0.2121144) + x * (Real(0.074261) - Real(0.0187293) * x)));
  }
  static Real FastInvTan0(Real x) {
    const Real s = x * x;
    return x * (Real(0.999866) +
                s * (Real(-0.3302995) + s * (Real(0.180141) + s * (Real(-0.085133) + Real(0.0208351) * s))));
  }
  static Real FastInvTan1(Real x) {
    const Real s = x * x;
    return x * (Real(1) +
                s * (Real(-0.3333314528) +
                     s * (Real(0.1999355085) +
                          s * (Real(-0.1420889944) +
                               s * (Real(0.1065626393) +
                                    s * (Real(-0.07528964) +
                                         s * (Real(0.0429096138) +
                                              s * (Real(-0.0161657367) + Real(0.0028662257) * s))))))));
  }
  // 1 / sqrt(x) from the bits of x in single precision (both instantiations):
  // the classic magic-constant estimate and one Newton step, relative error
  // below 0.18%.
  static Real FastInvSqrt(Real x) {
    const float value = static_cast<float>(x);
    const std::uint32_t bits = 0x5F3759DFu - (std::bit_cast<std::uint32_t>(value) >> 1);
    const float estimate = std::bit_cast<float>(bits);
    return Real(estimate * (1.5f - 0.5f * value * estimate * estimate));
  }

  // ---- angles in the x-y plane ----
  // a reduced into [0, 2 pi); values within 1e-6 of 0 or 2 pi snap to 0, and
  // so do values beyond +-1e6 and NaN.
  static Real NormalizeAngle(Real a);
  // Direction of the vector from point 1 to point 2 in [0, 2 pi) (a tiny
  // negative angle may round up to TWO_PI); two equal points give HALF_PI.
  static Real GetAngle(Real x1, Real y1, Real x2, Real y2);
  static Real GetAngle(const Point4& p1, const Point4& p2);
  // Angle at p2 from p2->p1 counter-clockwise to p2->p3, in [0, 2 pi).
  static Real GetRightAngle(Real x1, Real y1, Real x2, Real y2, Real x3, Real y3);
  static Real GetRightAngle(const Point4& p1, const Point4& p2, const Point4& p3);
  // Angle at p2 from p2->p3 counter-clockwise to p2->p1, in [0, 2 pi).
  static Real GetLeftAngle(Real x1, Real y1, Real x2, Real y2, Real x3, Real y3);
  static Real GetLeftAngle(const Point4& p1, const Point4& p2, const Point4& p3);
  // Signed change of heading walking p1 -> p2 -> p3: PI minus the left angle.
  static Real GetTurnAngle(Real x1, Real y1, Real x2, Real y2, Real x3, Real y3);
  static Real GetTurnAngle(const Point4& p1, const Point4& p2, const Point4& p3);
  // Counter-clockwise sweep from a1 to a2, in (0, 2 pi]; equal angles give 2 pi.
  static Real GetIncludedAngle(Real a1, Real a2);
  // Heading at point 2 of a straight (factor 0) or arc segment from point 1,
  // in (-pi, pi]; the factor is the bulge: the arc's sagitta over half the chord.
  static Real GetDirectionAngle(Real x1, Real y1, Real factor, Real x2, Real y2);
  static Real GetDirectionAngle(const Point4& p1, Real factor, const Point4& p2);

  // ---- points and lines ----
  // Position of p relative to the directed segment a->b: 0 left, 1 right,
  // 2 beyond b, 3 behind a, 4 between a and b, 5 at a, 6 at b.
  static int ClassifyPointToLine(const Real& px, const Real& py, const Real& ax, const Real& ay, const Real& bx,
                                 const Real& by);
  // 0 collinear, 1 parallel, 2 intersecting; t receives the parameter of the
  // intersection on line 1 (0 at point 1, 1 at point 2). Non-finite input
  // gives 1 (no single intersection point).
  static int ClassifyInfiniteLineToInfiniteLine(Real x1, Real y1, Real x2, Real y2, Real x3, Real y3, Real x4, Real y4,
                                                Real* t);
  // Segment (x1, y1)-(x2, y2) against segment (x3, y3)-(x4, y4): 1 parallel;
  // 0 collinear (3 with the shared endpoint written when they touch at an
  // endpoint of the first); 3 intersecting, 4 when the lines meet outside
  // the segments; for 3 and 4 (x, y) receives the intersection of the lines.
  static int ClassifyLineToLine(Real x1, Real y1, Real x2, Real y2, Real x3, Real y3, Real x4, Real y4, Real* x,
                                Real* y);

  // ---- circles and arcs ----
  // Centre of the circle through three points; 0 when they are collinear or
  // two of them coincide.
  static int GetCircleCenter(Real x1, Real y1, Real x2, Real y2, Real x3, Real y3, Real* cx, Real* cy);
  static int GetCircleCenter(const Point4& p1, const Point4& p2, const Point4& p3, Point4* center);
  // Centre as above; radius = distance from the centre to the second point.
  static int Circle3Pts_to_CenterRadius(Real x1, Real y1, Real x2, Real y2, Real x3, Real y3, Real* cx, Real* cy,
                                        Real* r);
  static int Circle3Pts_to_CenterRadius(const Point4& p1, const Point4& p2, const Point4& p3, Point4* center, Real* r);
  // Start, middle and end points of an arc; always 1.
  static int ArcCenterRadiusStartAngleArcAngle_to_StartMiddleEnd(Real cx, Real cy, Real r, Real start, Real sweep,
                                                                 Real* sx, Real* sy, Real* mx, Real* my, Real* ex,
                                                                 Real* ey);
  static int ArcCenterRadiusStartAngleArcAngle_to_StartMiddleEnd(const Point4& center, Real r, Real start, Real sweep,
                                                                 Point4* s, Point4* m, Point4* e);
  // Arc from its start, its heading there and its end; the sweep is signed
  // (positive counter-clockwise), less than a full turn. 0 when the arc
  // would be (nearly) straight or (nearly) a full circle, and when start and
  // end coincide.
  static int ArcStartDirectionEnd_to_CenterRadiusStartAngleArcAngle(Real sx, Real sy, Real dir, Real ex, Real ey,
                                                                    Real* cx, Real* cy, Real* r, Real* start,
                                                                    Real* sweep);
  static int ArcStartDirectionEnd_to_CenterRadiusStartAngleArcAngle(const Point4& s, Real dir, const Point4& e,
                                                                    Point4* center, Real* r, Real* start,
                                                                    Real* sweep);
  // Arc through three points as centre, radius and the start and end angles
  // of its counter-clockwise run; 0 when nearly straight or degenerate.
  static int ArcStartMiddleEnd_to_CenterRadiusStartArcAngleEndArcAngle(Real sx, Real sy, Real mx, Real my, Real ex,
                                                                       Real ey, Real* cx, Real* cy, Real* r,
                                                                       Real* start, Real* end);
  static int ArcStartMiddleEnd_to_CenterRadiusStartArcAngleEndArcAngle(const Point4& s, const Point4& m,
                                                                       const Point4& e, Point4* center, Real* r,
                                                                       Real* start, Real* end);
  // Arc through three points as centre, radius, start angle and signed sweep
  // (negative when S, M, E run clockwise).
  static int ArcStartMiddleEnd_to_CenterRadiusStartAngleArcAngle(Real sx, Real sy, Real mx, Real my, Real ex, Real ey,
                                                                 Real* cx, Real* cy, Real* r, Real* start,
                                                                 Real* sweep);
  static int ArcStartMiddleEnd_to_CenterRadiusStartAngleArcAngle(const Point4& s, const Point4& m, const Point4& e,
                                                                 Point4* center, Real* r, Real* start, Real* sweep);

  // ---- polygons and polylines (x-y only) ----
  // Unsigned area of the closed polygon; 0 for fewer than 3 points.
  static Real GetPolygonArea(const Point4* points, int n);
  // Crossing-number test of the closed polygon; a point on an edge gives
  // `boundary`; false for fewer than 3 points.
  static bool PolygonContainsPoint(const Point2* points, int n, const Point2& p, bool boundary);
  static bool PolygonContainsPoint(const Point4* points, int n, const Point4& p, bool boundary);
  // Sum of the n - 1 segment lengths; 0 for fewer than 2 points.
  static Real GetPolylineLength(const Point4* points, int n);
  // Distance from p to the segment a-b; the nearest point goes to `out`.
  static Real GetNearestPointOnLine(const Point4& a, const Point4& b, const Point4& p, Point4* out);
  // Distance from p to the polyline; `out` receives the nearest point and
  // `along` the length of the polyline up to it. For fewer than 2 points the
  // result and `along` are 0 and `out` receives Point4::ZERO.
  static Real GetNearestPointOnPolyline(const Point4* points, int n, const Point4& p, Point4* out, Real* along);
  // Projection of p on the segment a-b: -1 before a (out = a), 1 beyond b
  // (out = b), 0 on it; `dist` receives the distance from `out` to p. A
  // segment of length 0 projects every point onto a, with code 0.
  static int GetNearestPoint(const Point4& a, const Point4& b, const Point4& p, Point4* out, Real* dist);

protected:
  // The two forms of the incomplete gamma function: the series (x < a + 1)
  // and the continued fraction of 1 - P; MAX_REAL when not converged.
  static Real IncompleteGammaS(Real a, Real x);
  static Real IncompleteGammaCF(Real a, Real x);
};

extern template class KRCORELIB_API CKRMathT<float, double>;
extern template class KRCORELIB_API CKRMathT<double, float>;
