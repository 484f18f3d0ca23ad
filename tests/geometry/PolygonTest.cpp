// Polygon: the sweep-line triangulation, its invariants on random polygons
// with holes, and its answers to malformed input.
#include <krCoreLib/geometry/KRSweepPolygon.h>

#include "KRPolygonSamples.h"
#include "KRTestSeed.h"

#include <gtest/gtest.h>

#include <limits>
#include <sstream>
#include <string>

using namespace krPolygonTriangulation;

namespace {

// The diagnostics of malformed input.
const std::string kOrientationMessage =
    "Please check your input polygon:\n1)orientations?\n2)duplicated points?\ntriangulation stopped.\n";

const KRContour kSquare = Contour({{0, 0}, {4, 0}, {4, 4}, {0, 4}});
const KRContour kHole = Contour({{1, 1}, {1, 3}, {3, 3}, {3, 1}});  // clockwise

// Triangulates the contours (each with its reverse flag); the output the
// triangulator wrote goes to `output`.
bool Triangulate(Polygon& polygon, const std::vector<std::pair<KRContour, bool>>& contours,
                 std::string* output = nullptr) {
  for (const auto& [contour, reverse] : contours)
    polygon.AddContour(contour, reverse);
  polygon.Finish();
  testing::internal::CaptureStdout();
  const bool done = polygon.triangulation();
  const std::string written = testing::internal::GetCapturedStdout();
  if (output != nullptr)
    *output = written;
  return done;
}

double TriangleArea(const Polygon& polygon, const Polygon::Triangle& t) {
  const Pointbase& a = polygon.points()[t[0]];
  const Pointbase& b = polygon.points()[t[1]];
  const Pointbase& c = polygon.points()[t[2]];
  return ((b.m_X - a.m_X) * (c.m_Y - a.m_Y) - (b.m_Y - a.m_Y) * (c.m_X - a.m_X)) / 2;
}

// Each piece rises to one top and falls to one bottom along its loop.
bool IsMonotone(const Polygon& polygon, const Polygon::Piece& piece) {
  int tops = 0;
  for (std::size_t i = 0; i < piece.size(); ++i) {
    const Pointbase& p = polygon.points()[piece[i]];
    const Pointbase& before = polygon.points()[piece[(i + piece.size() - 1) % piece.size()]];
    const Pointbase& after = polygon.points()[piece[(i + 1) % piece.size()]];
    tops += p.IsAbove(before) && p.IsAbove(after);
  }
  return tops == 1;
}

class CKRTracedPolygon : public Polygon {
public:
  using Polygon::setDebugLog;
};

}  // namespace

TEST(Polygon, SquaresAndHoles) {
  struct SKRCase {
    const char* m_Name;
    std::vector<std::pair<KRContour, bool>> m_Contours;
    std::size_t m_Triangles;
  };
  const SKRCase cases[] = {
      {"square", {{kSquare, false}}, 2},
      {"clockwise square reversed", {{Contour({{0, 0}, {0, 4}, {4, 4}, {4, 0}}), true}}, 2},
      {"square with a hole", {{kSquare, false}, {kHole, false}}, 8},
      // Equal heights everywhere: the events order by x at each height.
      {"two holes side by side", {{kSquare, false}, {Contour({{0.5, 1}, {0.5, 3}, {1.5, 3}, {1.5, 1}}), false},
                                  {Contour({{2.5, 1}, {2.5, 3}, {3.5, 3}, {3.5, 1}}), false}}, 14},
  };
  for (const SKRCase& c : cases) {
    SCOPED_TRACE(c.m_Name);
    Polygon polygon;
    std::string output;
    ASSERT_TRUE(Triangulate(polygon, c.m_Contours, &output));
    EXPECT_EQ(output, "Total number of triangles:" + std::to_string(c.m_Triangles) + "\n");
    ASSERT_EQ(polygon.triangles().size(), c.m_Triangles);
    double area = 0;
    for (const Polygon::Triangle& t : polygon.triangles()) {
      EXPECT_GT(TriangleArea(polygon, t), 0);
      area += TriangleArea(polygon, t);
    }
    double expected = 0;
    for (const auto& [contour, reverse] : c.m_Contours)
      expected += SignedArea(contour) * (reverse ? -1 : 1);
    EXPECT_DOUBLE_EQ(area, expected);
  }
}

TEST(Polygon, RandomPolygonsWithHolesMeetTheInvariants) {
  std::mt19937 random(KRTestSeed());
  std::uniform_int_distribution<int> vertices(5, 60);
  std::uniform_int_distribution<int> holes(0, 12);
  for (int round = 0; round < 300; ++round) {
    const SKRPolygonSample sample = RandomStarWithHoles(random, vertices(random), holes(random));
    SCOPED_TRACE(testing::Message() << "round " << round << ": " << sample.m_Outer.size() << " vertices, "
                                    << sample.m_Holes.size() << " holes");
    Polygon polygon;
    sample.AddTo(polygon);
    polygon.Finish();
    testing::internal::CaptureStdout();
    const bool done = polygon.triangulation();
    testing::internal::GetCapturedStdout();
    ASSERT_TRUE(done);
    ASSERT_EQ(polygon.triangles().size(), sample.VertexCount() + 2 * sample.m_Holes.size() - 2);
    for (const Polygon::Piece& piece : polygon.monotonePieces())
      ASSERT_TRUE(IsMonotone(polygon, piece));

    double expected = SignedArea(sample.m_Outer);
    for (const KRContour& hole : sample.m_Holes)
      expected -= SignedArea(hole);
    double area = 0;
    for (const Polygon::Triangle& t : polygon.triangles()) {
      const Pointbase& a = polygon.points()[t[0]];
      const Pointbase& b = polygon.points()[t[1]];
      const Pointbase& c = polygon.points()[t[2]];
      ASSERT_GT(orient2d(a.m_X, a.m_Y, b.m_X, b.m_Y, c.m_X, c.m_Y), 0);
      area += TriangleArea(polygon, t);
      // The centroid lies inside the boundary and in no hole.
      const CKRPoint2T<double, float> centroid((a.m_X + b.m_X + c.m_X) / 3, (a.m_Y + b.m_Y + c.m_Y) / 3);
      using Math = CKRMathT<double, float>;
      ASSERT_TRUE((Math::PolygonContainsPoint(sample.m_Outer.data(), int(sample.m_Outer.size()), centroid, false)));
      for (const KRContour& hole : sample.m_Holes)
        ASSERT_FALSE((Math::PolygonContainsPoint(hole.data(), 4, centroid, true)));
    }
    EXPECT_NEAR(area, expected, 1e-9 * std::fabs(expected));
  }
}

TEST(Polygon, AddContourRefusesUnusableContours) {
  const double nan = std::numeric_limits<double>::quiet_NaN();
  const double inf = std::numeric_limits<double>::infinity();
  const struct {
    const char* m_Name;
    KRContour m_Points;
    bool m_Closed;
  } refused[] = {
      {"repeated point", Contour({{5, 5}, {9, 5}, {5, 5}, {5, 9}}), false},
      {"point of the first contour", Contour({{0, 0}, {-5, -1}, {-1, -5}}), false},
      {"-0 repeats 0", Contour({{-0.0, 0}, {-5, -1}, {-1, -5}}), false},
      {"two points", Contour({{5, 5}, {9, 5}}), false},
      {"two points closed", Contour({{5, 5}, {9, 5}, {5, 5}}), true},
      {"nothing closed", Contour({}), true},
      {"NaN", Contour({{5, 5}, {nan, 5}, {5, 9}}), false},
      {"infinity", Contour({{5, 5}, {9, 5}, {5, inf}}), false},
      {"1e300", Contour({{5, 5}, {1e300, 5}, {5, 9}}), false},
  };
  Polygon polygon;
  ASSERT_TRUE(polygon.AddContour(kSquare));
  for (const auto& c : refused) {
    SCOPED_TRACE(c.m_Name);
    EXPECT_FALSE(polygon.AddContour(c.m_Points, false, c.m_Closed));
    // Nothing of a refused contour stays behind.
    EXPECT_EQ(polygon.points().size(), 4u);
    EXPECT_FALSE(polygon.is_exist(5, 5));
  }
  EXPECT_TRUE(polygon.is_exist(4, 4));
  ASSERT_TRUE(polygon.AddContour(kHole));
  EXPECT_EQ(polygon.points()[5].m_X, 1);
  polygon.Finish();
  EXPECT_FALSE(polygon.AddContour(Contour({{10, 10}, {11, 10}, {11, 11}})));
  testing::internal::CaptureStdout();
  EXPECT_TRUE(polygon.triangulation());
  testing::internal::GetCapturedStdout();
  EXPECT_EQ(polygon.triangles().size(), 8u);
}

TEST(Polygon, MalformedInputEndsInAReportOrAResult) {
  // Every contour must run the way its nesting asks (outside counter-
  // clockwise, holes clockwise, islands in holes counter-clockwise again)
  // and be simple; a result must be counter-clockwise triangles covering
  // exactly the contours' area.
  const KRContour island = Contour({{1.5, 1.5}, {2.5, 1.5}, {2.5, 2.5}, {1.5, 2.5}});
  const KRContour beside = Contour({{6, 0}, {7, 0}, {7, 1}, {6, 1}});
  const struct {
    const char* m_Name;
    std::vector<std::pair<KRContour, bool>> m_Contours;
    bool m_bDone;
    const char* m_Message;  // the diagnostic of a failure, if fixed
    double m_Area;          // the triangles' area of a result
  } cases[] = {
      {"clockwise boundary", {{Contour({{0, 0}, {0, 4}, {4, 4}, {4, 0}}), false}}, false, kOrientationMessage.c_str(), 0},
      {"no contour", {}, false, kOrientationMessage.c_str(), 0},
      {"hole turning the wrong way", {{kSquare, false}, {kHole, true}}, false, kOrientationMessage.c_str(), 0},
      {"hole outside", {{kSquare, false}, {Contour({{6, 1}, {6, 3}, {8, 3}, {8, 1}}), false}}, false,
       kOrientationMessage.c_str(), 0},
      {"hole above the boundary", {{kSquare, false}, {Contour({{1, 5}, {1, 7}, {3, 7}, {3, 5}}), false}}, false,
       kOrientationMessage.c_str(), 0},
      {"island turning the wrong way", {{kSquare, false}, {kHole, false}, {island, true}}, false,
       kOrientationMessage.c_str(), 0},
      {"hole touching the boundary", {{kSquare, false}, {Contour({{3, 1}, {2, 2}, {4, 3}}), false}}, false,
       kOrientationMessage.c_str(), 0},
      {"collinear boundary", {{Contour({{0, 0}, {1, 1}, {2, 2}}), false}}, false, nullptr, 0},
      {"collinear hole", {{kSquare, false}, {Contour({{1, 1}, {2, 2}, {3, 3}}), false}}, false, nullptr, 0},
      {"bow tie", {{Contour({{0, 0}, {4, 4}, {4, 0}, {0, 4}}), false}}, false, nullptr, 0},
      {"crossing hole", {{kSquare, false}, {Contour({{1, 1}, {1, 5}, {3, 5}, {3, 1}}), false}}, false, nullptr, 0},
      // The hole is refused by AddContour (its first point repeats a corner).
      {"hole sharing a vertex", {{kSquare, false}, {Contour({{0, 0}, {1, 3}, {3, 1}}), false}}, true, nullptr, 16},
      {"square with a hole", {{kSquare, false}, {kHole, false}}, true, nullptr, 12},
      {"island in a hole", {{kSquare, false}, {kHole, false}, {island, false}}, true, nullptr, 13},
      {"two boundaries", {{kSquare, false}, {beside, false}, {kHole, false}}, true, nullptr, 13},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.m_Name);
    Polygon polygon;
    std::string output;
    const bool done = Triangulate(polygon, c.m_Contours, &output);
    EXPECT_EQ(done, c.m_bDone);
    if (!done) {
      EXPECT_TRUE(polygon.triangles().empty());
      EXPECT_TRUE(polygon.monotonePieces().empty());
      EXPECT_NE(output.find("triangulation stopped"), std::string::npos);
      if (c.m_Message != nullptr) {
        EXPECT_EQ(output, c.m_Message);
      }
    } else {
      double area = 0;
      for (const Polygon::Triangle& t : polygon.triangles()) {
        EXPECT_GT(TriangleArea(polygon, t), 0);
        area += TriangleArea(polygon, t);
      }
      EXPECT_EQ(area, c.m_Area);
    }
  // A pass asked for again gives its first outcome and writes nothing.
    testing::internal::CaptureStdout();
    EXPECT_EQ(polygon.triangulation(), done);
    EXPECT_EQ(testing::internal::GetCapturedStdout(), "");
  }
  // Passes before Finish() do nothing.
  Polygon unfinished;
  unfinished.AddContour(kSquare);
  EXPECT_FALSE(unfinished.triangulation());
  unfinished.Finish();
  testing::internal::CaptureStdout();
  EXPECT_TRUE(unfinished.triangulation());
  testing::internal::GetCapturedStdout();
}

TEST(Polygon, FuzzedInputNeverFaultsOrHangs) {
  // Thousands of mostly invalid polygons through the whole pipeline: small
  // grids (repeats, collinear points, crossings), random walks, extreme and
  // non-finite values. Each run must end in a report or in triangles over
  // the stored vertices.
  std::mt19937 random(KRTestSeed());
  std::uniform_int_distribution<int> contours(1, 4);
  std::uniform_int_distribution<int> sizes(0, 12);
  std::uniform_int_distribution<int> grid(0, 4);
  std::uniform_int_distribution<int> kinds(0, 99);
  std::uniform_real_distribution<double> real(-10, 10);
  const double extremes[] = {std::numeric_limits<double>::quiet_NaN(), std::numeric_limits<double>::infinity(),
                             1e300, -1e150, 1e-300, 0x1p-1074};
  int succeeded = 0;
  testing::internal::CaptureStdout();
  for (int round = 0; round < 4000; ++round) {
    const int kind = kinds(random);
    Polygon polygon;
    for (int c = contours(random); c > 0; --c) {
      KRContour contour;
      const int size = kind < 10 ? 20 + sizes(random) * 4 : sizes(random);
      for (int i = 0; i < size; ++i) {
        double x = kind < 50 ? grid(random) : real(random);
        double y = kind < 50 ? grid(random) : real(random);
        if (kind >= 95 && i == 0)
          x = extremes[random() % std::size(extremes)];
        contour.emplace_back(x, y);
      }
      polygon.AddContour(contour, random() % 2 == 0, random() % 5 == 0);
    }
    polygon.Finish();
    if (polygon.triangulation()) {
      ++succeeded;
      for (const Polygon::Triangle& t : polygon.triangles())
        for (const unsigned id : t)
          ASSERT_TRUE(id >= 1 && id <= polygon.points().size()) << "round " << round;
    } else {
      ASSERT_TRUE(polygon.triangles().empty()) << "round " << round;
    }
  }
  testing::internal::GetCapturedStdout();
  // Both outcomes occur: the sample is not all rejected at the door.
  EXPECT_GT(succeeded, 100);
  EXPECT_LT(succeeded, 3900);
}

TEST(Polygon, StepTraceFollowsThePasses) {
  CKRTracedPolygon polygon;
  std::ostringstream log;
  polygon.setDebugLog(&log);
  std::string output;
  ASSERT_TRUE(Triangulate(polygon, {{kSquare, false}, {kHole, false}}, &output));
  const std::string trace = log.str();
  for (const char* text : {"\n\nHandle vertex:4 type:START", " type:SPLIT", " type:MERGE", "Insert e4 to splay tree\n",
                           "Add Diagonal from ", "Searching for loops:", "\nloop closed!\n\n",
                           "current top queue vertex index=", "Add triangle:"})
    EXPECT_NE(trace.find(text), std::string::npos) << text;
  // The trace goes to its own stream only.
  EXPECT_EQ(output, "Total number of triangles:8\n");
}
