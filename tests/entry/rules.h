// The rules for arguments of Levels 2 and 3, written down a second time from the published definitions, as text.
//
// parameters: the published order. options: letters of each option, in the order of the parameters. dimensions: what
// may not be negative. others: leading dimensions with their least value and increments that may not be zero, in the
// order of the parameters. "side=L?m:n" is m where side is L in either case, n otherwise; max(1, v) where a least value
// is v alone.
#pragma once

namespace qtb::test {

struct FamilyRules {
  const char *routines, *parameters, *options, *dimensions, *others;
};

inline constexpr FamilyRules family_rules[] = {
    {"sgemm dgemm cgemm zgemm", "transa transb m n k alpha a lda b ldb beta c ldc", "transa:NCT transb:NCT", "m n k",
     "lda>=max1(transa=N?m:k) ldb>=max1(transb=N?k:n) ldc>=max1(m)"},
    {"ssymm dsymm csymm zsymm chemm zhemm", "side uplo m n alpha a lda b ldb beta c ldc", "side:LR uplo:UL", "m n",
     "lda>=max1(side=L?m:n) ldb>=max1(m) ldc>=max1(m)"},
    {"ssyrk dsyrk", "uplo trans n k alpha a lda beta c ldc", "uplo:UL trans:NTC", "n k",
     "lda>=max1(trans=N?n:k) ldc>=max1(n)"},
    {"csyrk zsyrk", "uplo trans n k alpha a lda beta c ldc", "uplo:UL trans:NT", "n k",
     "lda>=max1(trans=N?n:k) ldc>=max1(n)"},
    {"cherk zherk", "uplo trans n k alpha a lda beta c ldc", "uplo:UL trans:NC", "n k",
     "lda>=max1(trans=N?n:k) ldc>=max1(n)"},
    {"ssyr2k dsyr2k", "uplo trans n k alpha a lda b ldb beta c ldc", "uplo:UL trans:NTC", "n k",
     "lda>=max1(trans=N?n:k) ldb>=max1(trans=N?n:k) ldc>=max1(n)"},
    {"csyr2k zsyr2k", "uplo trans n k alpha a lda b ldb beta c ldc", "uplo:UL trans:NT", "n k",
     "lda>=max1(trans=N?n:k) ldb>=max1(trans=N?n:k) ldc>=max1(n)"},
    {"cher2k zher2k", "uplo trans n k alpha a lda b ldb beta c ldc", "uplo:UL trans:NC", "n k",
     "lda>=max1(trans=N?n:k) ldb>=max1(trans=N?n:k) ldc>=max1(n)"},
    {"strmm dtrmm ctrmm ztrmm strsm dtrsm ctrsm ztrsm", "side uplo transa diag m n alpha a lda b ldb",
     "side:LR uplo:UL transa:NTC diag:UN", "m n", "lda>=max1(side=L?m:n) ldb>=max1(m)"},
    {"sgemv dgemv cgemv zgemv", "trans m n alpha a lda x incx beta y incy", "trans:NTC", "m n",
     "lda>=max1(m) incx!=0 incy!=0"},
    {"sgbmv dgbmv cgbmv zgbmv", "trans m n kl ku alpha a lda x incx beta y incy", "trans:NTC", "m n kl ku",
     "lda>=kl+ku+1 incx!=0 incy!=0"},
    {"sger dger cgerc cgeru zgerc zgeru", "m n alpha x incx y incy a lda", "", "m n", "incx!=0 incy!=0 lda>=max1(m)"},
    {"ssymv dsymv chemv zhemv", "uplo n alpha a lda x incx beta y incy", "uplo:UL", "n",
     "lda>=max1(n) incx!=0 incy!=0"},
    {"ssbmv dsbmv chbmv zhbmv", "uplo n k alpha a lda x incx beta y incy", "uplo:UL", "n k",
     "lda>=k+1 incx!=0 incy!=0"},
    {"sspmv dspmv chpmv zhpmv", "uplo n alpha ap x incx beta y incy", "uplo:UL", "n", "incx!=0 incy!=0"},
    {"ssyr dsyr cher zher", "uplo n alpha x incx a lda", "uplo:UL", "n", "incx!=0 lda>=max1(n)"},
    {"sspr dspr chpr zhpr", "uplo n alpha x incx ap", "uplo:UL", "n", "incx!=0"},
    {"ssyr2 dsyr2 cher2 zher2", "uplo n alpha x incx y incy a lda", "uplo:UL", "n", "incx!=0 incy!=0 lda>=max1(n)"},
    {"sspr2 dspr2 chpr2 zhpr2", "uplo n alpha x incx y incy ap", "uplo:UL", "n", "incx!=0 incy!=0"},
    {"strmv dtrmv ctrmv ztrmv strsv dtrsv ctrsv ztrsv", "uplo trans diag n a lda x incx", "uplo:UL trans:NTC diag:UN",
     "n", "lda>=max1(n) incx!=0"},
    {"stbmv dtbmv ctbmv ztbmv stbsv dtbsv ctbsv ztbsv", "uplo trans diag n k a lda x incx", "uplo:UL trans:NTC diag:UN",
     "n k", "lda>=k+1 incx!=0"},
    {"stpmv dtpmv ctpmv ztpmv stpsv dtpsv ctpsv ztpsv", "uplo trans diag n ap x incx", "uplo:UL trans:NTC diag:UN", "n",
     "incx!=0"},
};

}  // namespace qtb::test
