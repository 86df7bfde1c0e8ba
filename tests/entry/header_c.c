/* The public header in C: it is self-contained, and its complex elements are C's own. */
#include "include/qtb.h"

_Static_assert(sizeof(QtbInt) == 8, "integers have 64 bits");
_Static_assert(_Generic((QtbFloatComplex *)0, float _Complex * : 1, default : 0), "single complex is C's own");
_Static_assert(_Generic((QtbDoubleComplex *)0, double _Complex * : 1, default : 0), "double complex is C's own");
_Static_assert(_Generic(&zdotc,
                        QtbDoubleComplex *(*)(QtbDoubleComplex *, const QtbInt *, const QtbDoubleComplex *,
                                              const QtbInt *, const QtbDoubleComplex *, const QtbInt *) : 1,
                        default : 0),
               "a complex result goes through the first argument");
_Static_assert(_Generic(&ZDOTC, __typeof__(&zdotc) : 1, default : 0), "both cases are one routine");
