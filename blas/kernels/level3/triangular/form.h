// TriForm: which of its cases a triangular product or solve is.
#pragma once

#include "blas/kernels/element.h"

namespace qtb::QTB_TIER {
namespace {

struct TriForm {
  bool left;   // the triangle stands to the left of B
  bool upper;  // the triangle that is stored
  Op op;
  bool unit;  // the diagonal is 1 and never read
};

template <class T>
TriForm read_form(const char *side, const char *uplo, const char *transa, const char *diag) {
  return {is_letter(*side, 'L'), is_letter(*uplo, 'U'), read_op<T>(transa), is_letter(*diag, 'U')};
}

// Whether op(T) is an upper triangle.
inline bool is_upper(const TriForm &form) { return form.upper == (form.op == Op::none); }

}  // namespace
}  // namespace qtb::QTB_TIER
