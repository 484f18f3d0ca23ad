// CKRMathT: rounding, random numbers and special functions; the plane
// helpers are defined in CKRMathTPlane.h, CKRMathTArcs.h and
// CKRMathTPolygons.h. Both precision pairs are compiled here.
#include <krCoreLib/math/CKRMathT.h>

#include <krCoreLib/math/CKRPoint2T.h>
#include <krCoreLib/math/CKRPoint4T.h>

#include <atomic>

namespace {

// The process-wide generator of UnitRandom and its relatives: the C
// standard's example generator (a linear congruential generator with outputs
// 0..32767), so that dividing by 32767 gives [0, 1] as the contract says on
// every platform. It starts as if seeded with 1. The state is updated with a
// compare-and-swap, so concurrent callers never race; their draws interleave.
std::atomic<unsigned>& RandomState() {
  static std::atomic<unsigned> state{1u};
  return state;
}

void SeedRandom(unsigned seed) { RandomState().store(seed, std::memory_order_relaxed); }

int NextRandom() {
  std::atomic<unsigned>& state = RandomState();
  unsigned current = state.load(std::memory_order_relaxed);
  unsigned next = 0;
  do
    next = current * 1103515245u + 12345u;
  while (!state.compare_exchange_weak(current, next, std::memory_order_relaxed));
  return static_cast<int>((next >> 16) & 0x7FFFu);
}

// The largest value NextRandom returns.
constexpr int kRandomMax = 32767;

// The convergence limits of the incomplete gamma function (a published
// single-precision evaluation): at most 100 terms, relative tolerance 3e-7.
constexpr int kGammaIterations = 100;
constexpr double kGammaTolerance = 3e-7;

}  // namespace

// ---- rounding and tolerant comparison ----

template <class Real, class Other>
Real CKRMathT<Real, Other>::Round(Real x, Real step) {
  if (step == Real(0))
    return x;
  if (std::isinf(step))
    return std::isfinite(x) ? Real(0) : x;
  return Floor(x / step + Real(0.5)) * step;
}

template <class Real, class Other>
Real CKRMathT<Real, Other>::Round(Real x, int decimals) {
  // The grids of 1 to 10 decimals are the decimal literals themselves, the
  // closest Reals to 10^-decimals.
  static constexpr Real kGrids[] = {Real(0.1),    Real(0.01),    Real(0.001),    Real(0.0001),    Real(0.00001),
                                    Real(0.000001), Real(0.0000001), Real(0.00000001), Real(0.000000001),
                                    Real(0.0000000001)};
  if (decimals >= 1 && decimals <= 10)
    return Round(x, kGrids[decimals - 1]);
  // Otherwise the power by repeated squaring: of 0.1 for more decimals, of 10
  // (exact up to 10^22 in double) for negative ones, so that rounding to
  // hundreds gives exact multiples of 100.
  unsigned exponent = decimals < 0 ? 0u - static_cast<unsigned>(decimals) : static_cast<unsigned>(decimals);
  Real base = decimals < 0 ? Real(10) : Real(0.1);
  Real grid = Real(1);
  while (exponent != 0) {
    if (exponent & 1u)
      grid *= base;
    base *= base;
    exponent >>= 1;
  }
  return Round(x, grid);
}

template <class Real, class Other>
int CKRMathT<Real, Other>::Approx_Equal(Real a, Real b, Real step) {
  return Round(a, step) == Round(b, step) ? 1 : 0;
}

template <class Real, class Other>
int CKRMathT<Real, Other>::Approx_Equal(Real a, Real b, int decimals) {
  return Round(a, decimals) == Round(b, decimals) ? 1 : 0;
}

// ---- random numbers ----

template <class Real, class Other>
Real CKRMathT<Real, Other>::UnitRandom(unsigned int seed) {
  if (seed != 0)
    SeedRandom(seed);
  return Real(NextRandom()) / Real(kRandomMax);
}

template <class Real, class Other>
Real CKRMathT<Real, Other>::SymmetricRandom(unsigned int seed) {
  return Real(2) * UnitRandom(seed) - Real(1);
}

template <class Real, class Other>
Real CKRMathT<Real, Other>::IntervalRandom(Real min, Real max, unsigned int seed) {
  return min + (max - min) * UnitRandom(seed);
}

// ---- special functions ----

// Lanczos' series with six terms (g = 5), accurate to about 1e-10 in exact
// arithmetic for x > 0.
template <class Real, class Other>
Real CKRMathT<Real, Other>::LogGamma(Real x) {
  const Real y = x - Real(1);
  const Real t = y + Real(5.5);
  const Real series = Real(1) + Real(76.18009173) / (y + Real(1)) - Real(86.50532033) / (y + Real(2)) +
                      Real(24.01409822) / (y + Real(3)) - Real(1.231739516) / (y + Real(4)) +
                      Real(0.00120858003) / (y + Real(5)) - Real(5.36382e-6) / (y + Real(6));
  return Log(Real(2.50662827465) * series) - (t - (y + Real(0.5)) * Log(t));
}

template <class Real, class Other>
Real CKRMathT<Real, Other>::Gamma(Real x) {
  return Exp(LogGamma(x));
}

template <class Real, class Other>
Real CKRMathT<Real, Other>::IncompleteGamma(Real a, Real x) {
  if (!(a > Real(0)))
    return MAX_REAL;
  if (x < a + Real(1))
    return IncompleteGammaS(a, x);
  const Real complement = IncompleteGammaCF(a, x);
  return complement == MAX_REAL ? MAX_REAL : Real(1) - complement;
}

template <class Real, class Other>
Real CKRMathT<Real, Other>::IncompleteGammaS(Real a, Real x) {
  if (x == Real(0))
    return Real(0);
  if (x < Real(0))
    return MAX_REAL;
  Real term = Real(1) / a;
  Real sum = term;
  for (int n = 1; n <= kGammaIterations; ++n) {
    term *= x / (a + Real(n));
    sum += term;
    if (FAbs(term) < FAbs(sum) * Real(kGammaTolerance))
      return sum * Exp(a * Log(x) - x - LogGamma(a));
  }
  return MAX_REAL;
}

// The continued fraction of Q(a, x) = 1 - P(a, x), evaluated by its
// convergents A/B, rescaled by f = 1/A1 to avoid overflow.
template <class Real, class Other>
Real CKRMathT<Real, Other>::IncompleteGammaCF(Real a, Real x) {
  Real a0 = Real(1);
  Real a1 = x;
  Real b0 = Real(0);
  Real b1 = Real(1);
  Real scale = Real(1);
  Real previous = Real(0);
  for (int n = 1; n <= kGammaIterations; ++n) {
    const Real offset = Real(n) - a;
    a0 = (a1 + a0 * offset) * scale;
    b0 = (b1 + b0 * offset) * scale;
    const Real weight = Real(n) * scale;
    a1 = x * a0 + weight * a1;
    b1 = x * b0 + weight * b1;
    if (a1 != Real(0)) {
      scale = Real(1) / a1;
      const Real g = b1 * scale;
      if (FAbs((g - previous) / g) < Real(kGammaTolerance))
        return Exp(a * Log(x) - x - LogGamma(a)) * g;
      previous = g;
    }
  }
  return MAX_REAL;
}

template <class Real, class Other>
Real CKRMathT<Real, Other>::Erf(Real x) {
  return Real(1) - Erfc(x);
}

// Chebyshev fit of erfc with fractional error below 1.2e-7 everywhere.
template <class Real, class Other>
Real CKRMathT<Real, Other>::Erfc(Real x) {
  const Real z = FAbs(x);
  const Real t = Real(1) / (Real(1) + Real(0.5) * z);
  const Real r =
      t * Exp(-z * z - Real(1.26551223) +
              t * (Real(1.00002368) +
                   t * (Real(0.37409196) +
                        t * (Real(0.09678418) +
                             t * (Real(-0.18628806) +
                                  t * (Real(0.27886807) +
                                       t * (Real(-1.13520398) +
                                            t * (Real(1.48851587) + t * (Real(-0.82215223) + t * Real(0.17087277))))))))));
  return x >= Real(0) ? r : Real(2) - r;
}

// Polynomial fits of I0 and I1 (Abramowitz and Stegun 9.8.1 to 9.8.4):
// error below 1.6e-7 (I0) and 8e-9 (I1 / x) up to 3.75, and below 1.9e-7 and
// 2.2e-7 in sqrt(x) exp(-x) I beyond. The second coefficient of I1 / x is
// the published 0.87890594 (with its last digits exchanged, 0.87890549, I1
// would be off by up to 1.7e-6 near 3.75).
template <class Real, class Other>
Real CKRMathT<Real, Other>::ModBessel0(Real x) {
  const Real a = FAbs(x);
  if (a <= Real(3.75)) {
    const Real y = Sqr(a / Real(3.75));
    return Real(1) +
           y * (Real(3.5156229) +
                y * (Real(3.0899424) +
                     y * (Real(1.2067492) + y * (Real(0.2659732) + y * (Real(0.0360768) + y * Real(0.0045813))))));
  }
  const Real y = Real(3.75) / a;
  return Exp(a) / Sqrt(a) *
         (Real(0.39894228) +
          y * (Real(0.01328592) +
               y * (Real(0.00225319) +
                    y * (Real(-0.00157565) +
                         y * (Real(0.00916281) +
                              y * (Real(-0.02057706) +
                                   y * (Real(0.02635537) + y * (Real(-0.01647633) + y * Real(0.00392377)))))))));
}

template <class Real, class Other>
Real CKRMathT<Real, Other>::ModBessel1(Real x) {
  if (x == Real(0))
    return Real(0);
  const Real a = FAbs(x);
  Real result;
  if (a <= Real(3.75)) {
    const Real y = Sqr(a / Real(3.75));
    result = a * (Real(0.5) +
                  y * (Real(0.87890594) +
                       y * (Real(0.51498869) +
                            y * (Real(0.15084934) + y * (Real(0.02658733) + y * (Real(0.00301532) + y * Real(0.00032411)))))));
  } else {
    const Real y = Real(3.75) / a;
    result = Exp(a) / Sqrt(a) *
             (Real(0.39894228) +
              y * (Real(-0.03988024) +
                   y * (Real(-0.00362018) +
                        y * (Real(0.00163801) +
                             y * (Real(-0.01031555) +
                                  y * (Real(0.02282967) +
                                       y * (Real(-0.02895312) + y * (Real(0.01787654) - y * Real(0.00420059)))))))));
  }
  return x < Real(0) ? -result : result;
}

#include "CKRMathTArcs.h"
#include "CKRMathTPlane.h"
#include "CKRMathTPolygons.h"

template class CKRMathT<float, double>;
template class CKRMathT<double, float>;
