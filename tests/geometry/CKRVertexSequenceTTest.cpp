// CKRVertexSourceT stores, CKRVertexSequenceT and CKRTriangleT in both
// precision pairs: indexing through sources, reversal and length, copies of
// owned arrays, comparisons, and bad positions that must not fault.
#include <krCoreLib/geometry/CKRTriangleT.h>
#include <krCoreLib/geometry/CKRVertexSequenceT.h>

#include "KRGeometryTestTypes.h"

#include <utility>

template <class Pair>
class CKRVertexSequenceTTest : public ::testing::Test {};
TYPED_TEST_SUITE(CKRVertexSequenceTTest, KRGeometryPairs, KRGeometryPairNames);

TYPED_TEST(CKRVertexSequenceTTest, SequencesWalkTheirSource) {
  KR_GEOMETRY_TEST_TYPES;
  CKRVectorVertexSourceT<2, Real, Other> source(4);
  for (unsigned i = 0; i < 4; ++i)
    source[i] = P2(Real(i), Real(10 * i));
  CKRVertexSequenceT<2, Real, Other> sequence(&source);
  EXPECT_EQ(sequence.GetLength(), 4u);
  sequence.Reverse();  // no indices: unchanged
  EXPECT_EQ(P2(sequence[1]), P2(1, 10));

  sequence.SetLength(3);
  EXPECT_EQ(sequence.GetLength(), 3u);
  EXPECT_EQ(P2(sequence[2]), P2(0, 0));  // new indices are 0
  sequence.GetIndices() = {3, 1, 2};
  sequence.Reverse();
  EXPECT_EQ(P2(sequence[0]), P2(2, 20));
  EXPECT_EQ(P2(sequence[2]), P2(3, 30));
  sequence[0] = P2(7, 7);  // writes through to the source
  EXPECT_EQ(P2(source[2]), P2(7, 7));
  sequence.SetLength(0);
  EXPECT_EQ(sequence.GetLength(), 4u);

  // Positions and indices outside the source give the detached point.
  sequence.GetIndices() = {0, 99};
  EXPECT_EQ(P2(sequence[1]), P2(0, 0));
  EXPECT_EQ(P2(std::as_const(sequence)[5]), P2(0, 0));
  CKRVertexSequenceT<2, Real, Other> empty;
  EXPECT_EQ(empty.GetLength(), 0u);
  EXPECT_EQ(P2(empty[3]), P2(0, 0));
}

TYPED_TEST(CKRVertexSequenceTTest, ArraySourcesCopyAndCompareTheirPoints) {
  KR_GEOMETRY_TEST_TYPES;
  using Array = CKRArrayVertexSourceT<3, Real, Other>;
  Array a(3);
  EXPECT_EQ(a.GetCount(), 3u);
  EXPECT_EQ(P3(a[2]), P3(0, 0, 0));
  a[1] = P3(1, 2, 3);
  Array b(a);
  EXPECT_EQ(b, a);
  b[1] = P3(1, 2, 4);  // the copy owns its own array
  EXPECT_EQ(P3(a[1]), P3(1, 2, 3));
  EXPECT_NE(b, a);
  EXPECT_TRUE(a < b);
  EXPECT_FALSE(b < a);
  EXPECT_TRUE(Array() < a);
  a = b;
  EXPECT_EQ(a, b);
  Array moved(std::move(a));
  EXPECT_EQ(moved, b);
  a = moved;  // usable again after the move
  EXPECT_EQ(a.GetCount(), 3u);
}

TYPED_TEST(CKRVertexSequenceTTest, TrianglesIndexIntoTheirSource) {
  KR_GEOMETRY_TEST_TYPES;
  using Triangle = CKRTriangleT<2, Real, Other>;
  CKRArrayVertexSourceT<2, Real, Other> source(3);
  source[0] = P2(0, 0);
  source[1] = P2(1, 0);
  source[2] = P2(0, 1);
  Triangle t(&source, 2, 0, 1);
  EXPECT_EQ(P2(t[0]), P2(0, 1));
  EXPECT_FALSE(t.IsMarked());
  t.SetMarked(true);
  const Triangle copy(t);
  EXPECT_TRUE(copy.IsMarked());
  EXPECT_EQ(copy, t);
  EXPECT_NE(Triangle(&source, 0, 1, 2), t);  // same points, other order
  CKRArrayVertexSourceT<2, Real, Other> nudged(source);
  nudged[2] = P2(Real(0), Real(1.00001));
  EXPECT_TRUE(Triangle(&nudged, 2, 0, 1).Approx_Equal(t, 3));
  EXPECT_FALSE(Triangle(&nudged, 2, 0, 1).Approx_Equal(t, 6));
  // No source, a corner outside 0..2 or an index past the source: the
  // detached point.
  Triangle detached;
  EXPECT_EQ(P2(detached[1]), P2(0, 0));
  EXPECT_EQ(P2(t[3]), P2(0, 0));
  EXPECT_EQ(P2(Triangle(&source, 0, 1, 7)[2]), P2(0, 0));
}
