// Vec<T>: a vector of one of the four element types, vector_bytes wide, at Levels 1 and 2.
//
// A thin layer over the intrinsics that all tiers have, so that a kernel is one template over the element type. A
// vector of complex elements is a vector of their parts in order of address. What a tier adds (duplicated parts,
// add-subtract, the byte-align instruction) stands under the instruction set that has it.
#pragma once

#include <emmintrin.h>
#if defined(__SSE3__)
#include <pmmintrin.h>
#endif
#if defined(__SSSE3__)
#include <tmmintrin.h>
#endif

#include "blas/kernels/kernel.h"

namespace qtb::QTB_TIER {
namespace {

// The width of a vector, and the boundary that aligned loads ask for: one for all tiers. Kernels take it, and lanes
// below, from here. A tier of another width states it here, and adds to VecOf and to the procedures on vectors; what it
// leaves out does not compile.
constexpr QtbInt vector_bytes = 16;

// The vector of an element type at a width in bytes.
template <class T, QtbInt bytes>
struct VecOf;
template <>
struct VecOf<float, 16> {
  using Type = __m128;
};
template <>
struct VecOf<double, 16> {
  using Type = __m128d;
};
template <class R, QtbInt bytes>
struct VecOf<Complex<R>, bytes> : VecOf<R, bytes> {};
template <class T, QtbInt bytes>
struct VecOf<const T, bytes> : VecOf<T, bytes> {};
template <class T>
using Vec = typename VecOf<T, vector_bytes>::Type;

// Elements of T in a vector.
template <class T>
constexpr QtbInt lanes = vector_bytes / static_cast<QtbInt>(sizeof(T));

// Parts of T in a vector.
template <class T>
constexpr QtbInt parts_per_vector = lanes<T>;
template <class R>
constexpr QtbInt parts_per_vector<Complex<R>> = lanes<R>;
template <class R>
constexpr QtbInt parts_per_vector<const Complex<R>> = lanes<R>;

inline __m128 load_aligned(const float *p) { return _mm_load_ps(p); }
inline __m128d load_aligned(const double *p) { return _mm_load_pd(p); }
inline __m128 load_unaligned(const float *p) { return _mm_loadu_ps(p); }
inline __m128d load_unaligned(const double *p) { return _mm_loadu_pd(p); }
inline void store_aligned(float *p, __m128 v) { _mm_store_ps(p, v); }
inline void store_aligned(double *p, __m128d v) { _mm_store_pd(p, v); }
inline void store_unaligned(float *p, __m128 v) { _mm_storeu_ps(p, v); }
inline void store_unaligned(double *p, __m128d v) { _mm_storeu_pd(p, v); }

// One real element, at any address: the type tells the compiler that the address need not be a multiple of the width.
template <class T>
struct [[gnu::packed, gnu::may_alias]] AnyAddress {
  T value;
};
template <class T>
T load_single(const T *p) {
  return reinterpret_cast<const AnyAddress<T> *>(p)->value;
}
template <class T>
void store_single(T *p, T v) {
  reinterpret_cast<AnyAddress<T> *>(p)->value = v;
}

// Two 8-byte loads, for the tiers whose processors read a misaligned vector slowly.
inline __m128 load_halves(const float *p) {
  const __m128d low = _mm_set_sd(load_single(reinterpret_cast<const double *>(p)));
  return _mm_loadh_pi(_mm_castpd_ps(low), reinterpret_cast<const __m64 *>(p + 2));
}
inline __m128d load_halves(const double *p) { return _mm_set_pd(load_single(p + 1), load_single(p)); }
inline void store_halves(float *p, __m128 v) {
  _mm_storel_pi(reinterpret_cast<__m64 *>(p), v);
  _mm_storeh_pi(reinterpret_cast<__m64 *>(p + 2), v);
}
inline void store_halves(double *p, __m128d v) {
  store_single(p, _mm_cvtsd_f64(v));
  store_single(p + 1, _mm_cvtsd_f64(_mm_unpackhi_pd(v, v)));
}

// The parts of elements: of a real element, itself.
inline const float *parts(const float *p) { return p; }
inline const double *parts(const double *p) { return p; }
inline float *parts(float *p) { return p; }
inline double *parts(double *p) { return p; }
template <class R>
const R *parts(const Complex<R> *p) {
  return reinterpret_cast<const R *>(p);
}
template <class R>
R *parts(Complex<R> *p) {
  return reinterpret_cast<R *>(p);
}
template <class R>
Vec<R> load_aligned(const Complex<R> *p) {
  return load_aligned(parts(p));
}
template <class R>
Vec<R> load_unaligned(const Complex<R> *p) {
  return load_unaligned(parts(p));
}
template <class R>
void store_aligned(Complex<R> *p, Vec<R> v) {
  store_aligned(parts(p), v);
}
template <class R>
void store_unaligned(Complex<R> *p, Vec<R> v) {
  store_unaligned(parts(p), v);
}

// One element's bit pattern, at any address: a move that no floating-point instruction has a hand in.
inline std::uint32_t load_bits(const float *p) { return load_single(reinterpret_cast<const std::uint32_t *>(p)); }
inline std::uint64_t load_bits(const double *p) { return load_single(reinterpret_cast<const std::uint64_t *>(p)); }
inline std::uint64_t load_bits(const cfloat *p) { return load_single(reinterpret_cast<const std::uint64_t *>(p)); }
inline __m128i load_bits(const cdouble *p) { return _mm_loadu_si128(reinterpret_cast<const __m128i *>(p)); }
inline void store_bits(float *p, std::uint32_t v) { store_single(reinterpret_cast<std::uint32_t *>(p), v); }
inline void store_bits(double *p, std::uint64_t v) { store_single(reinterpret_cast<std::uint64_t *>(p), v); }
inline void store_bits(cfloat *p, std::uint64_t v) { store_single(reinterpret_cast<std::uint64_t *>(p), v); }
inline void store_bits(cdouble *p, __m128i v) { _mm_storeu_si128(reinterpret_cast<__m128i *>(p), v); }

// One element in the lowest lanes of a vector of zeros, and its store.
inline __m128 load_lowest(const float *p) { return _mm_set_ss(load_single(p)); }
inline __m128d load_lowest(const double *p) { return _mm_set_sd(load_single(p)); }
inline __m128 load_lowest(const cfloat *p) { return _mm_castpd_ps(load_lowest(reinterpret_cast<const double *>(p))); }
inline __m128d load_lowest(const cdouble *p) { return load_unaligned(p); }
inline void store_lowest(float *p, __m128 v) { store_single(p, _mm_cvtss_f32(v)); }
inline void store_lowest(double *p, __m128d v) { store_single(p, _mm_cvtsd_f64(v)); }
inline void store_lowest(cfloat *p, __m128 v) { _mm_storel_pi(reinterpret_cast<__m64 *>(p), v); }
inline void store_lowest(cdouble *p, __m128d v) { store_unaligned(p, v); }

// One complex element, filling the vector: no lane holds anything else, so that arithmetic on all of them raises no
// exception that the element itself does not.
inline __m128 load_repeated(const cfloat *p) {
  return _mm_castpd_ps(_mm_set1_pd(load_single(reinterpret_cast<const double *>(p))));
}
inline __m128d load_repeated(const cdouble *p) { return load_unaligned(p); }

// A vector of elements that stand inc apart, and its scatter in the same order.
inline __m128 gather(const float *p, QtbInt inc) {
  return _mm_set_ps(load_single(p + 3 * inc), load_single(p + 2 * inc), load_single(p + inc), load_single(p));
}
inline __m128d gather(const double *p, QtbInt inc) { return _mm_set_pd(load_single(p + inc), load_single(p)); }
inline __m128 gather(const cfloat *p, QtbInt inc) {
  return _mm_castpd_ps(gather(reinterpret_cast<const double *>(p), inc));
}
inline __m128d gather(const cdouble *p, QtbInt) { return load_unaligned(p); }
inline void scatter(double *p, QtbInt inc, __m128d v) {
  store_single(p, _mm_cvtsd_f64(v));
  store_single(p + inc, _mm_cvtsd_f64(_mm_unpackhi_pd(v, v)));
}
inline void scatter(cfloat *p, QtbInt inc, __m128 v) { scatter(reinterpret_cast<double *>(p), inc, _mm_castps_pd(v)); }
inline void scatter(cdouble *p, QtbInt, __m128d v) { store_unaligned(p, v); }

inline __m128 broadcast(float v) { return _mm_set1_ps(v); }
inline __m128d broadcast(double v) { return _mm_set1_pd(v); }
inline __m128 add(__m128 a, __m128 b) { return _mm_add_ps(a, b); }
inline __m128d add(__m128d a, __m128d b) { return _mm_add_pd(a, b); }
inline __m128 sub(__m128 a, __m128 b) { return _mm_sub_ps(a, b); }
inline __m128d sub(__m128d a, __m128d b) { return _mm_sub_pd(a, b); }
inline __m128 mul(__m128 a, __m128 b) { return _mm_mul_ps(a, b); }
inline __m128d mul(__m128d a, __m128d b) { return _mm_mul_pd(a, b); }
inline __m128 bit_xor(__m128 a, __m128 b) { return _mm_xor_ps(a, b); }
inline __m128d bit_xor(__m128d a, __m128d b) { return _mm_xor_pd(a, b); }

// The value is computed here, once and in a register. Left alone, compilers repeat loads, and gather the additions to
// one accumulator from all over a long pass into one chain, at the price of spilled registers.
template <class V>
[[gnu::always_inline]] inline void keep_in_place(V &v) {
  __asm__("" : "+x"(v));
}

// The lowest lanes added or multiplied; the others are a's.
inline __m128 add_lowest(__m128 a, __m128 b) { return _mm_add_ss(a, b); }
inline __m128d add_lowest(__m128d a, __m128d b) { return _mm_add_sd(a, b); }

inline __m128 mul_lowest(__m128 a, __m128 b) { return _mm_mul_ss(a, b); }
inline __m128d mul_lowest(__m128d a, __m128d b) { return _mm_mul_sd(a, b); }

// The lower half of v plus the upper one, in the lowest lanes. The lanes above add zeros: whatever v holds, a sum that
// nobody wants raises no exception.
inline __m128 sum_halves(__m128 v) {
  const __m128 none = _mm_setzero_ps();
  return _mm_add_ps(_mm_movelh_ps(v, none), _mm_movehl_ps(none, v));
}

// The sum of all lanes: halves first, then the two that are left.
inline float sum_lanes(__m128 v) {
  const __m128 halves = sum_halves(v);
  return _mm_cvtss_f32(_mm_add_ss(halves, _mm_shuffle_ps(halves, halves, 1)));
}
inline double sum_lanes(__m128d v) { return _mm_cvtsd_f64(_mm_add_sd(v, _mm_unpackhi_pd(v, v))); }

// Vectors of complex elements: the parts of each element exchanged. The integer shuffle leaves v as it is, so that v
// needs no copy first.
inline __m128 swap_parts(__m128 v) { return _mm_castsi128_ps(_mm_shuffle_epi32(_mm_castps_si128(v), 0xB1)); }
inline __m128d swap_parts(__m128d v) { return _mm_castsi128_pd(_mm_shuffle_epi32(_mm_castpd_si128(v), 0x4E)); }

// (even, odd) in the lanes of the real and of the imaginary parts.
inline __m128 alternate(float even, float odd) { return _mm_set_ps(odd, even, odd, even); }
inline __m128d alternate(double even, double odd) { return _mm_set_pd(odd, even); }

// The real and the imaginary parts of each element, twice.
#if defined(__SSE3__)
inline __m128 real_parts(__m128 v) { return _mm_moveldup_ps(v); }
inline __m128d real_parts(__m128d v) { return _mm_movedup_pd(v); }
inline __m128 imaginary_parts(__m128 v) { return _mm_movehdup_ps(v); }
inline __m128d imaginary_parts(__m128d v) { return _mm_unpackhi_pd(v, v); }
inline __m128d load_real_parts(const cdouble *p) { return _mm_loaddup_pd(parts(p)); }
inline __m128d load_imaginary_parts(const cdouble *p) { return _mm_loaddup_pd(parts(p) + 1); }
// Even lanes subtracted, odd lanes added.
inline __m128 add_subtract(__m128 a, __m128 b) { return _mm_addsub_ps(a, b); }
inline __m128d add_subtract(__m128d a, __m128d b) { return _mm_addsub_pd(a, b); }
#else
inline __m128 real_parts(__m128 v) { return _mm_shuffle_ps(v, v, 0xA0); }
inline __m128d real_parts(__m128d v) { return _mm_unpacklo_pd(v, v); }
inline __m128 imaginary_parts(__m128 v) { return _mm_shuffle_ps(v, v, 0xF5); }
inline __m128d imaginary_parts(__m128d v) { return _mm_unpackhi_pd(v, v); }
#endif

// The first parts of an operand in the highest count lanes, zeros below.
template <int count>
__m128 load_highest(const float *p) {
  static_assert(count == 1 || count == 2 || count == 3);
  return _mm_set_ps(load_single(p + count - 1), count > 1 ? load_single(p + count - 2) : 0,
                    count > 2 ? load_single(p + count - 3) : 0, 0);
}
template <int count>
__m128d load_highest(const double *p) {
  static_assert(count == 1);
  return _mm_set_pd(load_single(p), 0);
}

// The vector that starts offset bytes into low, of two vectors that stand side by side in memory.
#if defined(__SSSE3__)
template <int offset>
__m128 join(__m128 low, __m128 high) {
  return _mm_castsi128_ps(_mm_alignr_epi8(_mm_castps_si128(high), _mm_castps_si128(low), offset));
}
#endif
template <int offset>
__m128d join(__m128d low, __m128d high) {
  static_assert(offset == sizeof(double));
  return _mm_shuffle_pd(low, high, 1);
}

// A factor, ready to multiply vectors and single elements of T. Single complex elements go through the same vector
// instructions, so that an element's bits do not depend on its place, in any rounding mode.
template <class T>
struct Factor {
  T value;
  Vec<T> lanes;
  explicit Factor(T v) : value(v), lanes(broadcast(v)) {}
  Vec<T> times(Vec<T> x) const { return mul(lanes, x); }
};
template <class R>
struct Factor<Complex<R>> {
  Vec<R> re, im;
#if defined(__SSE3__)
  explicit Factor(Complex<R> v) : re(broadcast(v.re)), im(broadcast(v.im)) {}
  Vec<R> times(Vec<R> x) const {
    keep_in_place(x);
    return add_subtract(mul(re, x), mul(im, swap_parts(x)));
  }
#else
  explicit Factor(Complex<R> v) : re(broadcast(v.re)), im(alternate(-v.im, v.im)) {}
  Vec<R> times(Vec<R> x) const {
    keep_in_place(x);
    return add(mul(re, x), mul(im, swap_parts(x)));
  }
#endif
};

template <class T>
Vec<T> zero() {
  if constexpr (sizeof(Real<T>) == sizeof(float))
    return _mm_setzero_ps();
  else
    return _mm_setzero_pd();
}

// The phase of an address: its distance in bytes above a vector boundary.
inline QtbInt phase(const void *p) {
  return static_cast<QtbInt>(reinterpret_cast<std::uintptr_t>(p) % static_cast<std::uintptr_t>(vector_bytes));
}

// Whether an address is a multiple of the element width, so that peeling elements can reach a vector boundary.
template <class T>
bool element_aligned(const T *p) {
  return reinterpret_cast<std::uintptr_t>(p) % sizeof(T) == 0;
}

// Where a walk over n elements starts: a negative increment starts at the far end, element (1 - n) * inc.
template <class T>
T *walk_start(T *p, QtbInt n, QtbInt inc) {
  return inc < 0 ? p + (1 - n) * inc : p;
}

// |v| by clearing the sign bit: exact, and of a NaN that NaN without a sign.
inline float absolute(float v) { return __builtin_fabsf(v); }
inline double absolute(double v) { return __builtin_fabs(v); }

inline float square_root(float v) { return _mm_cvtss_f32(_mm_sqrt_ss(_mm_set_ss(v))); }
inline double square_root(double v) {
  const __m128d w = _mm_set_sd(v);
  return _mm_cvtsd_f64(_mm_sqrt_sd(w, w));
}

}  // namespace
}  // namespace qtb::QTB_TIER
