// CKRMatrixT: the generic square matrix of size N = 2, 3 or 4.
//
// The storage and the size-independent operations of CKRMatrix2T,
// CKRMatrix3T and CKRMatrix4T, which derive from it; the operators here
// return the generic class, which converts back to the size class.
//
// Conventions: the N * N entries are stored row-major (entry (r, c) is
// element r * N + c) and nothing else, no virtual functions. Vectors and
// points are columns: M * v has component i = sum over j of M(i, j) v(j), and
// in a product the transformation applied first stands on the right.
//
// Equality compares the stored bits (0.0 and -0.0 differ; two NaNs with the
// same bits are equal); <, <=, >, >= compare the byte images of the entries
// as unsigned bytes in memory order, a total order for sorted containers, not
// a numeric one. Dividing by 0 gives MAX_REAL in every entry. Row, column and
// entry indexes are not checked: the caller keeps them in 0..N-1.
//
// Plain values: distinct objects may be used from different threads. The
// operations are inline, unrolled per size and never allocate.
#pragma once

#include <krCoreLib/math/CKRMathT.h>
#include <krCoreLib/math/CKRPointT.h>
#include <krCoreLib/math/CKRVectorT.h>
#include <krCoreLib/math/SKRMatrixLanes.h>

#include <cstring>
#include <limits>
#include <type_traits>
#include <utility>

// A pointer (not a class converting to one) to Real values, for the
// constructors of the size classes that read an array of entries.
template <class Pointer, class Real>
concept KRRealPointer = std::is_pointer_v<Pointer> && std::is_convertible_v<Pointer, const Real*>;

template <int N, class Real, class Other>
class CKRMatrixT {
  static_assert(N >= 2 && N <= 4, "matrices have 2, 3 or 4 rows");

public:
  using Math = CKRMathT<Real, Other>;
  using Vector = CKRVectorT<N, Real, Other>;
  using Point = CKRPointT<N, Real, Other>;

  // The zero matrix when `zero` is true (the default), the identity when false.
  explicit CKRMatrixT(bool zero = true) noexcept {
    if (zero)
      MakeZero();
    else
      MakeIdentity();
  }
  constexpr CKRMatrixT(const CKRMatrixT&) noexcept = default;
  CKRMatrixT& operator=(const CKRMatrixT&) noexcept = default;

  void MakeZero() noexcept {
    ForEachEntry([&](int i) { m_Entry[i] = Real(0); });
  }
  void MakeIdentity() noexcept {
    ForEachEntry([&](int i) { m_Entry[i] = i % (N + 1) == 0 ? Real(1) : Real(0); });
  }
  // The diagonal matrix of N values; a null array gives the zero matrix.
  void MakeDiagonal(const Real* diagonal) noexcept {
    ForEachEntry([&](int i) {
      m_Entry[i] = i % (N + 1) == 0 && diagonal != nullptr ? diagonal[i / (N + 1)] : Real(0);
    });
  }

  // ---- raw access ----
  // The first entry of a row; (row, column) one entry.
  Real* operator[](int row) noexcept { return m_Entry + row * N; }
  const Real* operator[](int row) const noexcept { return m_Entry + row * N; }
  Real& operator()(int row, int column) noexcept { return m_Entry[row * N + column]; }
  Real operator()(int row, int column) const noexcept { return m_Entry[row * N + column]; }
  void SetRow(int row, const Vector& v) noexcept {
    ForEach([&](int j) { m_Entry[row * N + j] = v[j]; });
  }
  Vector GetRow(int row) const noexcept {
    Vector v;
    ForEach([&](int j) { v[j] = m_Entry[row * N + j]; });
    return v;
  }
  void SetColumn(int column, const Vector& v) noexcept {
    ForEach([&](int i) { m_Entry[i * N + column] = v[i]; });
  }
  Vector GetColumn(int column) const noexcept {
    Vector v;
    ForEach([&](int i) { v[i] = m_Entry[i * N + column]; });
    return v;
  }
  // Writes the N * N entries column by column.
  void GetColumnMajor(Real* out) const noexcept {
    ForEachEntry([&](int i) { out[i] = m_Entry[(i % N) * N + i / N]; });
  }

  // ---- comparison ----
  bool operator==(const CKRMatrixT& m) const noexcept { return std::memcmp(m_Entry, m.m_Entry, sizeof m_Entry) == 0; }
  bool operator!=(const CKRMatrixT& m) const noexcept { return !(*this == m); }
  bool operator<(const CKRMatrixT& m) const noexcept { return CompareArrays(m) < 0; }
  bool operator<=(const CKRMatrixT& m) const noexcept { return CompareArrays(m) <= 0; }
  bool operator>(const CKRMatrixT& m) const noexcept { return CompareArrays(m) > 0; }
  bool operator>=(const CKRMatrixT& m) const noexcept { return CompareArrays(m) >= 0; }

  // ---- entrywise arithmetic ----
  CKRMatrixT operator+(const CKRMatrixT& m) const noexcept {
    return Build([&](int i) { return m_Entry[i] + m.m_Entry[i]; });
  }
  CKRMatrixT operator-(const CKRMatrixT& m) const noexcept {
    return Build([&](int i) { return m_Entry[i] - m.m_Entry[i]; });
  }
  CKRMatrixT operator-() const noexcept {
    return Build([&](int i) { return -m_Entry[i]; });
  }
  CKRMatrixT operator*(Real s) const noexcept {
    return Build([&](int i) { return m_Entry[i] * s; });
  }
  friend CKRMatrixT operator*(Real s, const CKRMatrixT& m) noexcept { return m * s; }
  // Every entry MAX_REAL when s is 0; otherwise the entries times 1 / s.
  CKRMatrixT operator/(Real s) const noexcept {
    if (s == Real(0))
      return Build([](int) { return Math::MAX_REAL; });
    return *this * (Real(1) / s);
  }
  CKRMatrixT& operator+=(const CKRMatrixT& m) noexcept { return *this = *this + m; }
  CKRMatrixT& operator-=(const CKRMatrixT& m) noexcept { return *this = *this - m; }
  CKRMatrixT& operator*=(Real s) noexcept { return *this = *this * s; }
  CKRMatrixT& operator/=(Real s) noexcept { return *this = *this / s; }

  // ---- products ----
  // The matrix times a column vector or point; the result is of the same kind.
  Vector operator*(const Vector& v) const noexcept { return Times(v); }
  Point operator*(const Point& p) const noexcept { return Times(p); }
  CKRMatrixT operator*(const CKRMatrixT& m) const noexcept { return Product<false, false>(*this, m); }
  CKRMatrixT& operator*=(const CKRMatrixT& m) noexcept { return *this = *this * m; }
  CKRMatrixT Transpose() const noexcept {
    return Build([&](int i) { return m_Entry[(i % N) * N + i / N]; });
  }
  // transpose(this) * m and this * transpose(m).
  CKRMatrixT TransposeTimes(const CKRMatrixT& m) const noexcept { return Product<true, false>(*this, m); }
  CKRMatrixT TimesTranspose(const CKRMatrixT& m) const noexcept { return Product<false, true>(*this, m); }
  // u . (this * v).
  Real QForm(const Vector& u, const Vector& v) const noexcept { return u.Dot(*this * v); }

protected:
  // Leaves the entries uninitialised (for results about to be written).
  struct SKRUninitialized {};
  explicit CKRMatrixT(SKRUninitialized) noexcept {}
  // The N * N entries in row order; for the size classes' constants (constexpr).
  template <class... Values>
    requires(sizeof...(Values) == N * N)
  constexpr CKRMatrixT(std::in_place_t, Values... values) noexcept : m_Entry{Real(values)...} {}

  // Entries row by row, or column by column when rowMajor is false; vectors
  // as the columns, or as the rows when `columns` is false. A null array
  // gives the zero matrix.
  void SetEntries(const Real* entries, bool rowMajor) noexcept {
    if (entries == nullptr)
      MakeZero();
    else
      ForEachEntry([&](int i) { m_Entry[i] = rowMajor ? entries[i] : entries[(i % N) * N + i / N]; });
  }
  template <class VectorN>
  void SetVectors(const VectorN* vectors, bool columns) noexcept {
    if (vectors == nullptr)
      MakeZero();
    else
      ForEach([&](int i) { columns ? SetColumn(i, vectors[i]) : SetRow(i, vectors[i]); });
  }

  // Whether a determinant allows an inverse: its magnitude above EPSILON
  // (an absolute threshold, 1.1920928955078125e-07) and finite.
  static bool IsInvertible(Real determinant) noexcept {
    const Real magnitude = Math::FAbs(determinant);
    return magnitude > Math::EPSILON && magnitude <= std::numeric_limits<Real>::max();
  }

  // -1, 0 or 1: the byte images of the entries compared as unsigned bytes in
  // memory order.
  int CompareArrays(const CKRMatrixT& m) const noexcept {
    const int order = std::memcmp(m_Entry, m.m_Entry, sizeof m_Entry);
    return (order > 0) - (order < 0);
  }

  // Calls function(i) for i = 0..N-1, and for i = 0..N*N-1, unrolled.
  template <class Function>
  static constexpr void ForEach(Function&& function) {
    [&]<int... I>(std::integer_sequence<int, I...>) { (function(I), ...); }(std::make_integer_sequence<int, N>{});
  }
  template <class Function>
  static constexpr void ForEachEntry(Function&& function) {
    [&]<int... I>(std::integer_sequence<int, I...>) { (function(I), ...); }(
        std::make_integer_sequence<int, N * N>{});
  }
  // The matrix whose entry i is function(i).
  template <class Function>
  static CKRMatrixT Build(Function&& function) {
    CKRMatrixT result{SKRUninitialized{}};
    ForEachEntry([&](int i) { result.m_Entry[i] = function(i); });
    return result;
  }
  // The matrix times the components of a vector or point: row by row, left
  // to right; four rows side by side in four lanes.
  template <class Tuple>
  Tuple Times(const Tuple& v) const noexcept {
    Tuple product;
    if constexpr (N == 4)
      SKRMatrixLanes<Real>::RowDots(m_Entry, v.GetTuple(), product.GetTuple());
    else
      ForEach([&](int i) { product[i] = RowTimes(i, v); });
    return product;
  }
  template <class Tuple>
  Real RowTimes(int i, const Tuple& v) const noexcept {
    Real sum = m_Entry[i * N] * v[0];
    ForEach([&](int j) {
      if (j > 0)
        sum += m_Entry[i * N + j] * v[j];
    });
    return sum;
  }
  // a * b with either factor transposed. Each row of the product is formed as
  // the sum over k of a(i, k) times row k of b, so that the entries of one
  // row are independent and the compiler can compute them side by side.
  template <bool TransposeA, bool TransposeB>
  static CKRMatrixT Product(const CKRMatrixT& a, const CKRMatrixT& b) noexcept {
    const auto at = [&](int i, int k) { return TransposeA ? a.m_Entry[k * N + i] : a.m_Entry[i * N + k]; };
    const auto bt = [&](int k, int j) { return TransposeB ? b.m_Entry[j * N + k] : b.m_Entry[k * N + j]; };
    CKRMatrixT product{SKRUninitialized{}};
    ForEach([&](int i) {
      ForEach([&](int j) { product.m_Entry[i * N + j] = at(i, 0) * bt(0, j); });
      ForEach([&](int k) {
        if (k > 0)
          ForEach([&](int j) { product.m_Entry[i * N + j] += at(i, k) * bt(k, j); });
      });
    });
    return product;
  }

  Real m_Entry[N * N];
};

extern template class KRCORELIB_API CKRMatrixT<2, float, double>;
extern template class KRCORELIB_API CKRMatrixT<3, float, double>;
extern template class KRCORELIB_API CKRMatrixT<4, float, double>;
extern template class KRCORELIB_API CKRMatrixT<2, double, float>;
extern template class KRCORELIB_API CKRMatrixT<3, double, float>;
extern template class KRCORELIB_API CKRMatrixT<4, double, float>;
