#!/bin/sh
# tier_objects_self_test.sh tier...: shows that tier_objects_test.sh passes a clean object and finds each kind of flaw.
# Every case compiles a few lines as the object of a tier. The arguments are all tiers, lowest first.
set -eu

tiers=$*

check=$(dirname "$0")/tier_objects_test.sh
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
failures=0

# compile name flags < source
compile() {
  # shellcheck disable=SC2086 # a list of flags
  "${CXX:-c++}" -std=c++20 -O2 -fPIC -march=x86-64 $2 -x c++ -c - -o "$folder/$1.o"
  echo "$folder/$1.o" > "$folder/$1.list"
}

# expect tier name finding: the check of the object finds this; an empty finding says that it passes.
expect() {
  # shellcheck disable=SC2086 # a list of tiers
  if output=$("$check" "$1" "$folder/$2.list" $tiers 2>&1); then
    found=
  else
    found=$output
  fi
  case $found in
    "") [ -z "$3" ] && result=ok || result="passed" ;;
    *"$3"*) [ -n "$3" ] && result=ok || result="rejected: $found" ;;
    *) result="other finding: $found" ;;
  esac
  echo "$1 $2: $result"
  [ "$result" = ok ] || failures=$((failures + 1))
}

compile clean "" <<'END'
extern "C" void *memcpy(void *, const void *, unsigned long);
extern "C" double qtb_blas_xddot(const double *);
extern "C" double qtb_blas_def_xclean(double *x, const double *y) {
  memcpy(x, y, 4000);
  for (int i = 0; i < 500; i++) x[i] = x[i] * y[i] + y[0];
  return qtb_blas_xddot(x);
}
END
expect def clean ""

compile stray "" <<'END'
extern "C" void stray(double *x) { x[0] += x[1]; }
END
expect def stray "global symbol stray"

compile named "" <<'END'
extern "C" void qtb_blas_ssse3_xnamed(double *x) { x[0] += x[1]; }
END
expect def named "global symbol qtb_blas_ssse3_xnamed"
expect avx named "global symbol qtb_blas_ssse3_xnamed"

compile kernel "" <<'END'
extern "C" void qtb_blas_sse42_zgemm_kernel_cu(double *x) { x[0] += x[1]; }
extern "C" void qtb_blas_sse42_sgemm_nobcopy_kernel(float *x) { x[0] += x[1]; }
extern "C" void qtb_blas_sse42_cgemv_t_odd(float *x) { x[0] += x[1]; }
extern "C" void qtb_blas_sse42_zgemv_c(double *x) { x[0] += x[1]; }
extern "C" void qtb_blas_sse42_strsv_diag_unn(float *x) { x[0] += x[1]; }
extern "C" void qtb_blas_sse42_ztrmv_diag(double *x) { x[0] += x[1]; }
END
expect sse42 kernel ""

compile misnamed "" <<'END'
extern "C" void qtb_blas_sse42_dgemv_n_third(double *x) { x[0] += x[1]; }
END
expect sse42 misnamed "global symbol qtb_blas_sse42_dgemv_n_third"
expect avx kernel "global symbol qtb_blas_sse42_zgemm_kernel_cu"

compile shared "" <<'END'
extern "C" void qtb_blas_sse42_xshared(double *x) { x[0] += x[1]; }
extern "C" void qtb_blas_avx_xshared(double *x) __attribute__((alias("qtb_blas_sse42_xshared")));
END
expect sse42 shared ""

compile weak "" <<'END'
inline int shared(int n) { return n * n; }
extern "C" auto qtb_blas_def_xweak() { return &shared; }
END
expect def weak "weak symbol _Z6sharedi"

compile unique "" <<'END'
template <class T> struct Counter { static inline T count = 1; };
extern "C" int *qtb_blas_def_xunique() { return &Counter<int>::count; }
END
expect def unique "unique symbol"

compile initialiser "" <<'END'
extern "C" int qtb_serv_value();
static const int value = qtb_serv_value();
extern "C" int qtb_blas_def_xinitialiser() { return value; }
END
expect def initialiser "static initialiser in section .init_array"

compile foreign "" <<'END'
extern "C" int puts(const char *);
extern "C" void qtb_blas_def_xforeign() { puts("kernel"); }
END
expect def foreign "undefined symbol puts"

compile other_tier "" <<'END'
extern "C" void qtb_blas_avx_xdaxpy();
extern "C" void qtb_blas_def_xother() { qtb_blas_avx_xdaxpy(); }
END
expect def other_tier "reference to another tier: qtb_blas_avx_xdaxpy"

# The same source at each level passes in its own tier and from there on, and not below.
for level in sse3 ssse3 sse42; do
  case $level in
    sse3) flags=-msse3 header=pmmintrin.h value='_mm_hadd_pd(v, v)' word=haddpd below=def ;;
    ssse3) flags=-mssse3 header=tmmintrin.h word=palignr below=sse3
      value='(__m128d)_mm_alignr_epi8((__m128i)v, (__m128i)v, 4)' ;;
    sse42) flags=-msse4.2 header=smmintrin.h value='_mm_dp_pd(v, v, 49)' word=dppd below=ssse3 ;;
  esac
  compile "$level" "$flags" <<END
#include <$header>
extern "C" __m128d qtb_blas_${level}_xlevel(__m128d v) { return $value; }
END
  expect $level $level ""
  expect "$below" $level "not in the lists of $below, in qtb_blas_${level}_xlevel: $word"
done

compile popcount "-msse4.2 -mpopcnt" <<'END'
extern "C" int qtb_blas_sse42_xpopcount(unsigned n) { return __builtin_popcount(n); }
END
expect sse42 popcount "not in the lists of sse42, in qtb_blas_sse42_xpopcount: popcnt"

compile wide "-mavx" <<'END'
extern "C" void qtb_blas_avx_xwide(double *x) {
  for (int i = 0; i < 64; i++) x[i] += 1;
  asm volatile("vaddpd %ymm1, %ymm2, %ymm3");
}
END
expect avx wide "wider encoding in qtb_blas_avx_xwide: v"

compile narrow "-mavx" <<'END'
extern "C" double qtb_blas_sse42_xnarrow(double x, double y) { return x * y; }
END
expect sse42 narrow "wider encoding in qtb_blas_sse42_xnarrow: vmulsd"

compile mmx "" <<'END'
extern "C" long qtb_blas_def_xmmx(long n) {
  asm("movq %0, %%mm0\n\tpaddd %%mm0, %%mm0\n\tmovq %%mm0, %0" : "+r"(n));
  return n;
}
END
expect def mmx "MMX register in qtb_blas_def_xmmx"

compile extended "" <<'END'
extern "C" void qtb_blas_def_xextended(long double *x) { *x *= 2; }
END
expect def extended "not in the lists of def, in qtb_blas_def_xextended: fld"

compile empty "" <<'END'
END
expect def empty "nothing to read"

echo "$folder/absent.o" > "$folder/absent.list"
expect def absent "read 0 objects of 1"

# An object that may be wide passes with AVX, and not with a later set.
mkdir -p "$folder/permissive/mnemonics"
cp "$check" "$folder/permissive"
cp "$(dirname "$0")"/mnemonics/*.txt "$folder/permissive/mnemonics"
echo 'wide fused narrowed' > "$folder/permissive/mnemonics/vex_objects.txt"
check=$folder/permissive/tier_objects_test.sh
expect avx wide ""
compile fused "-mfma -ffp-contract=fast" <<'END'
extern "C" double qtb_blas_avx_xfused(double x, double y, double z) { return x * y + z; }
END
expect avx fused "above the tier in qtb_blas_avx_xfused: vfm"
compile narrowed "" <<'END'
extern "C" void qtb_blas_avx_xnarrowed(double *x) { x[0] += x[1]; }
END
expect avx narrowed "no instruction of the wider encoding"

# A tier without a list of instructions is told to have one, and an unlisted one is not taken for another.
expect sse5 clean "sse5 is not among the tiers"
tiers="$tiers sse5"
expect sse5 clean "into tests/product/mnemonics/sse5.txt"

[ $failures -eq 0 ]
