// The elements of the sweep-line triangulator (namespace
// krPolygonTriangulation): the vertex and edge classification Type, the
// vertex Pointbase, the edge Linebase and IdMap, the id-indexed store the
// triangulator keeps them in.
//
// Plain values and containers without locks: distinct objects may be used
// from different threads, one object from one thread at a time.
#pragma once

#include <krCoreLib/core/KRExport.h>

#include <cstddef>
#include <vector>

namespace krPolygonTriangulation {

// What a point or an edge is. Edges are CONTOUR (given) or DIAGONAL (added
// by the sweep); vertices are classified by their neighbours ("above" and
// "below" in the order of Pointbase).
enum Type {
  UNCLASSIFIED = 0,  // built without a type
  CONTOUR = 1,       // on an input contour, before classification
  DIAGONAL = 2,      // an edge the sweep added
  START = 3,         // both neighbours below, interior angle below pi
  END = 4,           // both neighbours above, interior angle below pi
  MERGE = 5,         // both neighbours above, interior angle above pi
  SPLIT = 6,         // both neighbours below, interior angle above pi
  REGULAR_UP = 7,    // previous neighbour below, next neighbour above
  REGULAR_DOWN = 8   // previous neighbour above, next neighbour below
};

// The name of a type as the step trace writes it ("START", ...); "" for the
// types that are not vertex classes and for values outside the enumeration.
KRCORELIB_API const char* TypeName(Type type) noexcept;

// A vertex: its id (1-based; 0 for a point that belongs to no polygon), its
// coordinates, its class and, in a monotone piece, whether it lies on the
// left chain.
struct KRCORELIB_API Pointbase {
  unsigned m_Id = 0;
  double m_X = 0;
  double m_Y = 0;
  Type m_Type = UNCLASSIFIED;
  bool m_bLeft = false;

  Pointbase() noexcept = default;
  Pointbase(double x, double y) noexcept : m_X(x), m_Y(y) {}
  Pointbase(unsigned id, double x, double y) noexcept : m_Id(id), m_X(x), m_Y(y) {}
  Pointbase(double x, double y, Type type) noexcept : m_X(x), m_Y(y), m_Type(type) {}
  Pointbase(unsigned id, double x, double y, Type type) noexcept : m_Id(id), m_X(x), m_Y(y), m_Type(type) {}
  Pointbase(const Pointbase& other) noexcept = default;
  Pointbase& operator=(const Pointbase& other) noexcept = default;

  // The sweep order: this point is above `other` when its y is larger, or
  // the y values are equal and its x is smaller. Ids and types play no part;
  // with a NaN coordinate neither point is above the other.
  bool IsAbove(const Pointbase& other) const noexcept {
    return m_Y > other.m_Y || (m_Y == other.m_Y && m_X < other.m_X);
  }
};

// An edge: from its start point to its end point (not owned), its type, the
// key that orders it in the sweep status (its x at the sweep height) and
// the id of its helper vertex (0 until one is set).
class KRCORELIB_API Linebase {
public:
  Linebase() noexcept = default;
  // Null end points are allowed only for an edge that is never keyed.
  Linebase(unsigned id, Pointbase* start, Pointbase* end, Type type) noexcept
      : m_pEndPoints{start, end}, m_Id(id), m_Type(type) {}
  Linebase(const Linebase& other) noexcept = default;
  Linebase& operator=(const Linebase& other) noexcept = default;

  unsigned id() const noexcept { return m_Id; }
  Type type() const noexcept { return m_Type; }
  // The start point for 0, the end point for 1 (any other index: null).
  Pointbase* endPoint(int i) const noexcept { return i == 0 || i == 1 ? m_pEndPoints[i] : nullptr; }

  double keyValue() const noexcept { return m_Key; }
  // The key at sweep height y: x0 + (x1 - x0)(y - y0) / (y1 - y0), or the
  // smaller x for a horizontal edge.
  void setKeyValue(double y) noexcept;
  void increaseKeyValue(double d) noexcept { m_Key += d; }
  // Exchanges the end points.
  void reverse() noexcept;

  unsigned helper() const noexcept { return m_Helper; }
  void setHelper(unsigned id) noexcept { m_Helper = id; }

private:
  Pointbase* m_pEndPoints[2] = {nullptr, nullptr};
  double m_Key = 0;
  unsigned m_Id = 0;
  unsigned m_Helper = 0;
  Type m_Type = UNCLASSIFIED;
};

// Elements numbered 1, 2, 3, ... in the order they were added: the point
// and edge maps of the triangulator, stored densely. Pointers to elements
// stay valid while the map grows within its reserved capacity (the
// triangulator reserves what it will need before it hands pointers out).
template <class T>
class IdMap {
public:
  using const_iterator = typename std::vector<T>::const_iterator;

  std::size_t size() const noexcept { return m_Items.size(); }
  bool empty() const noexcept { return m_Items.empty(); }
  // The element with this id, or null for 0 and ids beyond size().
  const T* find(unsigned id) const noexcept { return id >= 1 && id <= m_Items.size() ? &m_Items[id - 1] : nullptr; }
  T* find(unsigned id) noexcept { return id >= 1 && id <= m_Items.size() ? &m_Items[id - 1] : nullptr; }
  // Unchecked: id must be 1 to size().
  const T& operator[](unsigned id) const noexcept { return m_Items[id - 1]; }
  T& operator[](unsigned id) noexcept { return m_Items[id - 1]; }
  // In id order.
  const_iterator begin() const noexcept { return m_Items.begin(); }
  const_iterator end() const noexcept { return m_Items.end(); }

  std::size_t capacity() const noexcept { return m_Items.capacity(); }
  void Reserve(std::size_t count) { m_Items.reserve(count); }
  // Adds an element, which gets the id size() + 1.
  T& PushBack(const T& item) { return m_Items.emplace_back(item); }
  void PopBack() noexcept { m_Items.pop_back(); }

private:
  std::vector<T> m_Items;
};

using PointbaseMap = IdMap<Pointbase>;
using LinebaseMap = IdMap<Linebase>;

}  // namespace krPolygonTriangulation
