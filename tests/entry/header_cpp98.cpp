// The public header in the oldest C++ that it is for. Compiled as that, every warning an error.
#include "include/qtb.h"

#if __cplusplus >= 201103L
#error "compiled as a later C++"
#endif

namespace {

// Both cases of a name are of one type.
template <class Function>
int same(Function *, Function *) {
  return 1;
}

}  // namespace

int qtb_header_in_cpp98();
int qtb_header_in_cpp98() {
  const QtbDoubleComplex element(1, 2);
  return same(&zdotc, &ZDOTC) + same(&dgemm, &DGEMM) + same(&xerbla, &XERBLA) + (element.real() == 1);
}
