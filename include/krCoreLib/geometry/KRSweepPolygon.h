// Polygon: the sweep-line triangulator of polygons with holes (namespace
// krPolygonTriangulation).
//
// Input: closed contours of double-precision points, each given once (the
// last point does not repeat the first unless AddContour is told so). The
// interior must lie left of every directed edge: the outer boundary runs
// counter-clockwise, holes clockwise (AddContour can reverse a contour). The
// contours must be simple, must not touch or cross each other, and holes
// must lie inside the outer boundary.
//
// Method: a plane sweep from the top down classifies every vertex and adds
// diagonals that cut the polygon into y-monotone pieces (pass 1,
// partition2Monotone); a walk over the edges collects the pieces as vertex
// loops (pass 2, searchMonotones); each piece is triangulated with a stack
// (pass 3, inside triangulation). O(n log n) time and O(n) memory for n
// vertices: the sweep status orders edges by their x at the current sweep
// height, taken for each edge a search meets.
//
// Ids: points are numbered 1, 2, 3, ... in the order AddContour stores them,
// contour after contour (a reversed contour is stored from its last point
// to its first). The edge from vertex i to its successor has id i; diagonals
// get the ids that follow. A valid polygon with n vertices and h holes gives
// n + 2h - 2 triangles, each three vertex ids in counter-clockwise order.
//
// Output and failure: triangulation() writes "Total number of triangles:"
// with the count and a newline ("Total number of triangles:8\n") to
// standard output. Malformed input is reported to
// standard output with the diagnostic texts below, the triangulation stops,
// triangulation() returns false and the triangle list and the monotone
// pieces are empty:
//   - the highest vertex is not a START vertex (wrong orientation, or no
//     vertices at all), or a contour does not run the way its nesting
//     asks: "Please check your input polygon:\n1)orientations?\n
//     2)duplicated points?\n" and "triangulation stopped.\n";
//   - a vertex with coincident neighbours: "No duplicated points please!
//     triangulation stopped\n";
//   - a loop of pass 2 cannot be closed, or would walk more edges than a
//     valid polygon has, or the triangles found do not cover the contours
//     (self-intersecting or otherwise invalid input): "Please check your
//     input polygon:\n1)orientations?\n2)with duplicated points?\n3)is a
//     simple one?\ntriangulation stopped.\n";
//   - a piece of fewer than three vertices: nothing is written.
// Nesting, before the sweep: each contour's orientation is taken exactly
// (orient2d at its highest vertex, where a simple contour is convex; a
// contour folding back there fails), and so is the other contours' winding
// number around that vertex. A contour must run counter-clockwise where
// they wind 0 times (outer boundaries, islands in holes) and clockwise
// where they wind once (holes); a vertex on another contour's edge fails
// too. Only contours whose bounds hold the vertex are walked; a sweep over
// the contours' left bounds finds them. For c contours that is O(c log c)
// plus a bounds test per contour whose x range holds the vertex, plus the
// sizes of the contours walked: about O(n + c sqrt(c)) for a boundary with
// a grid of small holes, O(n c) in the worst case (every contour within
// the bounds of every other).
// Cover, after pass 3: every triangle must turn left (orient2d > 0), and
// twice the triangles' area must equal twice the contours' signed area
// (cross products about each contour's first vertex) within 2 (m + 4) eps
// times the summed magnitudes of the m cross-product terms of both sums, a
// bound of their rounding errors (eps = 2^-52). O(n).
// Invalid input that passes all of these (contours crossing so that the
// orientations and the area still agree) may still end in a triangle list
// that does not cover the polygon correctly, never in a fault or a hang.
// The process is never ended. After a failure the polygon stays consistent
// and is safely destroyed; edges() may hold the diagonals added before it.
//
// Lifecycle: construct, AddContour per contour, Finish(), triangulation();
// each pass runs once (a pass asked for again returns its first outcome),
// and the polygon is not reused. AddContour after Finish() and the passes
// before Finish() return false and change nothing.
//
// Coordinates far below 1e-140 in magnitude may underflow in the exact
// orientation test; the results then need not be right, but stay safe.
//
// The polygon owns its points and edges. Not thread-safe; distinct polygons
// may be used from different threads (the shared standard output aside).
#pragma once

#include <krCoreLib/geometry/KRSweepElements.h>
#include <krCoreLib/geometry/KRSweepSplayTree.h>
#include <krCoreLib/math/CKRPoint2T.h>

#include <array>
#include <cstddef>
#include <cstdint>
#include <iosfwd>
#include <vector>

namespace krPolygonTriangulation {

class KRCORELIB_API Polygon {
public:
  // Three vertex ids, counter-clockwise.
  using Triangle = std::array<unsigned, 3>;
  // The vertex ids of a monotone piece in loop order (interior to the left).
  using Piece = std::vector<unsigned>;

  // The largest coordinate magnitude accepted: products and sums of
  // differences of such coordinates stay far from overflow in the exact
  // orientation test.
  static constexpr double MAX_COORDINATE = 1e150;
  // The most vertices a polygon holds, so that edge ids (vertices plus
  // diagonals) stay within unsigned.
  static constexpr std::size_t MAX_VERTICES = 0x3FFFFFFF;

  Polygon();
  ~Polygon();
  Polygon(const Polygon&) = delete;
  Polygon& operator=(const Polygon&) = delete;

  // Stores one contour: its points in order, or last to first with
  // `reverse` (which turns its orientation); with `closed` the last point
  // repeats the first and is skipped. Returns false, and stores nothing of
  // this contour, when a point repeats a stored point or an earlier point of
  // the contour (exact coordinates; 0 and -0 are equal), a coordinate is not
  // finite or exceeds MAX_COORDINATE, fewer than 3 points remain, the
  // vertex limit would be passed, or Finish() has run.
  bool AddContour(const std::vector<CKRPoint2T<double, float>>& points, bool reverse = false, bool closed = false);
  // True when a stored point has exactly these coordinates.
  bool is_exist(double x, double y) const;
  // Builds the edges and classifies the vertices; once.
  void Finish();

  // Pass 1, the sweep. Each pass runs the passes before it that have not
  // run; true on success (also when asked again after success).
  bool partition2Monotone();
  // Pass 2, the monotone pieces.
  bool searchMonotones();
  // All passes: the triangles. True on success, false on malformed input.
  bool triangulation();

  // The triangles in the order they were found; empty until triangulation()
  // succeeds.
  const std::vector<Triangle>& triangles() const noexcept { return m_Triangles; }
  const std::vector<Piece>& monotonePieces() const noexcept { return m_MonotonePieces; }
  const PointbaseMap& points() const noexcept { return m_Points; }
  const LinebaseMap& edges() const noexcept { return m_Edges; }
  // The bounds of the stored points (xmin 1e38 and xmax -1e38, likewise
  // for y, while there are none).
  double xmin() const noexcept { return m_XMin; }
  double xmax() const noexcept { return m_XMax; }
  double ymin() const noexcept { return m_YMin; }
  double ymax() const noexcept { return m_YMax; }

protected:
  // The step trace for developers: with a stream every step of the passes
  // writes a line to it (the caller keeps the stream alive); null, the
  // default, turns it off. The public interface never turns it on.
  void setDebugLog(std::ostream* log) noexcept;

private:
  enum class Stage { Adding, Finished, Partitioned, Collected, Triangulated, Failed };
  // A vertex of the piece being triangulated.
  struct PieceVertex {
    unsigned m_Id;
    bool m_bLeft;  // on the left chain: the loop goes down from it
  };

  // The predecessor of vertex i in its contour (its successor is the end
  // of edge i).
  unsigned prev(unsigned i) const noexcept;
  static double angleCosb(const Pointbase& a, const Pointbase& b, const Pointbase& c) noexcept;
  void addDiagonal(unsigned i, unsigned j);
  Linebase* selectNextEdge(Linebase* edge);
  bool triangulateMonotone(const Piece& piece);
  void addTriangle(unsigned v, unsigned upper, unsigned lower, bool chainOnLeft);
  void initializate();
  void handleStartVertex(const Pointbase& v);
  void handleEndVertex(const Pointbase& v);
  void handleSplitVertex(const Pointbase& v);
  void handleMergeVertex(const Pointbase& v);
  void handleRegularVertexUp(const Pointbase& v);
  void handleRegularVertexDown(const Pointbase& v);
  // The edge that ends at v leaves the status; a MERGE helper is joined first.
  void removePreviousEdge(const Pointbase& v);
  // The edge directly left of v takes v as its helper, after its helper is
  // joined to v (any helper with joinAnyHelper, else only a MERGE vertex);
  // false when no edge lies left of v.
  bool updateLeftEdge(const Pointbase& v, bool joinAnyHelper);
  void insertEdge(const Pointbase& v);
  bool isMergeVertex(unsigned id) const noexcept;
  // Before the sweep: every contour runs counter-clockwise where the other
  // contours wind 0 times around it and clockwise where they wind once,
  // and no contour runs through a vertex of another.
  bool contoursAgreeWithNesting() const;
  // The winding number of `contour` (an index into m_ContourSizes) around
  // p; false when p lies on it.
  bool windingAround(unsigned contour, const Pointbase& p, int& winding) const;
  // After pass 3: every triangle turns left and their areas sum to the
  // contours' signed area within the rounding bound.
  bool trianglesCoverContours() const;
  // Ends the passes: writes `message` (if any), empties the results.
  bool fail(const char* message);
  std::ostream* trace() const noexcept { return m_bDebug ? m_pLog : nullptr; }
  void rollbackPoints(std::size_t count);

  std::vector<Triangle> m_Triangles;
  // The event queue: the ids of the classified points, highest first.
  std::vector<unsigned> m_EventQueue;
  SplayTree m_Status;
  std::vector<Piece> m_MonotonePieces;
  // The edges that start at each vertex, for pass 2: vertex i's contour
  // edge (id i) until it is walked, and its diagonals, which are kept (a
  // diagonal is walked once each way). The diagonals of vertex i are
  // m_AdjacentDiagonals[m_AdjacentOffsets[i] .. m_AdjacentOffsets[i + 1]).
  std::vector<char> m_ContourEdgeWalked;
  std::vector<unsigned> m_AdjacentOffsets;
  std::vector<unsigned> m_AdjacentDiagonals;
  // The ids of the diagonals, ascending.
  std::vector<unsigned> m_Diagonals;
  bool m_bDebug = false;
  std::ostream* m_pLog = nullptr;
  unsigned m_LastEdgeId = 0;
  unsigned m_VertexCount = 0;
  unsigned m_ContourCount = 0;
  // The contour sizes; running totals after Finish().
  std::vector<unsigned> m_ContourSizes;
  PointbaseMap m_Points;
  LinebaseMap m_Edges;
  double m_XMin = 1e38;
  double m_XMax = -1e38;
  double m_YMin = 1e38;
  double m_YMax = -1e38;
  // Open-addressing table of the points by coordinates: per slot the high
  // half of the coordinates' hash above the point id (0: a free slot).
  std::vector<std::uint64_t> m_PointSlots;
  // Scratch of pass 3: a piece's vertices in sweep order, the sort's
  // buffer and the stack (indices into the queue).
  std::vector<PieceVertex> m_PieceQueue;
  std::vector<PieceVertex> m_PieceBuffer;
  std::vector<unsigned> m_Stack;
  Stage m_Stage = Stage::Adding;
};

}  // namespace krPolygonTriangulation
