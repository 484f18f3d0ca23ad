// Sorting vertices into sweep order (highest first) by merging runs.
//
// A polygon's vertices in loop order fall into runs that rise or fall in the
// sweep order: three for a convex or y-monotone loop, more for a winding
// one. Reversing the rising runs and merging pairs of runs costs
// O(n log r) for r runs: linear for the loops the sweep meets most (a
// monotone piece always has at most three), never worse than a general sort.
// Equal elements (possible only in pieces of invalid input) keep an order
// that depends on the input, as in any sort.
#pragma once

#include <algorithm>
#include <cstddef>
#include <vector>

namespace krPolygonTriangulation {

// Sorts `items` so that each comes before those it is above (`above(a, b)`:
// a strict order). `buffer` is scratch space; its contents are lost.
template <class T, class Above>
void SortFromHighest(std::vector<T>& items, std::vector<T>& buffer, Above above) {
  const std::size_t n = items.size();
  std::vector<std::size_t> bounds{0};
  for (std::size_t i = 0; i < n;) {
    std::size_t j = i + 1;
    if (j < n && above(items[j], items[i])) {
      while (j + 1 < n && above(items[j + 1], items[j]))
        ++j;
      std::reverse(items.begin() + std::ptrdiff_t(i), items.begin() + std::ptrdiff_t(j + 1));
      ++j;
    } else {
      while (j < n && above(items[j - 1], items[j]))
        ++j;
    }
    bounds.push_back(j);
    i = j;
  }
  buffer.resize(n);
  std::vector<std::size_t> merged;
  while (bounds.size() > 2) {
    merged.assign(1, 0);
    const std::size_t runs = bounds.size() - 1;
    const auto at = [](std::vector<T>& v, std::size_t k) { return v.begin() + std::ptrdiff_t(k); };
    for (std::size_t k = 0; k + 1 < runs; k += 2) {
      std::merge(at(items, bounds[k]), at(items, bounds[k + 1]), at(items, bounds[k + 1]), at(items, bounds[k + 2]),
                 at(buffer, bounds[k]), above);
      merged.push_back(bounds[k + 2]);
    }
    if (runs % 2 == 1) {
      std::copy(at(items, bounds[runs - 1]), items.end(), at(buffer, bounds[runs - 1]));
      merged.push_back(n);
    }
    items.swap(buffer);
    bounds.swap(merged);
  }
}

}  // namespace krPolygonTriangulation
