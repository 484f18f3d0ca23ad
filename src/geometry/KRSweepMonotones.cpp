// Polygon: the monotone pieces (pass 2) and their triangles (pass 3).
#include <krCoreLib/geometry/KRSweepPolygon.h>

#include <krCoreLib/geometry/KRAdaptiveOrient2d.h>

#include "KRSweepOrder.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdio>
#include <ostream>

namespace {

using krPolygonTriangulation::Pointbase;

// The diagnostic of a loop that cannot be closed, on standard output.
constexpr char kMessageOpenLoop[] =
    "Please check your input polygon:\n"
    "1)orientations?\n2)with duplicated points?\n3)is a simple one?\n"
    "triangulation stopped.\n";

double Orientation(const Pointbase& a, const Pointbase& b, const Pointbase& c) {
  return krPolygonTriangulation::orient2d(a.m_X, a.m_Y, b.m_X, b.m_Y, c.m_X, c.m_Y);
}

}  // namespace

namespace krPolygonTriangulation {

// ---- pass 2: the monotone pieces ----

double Polygon::angleCosb(const Pointbase& a, const Pointbase& b, const Pointbase& c) noexcept {
  const double ux = a.m_X - b.m_X;
  const double uy = a.m_Y - b.m_Y;
  const double vx = c.m_X - b.m_X;
  const double vy = c.m_Y - b.m_Y;
  return (ux * vx + uy * vy) / (std::sqrt(ux * ux + uy * uy) * std::sqrt(vx * vx + vy * vy));
}

bool Polygon::searchMonotones() {
  if (m_Stage == Stage::Finished && !partition2Monotone())
    return false;
  if (m_Stage == Stage::Adding || m_Stage == Stage::Failed)
    return false;
  if (m_Stage != Stage::Partitioned)
    return true;

  // The diagonals of each vertex, ascending by id (they were made in id
  // order), as the ranges of one array.
  const unsigned n = m_VertexCount;
  m_AdjacentOffsets.assign(n + 2, 0);
  for (const unsigned id : m_Diagonals) {
    ++m_AdjacentOffsets[m_Edges[id].endPoint(0)->m_Id + 1];
    ++m_AdjacentOffsets[m_Edges[id].endPoint(1)->m_Id + 1];
  }
  for (unsigned i = 1; i <= n + 1; ++i)
    m_AdjacentOffsets[i] += m_AdjacentOffsets[i - 1];
  m_AdjacentDiagonals.resize(2 * m_Diagonals.size());
  {
    std::vector<unsigned> fill(m_AdjacentOffsets.begin(), m_AdjacentOffsets.end() - 1);
    for (const unsigned id : m_Diagonals) {
      m_AdjacentDiagonals[fill[m_Edges[id].endPoint(0)->m_Id]++] = id;
      m_AdjacentDiagonals[fill[m_Edges[id].endPoint(1)->m_Id]++] = id;
    }
  }
  m_ContourEdgeWalked.assign(n + 1, 0);

  // A valid polygon walks each contour edge once and each diagonal once each
  // way; a walk beyond that goes round in circles on invalid input.
  const std::size_t budget = n + 2 * m_Diagonals.size();
  std::size_t steps = 0;
  // Contour edges leave the walk in any order; the lowest id not yet walked
  // starts the next piece.
  unsigned lowest = 1;
  for (;;) {
    while (lowest <= n && m_ContourEdgeWalked[lowest])
      ++lowest;
    if (lowest > n)
      break;
    Linebase* edge = &m_Edges[lowest];
    const unsigned start = edge->endPoint(0)->m_Id;
    Piece piece{start};
    if (std::ostream* out = trace())
      *out << "Searching for loops:\nvertex index:" << start << "\n";
    for (;;) {
      if (++steps > budget)
        return fail(kMessageOpenLoop);
      if (edge->type() != DIAGONAL)
        m_ContourEdgeWalked[edge->id()] = 1;
      const unsigned end = edge->endPoint(1)->m_Id;
      if (end == start)
        break;
      piece.push_back(end);
      if (std::ostream* out = trace())
        *out << "vertex index:" << end << "\n";
      Linebase* following = selectNextEdge(edge);
      if (following == nullptr)
        return fail(kMessageOpenLoop);
      if (following->endPoint(0)->m_Id != end)
        following->reverse();
      edge = following;
    }
    if (std::ostream* out = trace())
      *out << "\nloop closed!\n\n";
    m_MonotonePieces.push_back(std::move(piece));
  }
  m_ContourEdgeWalked = std::vector<char>();
  m_AdjacentOffsets = std::vector<unsigned>();
  m_AdjacentDiagonals = std::vector<unsigned>();
  m_Stage = Stage::Collected;
  return true;
}

Linebase* Polygon::selectNextEdge(Linebase* edge) {
  const Pointbase& a = *edge->endPoint(0);
  const Pointbase& b = *edge->endPoint(1);
  const unsigned vertex = b.m_Id;
  // The candidates in id order, each turned to start at b: b's contour edge
  // if not yet walked, then its diagonals; never the edge itself. A vertex
  // has at most four diagonals: two made at its own event and one for each
  // of the (at most two) edges it became the helper of.
  std::array<Linebase*, 8> candidates{};
  std::size_t count = 0;
  const auto consider = [&](unsigned id) {
    if (id == edge->id() || count == candidates.size())
      return;
    Linebase* c = &m_Edges[id];
    if (c->endPoint(0)->m_Id != vertex)
      c->reverse();
    candidates[count++] = c;
  };
  if (!m_ContourEdgeWalked[vertex])
    consider(vertex);
  for (unsigned k = m_AdjacentOffsets[vertex]; k < m_AdjacentOffsets[vertex + 1]; ++k)
    consider(m_AdjacentDiagonals[k]);
  if (count <= 1)
    return candidates[0];

  // The tightest left turn (largest cosine) wins; failing any left turn, the
  // widest other turn (smallest cosine). Cosines lie in [-1, 1].
  Linebase* leftTurn = nullptr;
  Linebase* other = nullptr;
  double largest = -2;
  double smallest = 2;
  for (std::size_t k = 0; k < count; ++k) {
    const Pointbase& far = *candidates[k]->endPoint(1);
    const double area = Orientation(a, b, far);
    const double cosine = angleCosb(a, b, far);
    if (area > 0 && cosine > largest) {
      leftTurn = candidates[k];
      largest = cosine;
    } else if (cosine < smallest) {
      other = candidates[k];
      smallest = cosine;
    }
  }
  return leftTurn != nullptr ? leftTurn : other;
}

// ---- pass 3: the triangles ----

void Polygon::addTriangle(unsigned v, unsigned upper, unsigned lower, bool chainOnLeft) {
  // v lies below the other two. Seen from v, a pair on the left chain runs
  // counter-clockwise from the upper vertex down, a pair on the right chain
  // from the lower one up.
  if (chainOnLeft)
    m_Triangles.push_back({v, upper, lower});
  else
    m_Triangles.push_back({v, lower, upper});
  if (std::ostream* out = trace()) {
    const Triangle& t = m_Triangles.back();
    *out << "Add triangle:" << t[0] << " " << t[1] << " " << t[2] << "\n";
  }
}

bool Polygon::triangulateMonotone(const Piece& piece) {
  const std::size_t k = piece.size();
  if (k < 3)
    return false;
  // A vertex lies on the left chain when the loop goes down from it.
  m_PieceQueue.clear();
  for (std::size_t j = 0; j < k; ++j) {
    const unsigned id = piece[j];
    m_PieceQueue.push_back({id, m_Points[id].IsAbove(m_Points[piece[j + 1 == k ? 0 : j + 1]])});
  }
  SortFromHighest(m_PieceQueue, m_PieceBuffer, [this](const PieceVertex& a, const PieceVertex& b) {
    return m_Points[a.m_Id].IsAbove(m_Points[b.m_Id]);
  });

  // The stack holds indices into the queue, its top last.
  const auto id = [this](unsigned index) { return m_PieceQueue[index].m_Id; };
  const auto onLeft = [this](unsigned index) { return m_PieceQueue[index].m_bLeft; };
  m_Stack.assign({0, 1});
  for (unsigned j = 2; j + 1 < k; ++j) {
    if (std::ostream* out = trace())
      *out << "current top queue vertex index=" << id(j) << "\n";
    const bool topOnLeft = onLeft(m_Stack.back());
    if (onLeft(j) != topOnLeft) {
      // v sees the whole stack across the piece.
      for (std::size_t s = 0; s + 1 < m_Stack.size(); ++s)
        addTriangle(id(j), id(m_Stack[s]), id(m_Stack[s + 1]), topOnLeft);
      const unsigned previousTop = m_Stack.back();
      m_Stack.assign({previousTop, j});
      continue;
    }
    // Same chain: cut off triangles while the chain turns towards the
    // interior at the top vertex.
    const Pointbase& v = m_Points[id(j)];
    while (m_Stack.size() >= 2) {
      const unsigned first = m_Stack.back();
      const unsigned second = m_Stack[m_Stack.size() - 2];
      if (std::ostream* out = trace())
        *out << "Current top stack vertex index=" << id(first) << "\n"
             << "Second stack vertex index=" << id(second) << "\n";
      const double turn = Orientation(m_Points[id(second)], m_Points[id(first)], v);
      if (onLeft(first) ? !(turn > 0) : !(turn < 0))
        break;
      addTriangle(id(j), id(second), id(first), onLeft(first));
      m_Stack.pop_back();
    }
    m_Stack.push_back(j);
  }
  const bool topOnLeft = onLeft(m_Stack.back());
  for (std::size_t s = 0; s + 1 < m_Stack.size(); ++s)
    addTriangle(id(unsigned(k - 1)), id(m_Stack[s]), id(m_Stack[s + 1]), topOnLeft);
  return true;
}

bool Polygon::triangulation() {
  if (m_Stage == Stage::Triangulated)
    return true;
  if (!searchMonotones())
    return false;
  std::size_t count = 0;
  for (const Piece& piece : m_MonotonePieces)
    count += piece.size() >= 2 ? piece.size() - 2 : 0;
  m_Triangles.reserve(count);
  for (const Piece& piece : m_MonotonePieces)
    if (!triangulateMonotone(piece))
      return fail(nullptr);
  m_PieceQueue = std::vector<PieceVertex>();
  m_PieceBuffer = std::vector<PieceVertex>();
  m_Stack = std::vector<unsigned>();
  if (!trianglesCoverContours())
    return fail(kMessageOpenLoop);
  std::printf("Total number of triangles:%zu\n", m_Triangles.size());
  std::fflush(stdout);
  m_Stage = Stage::Triangulated;
  return true;
}

}  // namespace krPolygonTriangulation
