// CKRQuaternionT in both precision pairs: conversions to and from rotation
// matrices, axis and angle, the algebra (product, inverse, Exp and Log),
// interpolation, alignment and the twist decompositions, over many random
// rotations.
#include "KRMathTestTypes.h"

template <class Pair>
class CKRQuaternionTTest : public ::testing::Test {
protected:
  using TReal = typename Pair::Real;
  using TQuaternion = CKRQuaternionT<TReal, typename Pair::Other>;
  static constexpr double kEpsilon = std::numeric_limits<TReal>::epsilon();

  // The largest component of a - b, and of a - b or a + b (the same rotation).
  static double Difference(const TQuaternion& a, const TQuaternion& b) {
    double largest = 0;
    for (int i = 0; i < 4; ++i)
      largest = std::max(largest, std::fabs(double(a[i]) - double(b[i])));
    return largest;
  }
  static double RotationDifference(const TQuaternion& a, const TQuaternion& b) {
    return std::min(Difference(a, b), Difference(a, -b));
  }
  // The angle between two unit quaternions on their great circle, accurate
  // also near 0 and pi.
  static double Angle(const TQuaternion& a, const TQuaternion& b) {
    double difference = 0, sum = 0;
    for (int i = 0; i < 4; ++i) {
      difference += (double(a[i]) - double(b[i])) * (double(a[i]) - double(b[i]));
      sum += (double(a[i]) + double(b[i])) * (double(a[i]) + double(b[i]));
    }
    return 2 * std::atan2(std::sqrt(difference), std::sqrt(sum));
  }
  static CKRVector3T<TReal, typename Pair::Other> RandomUnit(std::mt19937& random) {
    const TQuaternion q = KRRandomRotation<TQuaternion>(random);
    return CKRVector3T<TReal, typename Pair::Other>(q.X(), q.Y(), q.Z()).GetNormalized();
  }
};
TYPED_TEST_SUITE(CKRQuaternionTTest, KRPrecisionPairs, KRPrecisionPairNames);

// A unit quaternion and its rotation matrix convert into each other (up to
// the sign of the quaternion); every form of the conversion agrees; the
// Hamilton product is the product of the matrices.
TYPED_TEST(CKRQuaternionTTest, RotationMatricesRoundTrip) {
  KR_MATH_TEST_TYPES;
  const double epsilon = TestFixture::kEpsilon;
  std::mt19937 random(KRTestSeed());
  for (int i = 0; i < 1000; ++i) {
    const Quat q = KRRandomRotation<Quat>(random), p = KRRandomRotation<Quat>(random);
    Mat3 m, mp, mqp;
    q.ToRotationMatrix(m);
    p.ToRotationMatrix(mp);
    (q * p).ToRotationMatrix(mqp);
    ASSERT_LE(KROrthogonalityError(m), 16 * epsilon);
    ASSERT_NEAR(m.Determinant(), 1.0, 16 * epsilon);
    ASSERT_LE(KRMaxDifference(mqp, Mat3(m * mp)), 16 * epsilon);
    const Quat back(m);
    ASSERT_LE(TestFixture::RotationDifference(back, q), 8 * epsilon) << ::testing::PrintToString(q);
    Mat4 m4;
    q.ToRotationMatrix(m4);
    ASSERT_EQ(Quat(m4), back);
    ASSERT_EQ(m4(3, 3), Real(1));
    ASSERT_EQ(m4(0, 3) + m4(3, 0), Real(0));
    V3 columns[3];
    q.ToRotationMatrix(columns);
    const V4 columns4[3] = {V4(columns[0].X(), columns[0].Y(), columns[0].Z(), Real(1)),
                            V4(columns[1].X(), columns[1].Y(), columns[1].Z(), Real(1)),
                            V4(columns[2].X(), columns[2].Y(), columns[2].Z(), Real(1))};
    ASSERT_EQ(Quat(columns), back);
    ASSERT_EQ(Quat(columns4), back);
    const V3 v = TestFixture::RandomUnit(random);
    ASSERT_EQ(q * v, V3(m * v));
    ASSERT_EQ(V4(q * V4(v.X(), v.Y(), v.Z(), Real(5))).W(), Real(5));
    // The conjugate undoes the rotation; the inverse is the conjugate.
    ASSERT_LE(TestFixture::Difference(q * q.Conjugate(), Quat::IDENTITY), 4 * epsilon);
    ASSERT_LE(TestFixture::Difference(q.Inverse(), q.Conjugate()), 4 * epsilon);
  }
  // A half turn about y: w = 0 and y = 1.
  const Quat halfTurn(Mat3(Real(-1), Real(1), Real(-1)));
  EXPECT_EQ(halfTurn, Quat(Real(0), Real(0), Real(1), Real(0)));
  EXPECT_EQ(Quat(static_cast<const V3*>(nullptr)), Quat::IDENTITY);
  EXPECT_EQ(Quat::ZERO.Inverse(), Quat::ZERO);
  EXPECT_EQ(TestFixture::Difference((Quat::IDENTITY * Real(2)).Inverse(), Quat::IDENTITY * Real(0.5)), 0.0);
}

TYPED_TEST(CKRQuaternionTTest, AxisAngleExpAndLogRoundTrip) {
  KR_MATH_TEST_TYPES;
  const double epsilon = TestFixture::kEpsilon;
  std::mt19937 random(KRTestSeed());
  std::uniform_real_distribution<double> angles(0.01, 2 * std::numbers::pi - 0.01);
  for (int i = 0; i < 1000; ++i) {
    const V3 axis = TestFixture::RandomUnit(random);
    const Real angle = Real(angles(random));
    const Quat q(axis, angle);
    V3 foundAxis;
    Real foundAngle;
    q.ToAxisAngle(foundAxis, foundAngle);
    ASSERT_NEAR(foundAngle, angle, 2e3 * epsilon);
    ASSERT_LE(V3(foundAxis - axis).Length(), 64 * epsilon);
    // The rotation matrix agrees with the 3 x 3 one of the same axis and angle.
    Mat3 m;
    q.ToRotationMatrix(m);
    ASSERT_LE(KRMaxDifference(m, Mat3(axis, angle)), 8 * epsilon);
    // Exp undoes Log, also within 1e-6 of w = -1.
    const Quat r = i % 10 ? KRRandomRotation<Quat>(random) : Quat(axis, Real(2 * std::numbers::pi - 1e-6));
    ASSERT_LE(TestFixture::Difference(r.Log().Exp(), r), 16 * epsilon) << ::testing::PrintToString(r);
    ASSERT_EQ(r.Log().W(), Real(0));
  }
  // Tiny rotations report angle 0 about x; Exp of a half turn of the
  // quaternion is -1; the logarithm of the identity is 0.
  V3 axis;
  Real angle;
  Quat(V3(0, 1, 0), Real(1e-4)).ToAxisAngle(axis, angle);
  EXPECT_TRUE(angle == Real(0) && axis == V3::UNIT_X);
  EXPECT_LE(TestFixture::Difference(Quat(Real(0), Real(0), Real(std::numbers::pi), Real(0)).Exp(), -Quat::IDENTITY), 4 * epsilon);
  EXPECT_EQ(Quat::IDENTITY.Log(), Quat::ZERO);
}

// Slerp moves along the great circle at constant speed from p to q and
// stays unit; for q = -p it still does; extra spins add half turns; Squad
// meets its ends and the intermediate points of a uniform turn are its keys.
TYPED_TEST(CKRQuaternionTTest, InterpolationFollowsTheGreatCircle) {
  KR_MATH_TEST_TYPES;
  const double epsilon = TestFixture::kEpsilon;
  std::mt19937 random(KRTestSeed());
  for (int i = 0; i < 1000; ++i) {
    const Quat p = KRRandomRotation<Quat>(random);
    const Quat q = i % 10 ? KRRandomRotation<Quat>(random) : -p;
    const double whole = TestFixture::Angle(p, q);
    // Slerp finds the angle by an arc cosine, whose error grows as 1 / sin
    // and enters the length of the result as 1 / sin^2.
    const double sine = std::max(1e-3, std::sin(whole));
    const double tolerance = 64 * epsilon / sine;
    ASSERT_LE(TestFixture::Difference(Quat::Slerp(Real(0), p, q), p), 8 * epsilon);
    ASSERT_LE(TestFixture::Difference(Quat::Slerp(Real(1), p, q), q), 8 * epsilon);
    for (const double t : {0.25, 0.5, 0.8}) {
      const Quat s = Quat::Slerp(Real(t), p, q);
      ASSERT_NEAR(s.Dot(s), 1.0, 16 * epsilon / (sine * sine));
      ASSERT_NEAR(TestFixture::Angle(p, s), t * whole, tolerance) << t;
      ASSERT_LE(TestFixture::Difference(Quat::SlerpExtraSpins(Real(t), p, q, 0), s), 0.0);
    }
    ASSERT_LE(TestFixture::Difference(Quat::SlerpExtraSpins(Real(1), p, q, 1), -q), tolerance);
    ASSERT_LE(TestFixture::Difference(Quat::SlerpExtraSpins(Real(1), p, q, 2), q), tolerance);
    ASSERT_EQ(Quat::Slerp(Real(0.3), p, p), p);
    const Quat a0 = KRRandomRotation<Quat>(random), a1 = KRRandomRotation<Quat>(random);
    ASSERT_LE(TestFixture::Difference(Quat::Squad(Real(0), p, a0, a1, q), p), 8 * epsilon);
    ASSERT_LE(TestFixture::Difference(Quat::Squad(Real(1), p, a0, a1, q), q), 8 * epsilon);
    const V3 axis = TestFixture::RandomUnit(random);
    const Real step = Real(std::uniform_real_distribution<double>(0.1, 1.5)(random));
    const Quat key(axis, step);
    ASSERT_LE(TestFixture::Difference(Quat::GetIntermediate(Quat::IDENTITY, key, Quat(axis, 2 * step)), key),
              16 * epsilon);
  }
  // q to -q takes the long way: half-way is a quarter of the circle away.
  const Quat p = KRRandomRotation<Quat>(random);
  EXPECT_NEAR(Quat::Slerp(Real(0.5), p, -p).Dot(p), 0.0, 8 * epsilon);
}

// Align turns `from` onto `to` about their common normal; opposite vectors
// get the documented half turn; the twist decompositions multiply back to the
// rotation, with the no-twist part turning about a normal of the axis.
TYPED_TEST(CKRQuaternionTTest, AlignmentAndTwistDecompositions) {
  KR_MATH_TEST_TYPES;
  const double epsilon = TestFixture::kEpsilon;
  std::mt19937 random(KRTestSeed());
  for (int i = 0; i < 1000; ++i) {
    const V3 from = TestFixture::RandomUnit(random);
    const V3 to = i % 10 ? TestFixture::RandomUnit(random) : -from;
    const Quat align = Quat::Align(from, to);
    ASSERT_NEAR(align.Dot(align), 1.0, 8 * epsilon);
    // The bisector of nearly opposite vectors is ill-conditioned: the
    // rounding of their unit lengths turns it by about epsilon / |from + to|.
    const double bisector = std::max(double(V3(from + to).Length()), 1e-3);
    ASSERT_LE(V3(align * from - to).Length(), 16 * epsilon / (i % 10 ? bisector : 1.0));
    ASSERT_NEAR(V3(align.X(), align.Y(), align.Z()).Dot(from), 0.0, 8 * epsilon);
    ASSERT_EQ(Quat::Align(V4(from.X(), from.Y(), from.Z(), Real(3)), V4(to.X(), to.Y(), to.Z(), Real(0))), align);

    const Quat q = KRRandomRotation<Quat>(random);
    Quat twist, noTwist;
    q.DecomposeTwistTimesNoTwist(from, twist, noTwist);
    ASSERT_LE(TestFixture::Difference(twist * noTwist, q), 16 * epsilon);
    ASSERT_NEAR(V3(noTwist.X(), noTwist.Y(), noTwist.Z()).Dot(from), 0.0, 16 * epsilon);
    const V3 turned = q * from;
    const double turnedBisector = std::max(double(V3(from + turned).Length()), 1e-3);
    ASSERT_LE(V3(twist * turned - turned).Length(), 64 * epsilon / turnedBisector);
    q.DecomposeNoTwistTimesTwist(from, twist, noTwist);
    ASSERT_LE(TestFixture::Difference(noTwist * twist, q), 16 * epsilon);
    ASSERT_LE(V3(twist * from - from).Length(), 64 * epsilon / turnedBisector);
  }
  // Opposite vectors: the half turn about from turned by a right angle in
  // the plane of its z and its larger of x and y; zero vectors: IDENTITY.
  EXPECT_EQ(Quat::Align(V3(1, 0, 0), V3(-1, 0, 0)), Quat(0, 0, 0, 1));
  EXPECT_EQ(Quat::Align(V3(0, 0, 2), V3(0, 0, -2)), Quat(0, -1, 0, 0));
  EXPECT_EQ(Quat::Align(V3::ZERO, V3(1, 0, 0)), Quat::IDENTITY);
}
