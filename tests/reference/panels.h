// The packed panels of GEMM, read back: the oracle of the copy routines, sharing nothing with them.
//
// A panel is a sequence of micro-panels of mr rows or nr columns, ldp elements apart, k the slow index: element (i, l)
// of w rows at i + l*w, (l, j) of w columns at l*w + j. The columns that a full micro-panel leaves over form narrower
// ones, each at its own step. The depth is filled up with zeros to a multiple of ku.
#pragma once

#include <vector>

#include "blas/types.h"

namespace qtb::reference {

struct PanelTile {
  QtbInt mr, nr, ku;
};

inline QtbInt padded_depth(const PanelTile &tile, QtbInt k) { return (k + tile.ku - 1) / tile.ku * tile.ku; }

// The widths of the micro-panels of n columns of B. A tile of 12 columns leaves out fewer than 4.
inline std::vector<QtbInt> column_widths(const PanelTile &tile, QtbInt n) {
  std::vector<QtbInt> widths(static_cast<std::size_t>(n / tile.nr), tile.nr);
  QtbInt rest = n % tile.nr;
  for (const QtbInt width : {QtbInt{8}, QtbInt{4}})
    if (tile.nr > width && rest >= width) {
      widths.push_back(width);
      rest -= width;
    }
  if (rest > 0 && tile.nr <= 8) widths.push_back(rest);
  return widths;
}

// What a panel says of one row or column.
template <class T>
struct PanelLine {
  const T *first;  // its element at depth 0
  QtbInt width;    // the distance to the next depth
  const T &at(QtbInt l) const { return first[l * width]; }
};

template <class T>
std::vector<PanelLine<T>> unpack_a(const PanelTile &tile, QtbInt m, const T *panels, QtbInt ldp) {
  std::vector<PanelLine<T>> rows;
  for (QtbInt i = 0; i < m / tile.mr * tile.mr; i++)
    rows.push_back({panels + i / tile.mr * ldp + i % tile.mr, tile.mr});
  return rows;
}

template <class T>
std::vector<PanelLine<T>> unpack_b(const PanelTile &tile, QtbInt n, const T *panels, QtbInt ldp) {
  std::vector<PanelLine<T>> columns;
  for (const QtbInt width : column_widths(tile, n)) {
    for (QtbInt j = 0; j < width; j++) columns.push_back({panels + j, width});
    panels += ldp;
  }
  return columns;
}

}  // namespace qtb::reference
