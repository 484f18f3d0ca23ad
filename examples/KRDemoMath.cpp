// Math: the scalar helpers, vectors and points in both precisions, the text
// forms of points, matrices and quaternions.
#include "KRDemo.h"

#include <numbers>

void KRDemoMath() {
  using Math = CKRMathT<double, float>;
  using MathF = CKRMathT<float, double>;
  using Point = CKRPoint4T<double, float>;
  using Vector = CKRVector3T<double, float>;

  Print(L"1. Constants are single-precision values in both instantiations:\n");
  Print(CKRString::Formatted(L"   PI (double class)  %.17g\n   PI (float class)   %.17g\n   INV_TWO_PI         %.17g (2 / pi)\n",
                             Math::PI, double(MathF::PI), Math::INV_TWO_PI));

  Print(L"\n2. Rounding is half-up on a grid; tolerant equality compares the rounded values:\n");
  Print(CKRString::Formatted(L"   Round(2.5, 1) = %g   Round(-2.5, 1) = %g   Round(1234, -2) = %g\n",
                             Math::Round(2.5, 1.0), Math::Round(-2.5, 1.0), Math::Round(1234.0, -2)));
  Print(CKRString::Formatted(L"   Approx_Equal(0.149, 0.151, 0.1) = %d   Approx_Equal(0.151, 0.249, 0.1) = %d\n",
                             Math::Approx_Equal(0.149, 0.151, 0.1), Math::Approx_Equal(0.151, 0.249, 0.1)));

  Print(L"\n3. Special functions and fast approximations:\n");
  Print(CKRString::Formatted(L"   Erf(0.5) = %.7f   Gamma(5) = %.5f   I0(1) = %.7f   FastSin1(0.5) = %.9f\n",
                             Math::Erf(0.5), Math::Gamma(5.0), Math::ModBessel0(1.0), Math::FastSin1(0.5)));

  Print(L"\n4. Plane geometry: the circle through three points and an arc through them:\n");
  const Point a(1.0, 0.0, 0.0, 1.0);
  const Point b(0.0, 1.0, 0.0, 1.0);
  const Point c(-1.0, 0.0, 0.0, 1.0);
  Point center = Point::ZERO;
  double radius = 0;
  if (Math::Circle3Pts_to_CenterRadius(a, b, c, &center, &radius))
    Print(L"   centre " + center.ToString() + CKRString::Formatted(L"   radius %.6f\n", radius));
  double start = 0;
  double sweep = 0;
  if (Math::ArcStartMiddleEnd_to_CenterRadiusStartAngleArcAngle(a, b, c, &center, &radius, &start, &sweep))
    Print(CKRString::Formatted(L"   arc from %.1f degrees sweeping %.1f degrees\n", Math::RadToDeg(start),
                               Math::RadToDeg(sweep)));
  Print(CKRString::Formatted(L"   three collinear points: GetCircleCenter = %d\n",
                             Math::GetCircleCenter(0.0, 0.0, 1.0, 1.0, 2.0, 2.0, nullptr, nullptr)));

  const Point square[] = {Point(0.0, 0.0, 0.0, 1.0), Point(2.0, 0.0, 0.0, 1.0), Point(2.0, 2.0, 0.0, 1.0),
                          Point(0.0, 2.0, 0.0, 1.0)};
  Print(CKRString::Formatted(L"   square: area %g, contains (1, 1): %d, (3, 1): %d\n", Math::GetPolygonArea(square, 4),
                             Math::PolygonContainsPoint(square, 4, Point(1.0, 1.0, 0.0, 1.0), false),
                             Math::PolygonContainsPoint(square, 4, Point(3.0, 1.0, 0.0, 1.0), false)));

  Print(L"\n5. Vectors: arithmetic, cross product and normalisation:\n");
  const Vector u(1.0, 2.0, 3.0);
  const Vector v(-2.0, 0.5, 4.0);
  Print(L"   u + v        = " + Vector(u + v).ToString() + L"\n");
  Print(L"   u x v        = " + u.Cross(v).ToString() + L"\n");
  Print(CKRString::Formatted(L"   u . v        = %g\n", u.Dot(v)));
  Vector n = u;
  const double length = n.Normalize();
  Print(L"   u normalised = " + n.ToString() + CKRString::Formatted(L" (length was %.6f)\n", length));
  Print(L"   v / 0        = " + Vector(v / 0.0).ToString().Left(24) + L"... (every component MAX_REAL)\n");

  Print(L"\n6. Points: packed coordinates and their text forms:\n");
  CKRPoint3T<float, double> p(1.5f, -2.0f, 0.25f);
  Print(L"   ToString     " + p.ToString() + CKRString::Formatted(L"   (%d bytes: three floats)\n", int(sizeof p)));
  p.FromString(L"10, 20");
  Print(L"   FromString(\"10, 20\") keeps z: " + p.ToString() + L"\n");
  CKRPoint2T<double, float> precise(0.0, 0.0);
  precise.FromString(L"5000000.123456,-0.5");
  Print(L"   a double point reads at full precision: " + precise.ToString() + L"\n");

  Print(L"\n7. Matrices and quaternions: rotations, inverses and decompositions:\n");
  using Matrix3 = CKRMatrix3T<double, float>;
  using Quaternion = CKRQuaternionT<double, float>;
  const double quarterTurn = std::numbers::pi / 2;
  const Matrix3 turn(Vector(0, 0, 1), quarterTurn);
  Print(L"   a quarter turn about z maps x to " + Vector(turn * Vector(1, 0, 0)).ToString() + L"\n");
  Print(CKRString::Formatted(L"   by HALF_PI (pi / 2 in single precision) x becomes %.3g instead of 0\n",
                             Vector(Matrix3(Vector(0, 0, 1), Math::HALF_PI) * Vector(1, 0, 0)).X()));
  Matrix3 euler;
  euler.FromEulerAnglesXYZ(0.1, quarterTurn, 0.3);
  double x = 0, y = 0, z = 0;
  const bool unique = euler.ToEulerAnglesXYZ(x, y, z);
  Print(CKRString::Formatted(L"   Euler XYZ (0.1, pi/2, 0.3) back: unique %d, (%.2f, %.4f, %.2f): gimbal lock\n",
                             int(unique), x, y, z));
  const Matrix3 symmetric(2.0, 1.0, 0.0, 1.0, 2.0, 0.0, 0.0, 0.0, 5.0);
  Matrix3 rot, diag;
  symmetric.EigenDecomposition(rot, diag);
  Print(CKRString::Formatted(L"   eigenvalues of (2 1 0; 1 2 0; 0 0 5): %g, %g, %g\n", diag(0, 0), diag(1, 1),
                             diag(2, 2)));
  Print(CKRString::Formatted(L"   diag(1e-3, 1e-3, 1e-3) inverts to ZERO (determinant below EPSILON): %d\n",
                             int(Matrix3(1e-3, 1e-3, 1e-3).Inverse() == Matrix3::ZERO)));
  const Quaternion q(turn);
  Print(CKRString::Formatted(L"   its quaternion (w, x, y, z) = (%.6f, %g, %g, %.6f)\n", q.W(), q.X(), q.Y(), q.Z()));
  const Quaternion half = Quaternion::Slerp(0.5, Quaternion::IDENTITY, q);
  Vector axis;
  double angle = 0;
  half.ToAxisAngle(axis, angle);
  Print(L"   half-way from the identity: " + CKRString::Formatted(L"%.6f", angle) + L" rad about " + axis.ToString() +
        L"\n");
  const Quaternion flip = Quaternion::Align(Vector(1, 0, 0), Vector(-1, 0, 0));
  Print(CKRString::Formatted(L"   Align(x, -x) is the half turn (%g, %g, %g, %g)\n", flip.W(), flip.X(), flip.Y(),
                             flip.Z()));
}
