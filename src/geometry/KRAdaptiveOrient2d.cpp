// The adaptive-precision orientation test: a floating-point filter first,
// then exact arithmetic on expansions (sums of non-overlapping doubles)
// only as far as the sign needs it.
//
// Every helper below is exact in IEEE double arithmetic with round-to-
// nearest, provided nothing is contracted into fused multiply-adds: the
// build compiles this file with -ffp-contract=off.
#include <krCoreLib/geometry/KRAdaptiveOrient2d.h>

#include <cmath>

namespace {

// The rounding unit of double (half an ulp of 1).
constexpr double kEpsilon = 0x1p-53;
// Splits a double into two halves of 26 bits each: 2^ceil(53 / 2) + 1.
constexpr double kSplitter = 0x1p27 + 1.0;
// The error bounds of the published analysis of this evaluation order: the
// filter, the two-term stage, the corrected stage and the rounding of its
// result.
constexpr double kBoundFilter = (3.0 + 16.0 * kEpsilon) * kEpsilon;
constexpr double kBoundTwoTerms = (2.0 + 12.0 * kEpsilon) * kEpsilon;
constexpr double kBoundCorrected = (9.0 + 64.0 * kEpsilon) * kEpsilon * kEpsilon;
constexpr double kBoundResult = (3.0 + 8.0 * kEpsilon) * kEpsilon;

// sum + error == a + b exactly.
inline void TwoSum(double a, double b, double& sum, double& error) {
  sum = a + b;
  const double bPart = sum - a;
  const double aPart = sum - bPart;
  error = (a - aPart) + (b - bPart);
}

// The rounding error of difference = a - b.
inline double TwoDiffTail(double a, double b, double difference) {
  const double bPart = a - difference;
  const double aPart = difference + bPart;
  return (a - aPart) + (bPart - b);
}

inline void TwoDiff(double a, double b, double& difference, double& error) {
  difference = a - b;
  error = TwoDiffTail(a, b, difference);
}

// high + low == a, each with at most 26 significant bits.
inline void Split(double a, double& high, double& low) {
  const double scaled = kSplitter * a;
  const double big = scaled - a;
  high = scaled - big;
  low = a - high;
}

// product + error == a * b exactly.
inline void TwoProduct(double a, double b, double& product, double& error) {
  product = a * b;
  double aHigh = 0;
  double aLow = 0;
  double bHigh = 0;
  double bLow = 0;
  Split(a, aHigh, aLow);
  Split(b, bHigh, bLow);
  const double e1 = product - aHigh * bHigh;
  const double e2 = e1 - aLow * bHigh;
  const double e3 = e2 - aHigh * bLow;
  error = aLow * bLow - e3;
}

// (a1 + a0) - (b1 + b0) as the four-component expansion x[0..3], least
// significant first.
inline void TwoTwoDiff(double a1, double a0, double b1, double b0, double x[4]) {
  double upper = 0;
  double middle = 0;
  double step = 0;
  TwoDiff(a0, b0, step, x[0]);
  TwoSum(a1, step, upper, middle);
  TwoDiff(middle, b1, step, x[1]);
  TwoSum(upper, step, x[3], x[2]);
}

// The expansion a1 * b1 - a2 * b2, exactly, least significant first.
inline void ProductDifference(double a1, double b1, double a2, double b2, double x[4]) {
  double p1 = 0;
  double e1 = 0;
  double p2 = 0;
  double e2 = 0;
  TwoProduct(a1, b1, p1, e1);
  TwoProduct(a2, b2, p2, e2);
  TwoTwoDiff(p1, e1, p2, e2, x);
}

// h = e + f for expansions ordered by increasing magnitude (zeros anywhere);
// the result has the same order, holds no zeros except a lone zero for a
// zero sum, and has at most eCount + fCount components. Its last component
// is the largest and carries the sign of the sum.
int ExpansionSum(const double* e, int eCount, const double* f, int fCount, double* h) {
  int ei = 0;
  int fi = 0;
  // The smaller in magnitude of the two next components.
  const auto take = [&]() {
    if (fi == fCount || (ei < eCount && std::fabs(e[ei]) <= std::fabs(f[fi])))
      return e[ei++];
    return f[fi++];
  };
  int count = 0;
  double running = take();
  while (ei < eCount || fi < fCount) {
    double error = 0;
    TwoSum(running, take(), running, error);
    if (error != 0)
      h[count++] = error;
  }
  if (running != 0 || count == 0)
    h[count++] = running;
  return count;
}

double Estimate(const double* e, int count) {
  double sum = 0;
  for (int i = 0; i < count; ++i)
    sum += e[i];
  return sum;
}

// The stages after the filter: `magnitude` is |left| + |right| of the
// rounded products.
double OrientAdaptive(double ax, double ay, double bx, double by, double cx, double cy, double magnitude) {
  const double acx = ax - cx;
  const double bcx = bx - cx;
  const double acy = ay - cy;
  const double bcy = by - cy;

  // Stage 2: the products of the rounded differences, exactly.
  double b[4];
  ProductDifference(acx, bcy, acy, bcx, b);
  double det = Estimate(b, 4);
  double bound = kBoundTwoTerms * magnitude;
  if (det >= bound || -det >= bound)
    return det;

  // Stage 3: a first-order correction for the rounding of the differences.
  const double acxTail = TwoDiffTail(ax, cx, acx);
  const double bcxTail = TwoDiffTail(bx, cx, bcx);
  const double acyTail = TwoDiffTail(ay, cy, acy);
  const double bcyTail = TwoDiffTail(by, cy, bcy);
  if (acxTail == 0 && acyTail == 0 && bcxTail == 0 && bcyTail == 0)
    return det;
  bound = kBoundCorrected * magnitude + kBoundResult * std::fabs(det);
  det += (acx * bcyTail + bcy * acxTail) - (acy * bcxTail + bcx * acyTail);
  if (det >= bound || -det >= bound)
    return det;

  // Stage 4: the whole determinant of (difference + tail) terms, exactly.
  double u[4];
  double c1[8];
  double c2[12];
  double d[16];
  ProductDifference(acxTail, bcy, acyTail, bcx, u);
  const int c1Count = ExpansionSum(b, 4, u, 4, c1);
  ProductDifference(acx, bcyTail, acy, bcxTail, u);
  const int c2Count = ExpansionSum(c1, c1Count, u, 4, c2);
  ProductDifference(acxTail, bcyTail, acyTail, bcxTail, u);
  const int dCount = ExpansionSum(c2, c2Count, u, 4, d);
  return d[dCount - 1];
}

}  // namespace

namespace krPolygonTriangulation {

double orient2d(double ax, double ay, double bx, double by, double cx, double cy) noexcept {
  const double left = (ax - cx) * (by - cy);
  const double right = (ay - cy) * (bx - cx);
  const double det = left - right;
  double magnitude = 0;
  // Products of opposite signs (or a zero one) cannot cancel: the sign of
  // the rounded difference is right.
  if (left > 0) {
    if (right <= 0)
      return det;
    magnitude = left + right;
  } else if (left < 0) {
    if (right >= 0)
      return det;
    magnitude = -left - right;
  } else {
    return det;
  }
  const double bound = kBoundFilter * magnitude;
  if (det >= bound || -det >= bound)
    return det;
  return OrientAdaptive(ax, ay, bx, by, cx, cy, magnitude);
}

}  // namespace krPolygonTriangulation
