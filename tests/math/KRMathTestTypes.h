// The two precision pairs every math test runs through, and tolerances that
// depend on the precision.
#pragma once

#include <gtest/gtest.h>

#include <ostream>
#include <string>
#include <type_traits>

template <class TReal, class TOther>
struct KRPrecisionPair {
  using Real = TReal;
  using Other = TOther;
};

using KRPrecisionPairs = ::testing::Types<KRPrecisionPair<float, double>, KRPrecisionPair<double, float>>;

struct KRPrecisionPairNames {
  template <class Pair>
  static std::string GetName(int) {
    return std::is_same_v<typename Pair::Real, float> ? "float" : "double";
  }
};

// `single` in the float instantiation, `twice` in the double one.
template <class Real>
constexpr double KRByPrecision(double single, double twice) {
  return std::is_same_v<Real, float> ? single : twice;
}

template <int N, class Real, class Other>
class CKRVectorT;
template <int N, class Real, class Other>
class CKRPointT;

// Failure messages show the components (the classes also convert to
// pointers, which GoogleTest would print otherwise).
template <class Tuple>
void KRPrintTuple(const Tuple& tuple, int n, std::ostream* out) {
  *out << "(";
  for (int i = 0; i < n; ++i)
    *out << (i > 0 ? ", " : "") << tuple[i];
  *out << ")";
}
template <int N, class Real, class Other>
void PrintTo(const CKRVectorT<N, Real, Other>& v, std::ostream* out) {
  KRPrintTuple(v, N, out);
}
template <int N, class Real, class Other>
void PrintTo(const CKRPointT<N, Real, Other>& p, std::ostream* out) {
  KRPrintTuple(p, N, out);
}
