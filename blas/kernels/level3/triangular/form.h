// TriForm: which of its cases a triangular product or solve is.
#pragma once

#include "blas/kernels/level3/gemm/tier_gemm.h"

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

template <class T>
using TriProcedure = QTB_FUNCTION_TYPE(trmm, T);

// A procedure of this shape for a form.
template <class T>
void call_with_form(TriProcedure<T> *procedure, const TriForm &form, QtbInt m, QtbInt n, T alpha, const T *a,
                    QtbInt lda, T *b, QtbInt ldb) {
  procedure(form.left ? "L" : "R", form.upper ? "U" : "L", letter(form.op), form.unit ? "U" : "N", &m, &n, &alpha, a,
            &lda, b, &ldb);
}

}  // namespace
}  // namespace qtb::QTB_TIER
