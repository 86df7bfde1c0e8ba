// xerbla_, xerbla_array_, lsame_ and cblas_xerbla.
#include "interfaces/reports.h"

#include <algorithm>
#include <atomic>
#include <cstdarg>
#include <cstdio>
#include <cstring>
#include <string_view>

#include "blas/entry/lsame.h"
#include "blas/entry/xerbla.h"

#define QTB_CALL_FROM_C QTB_FACE_EXPAND(CBLAS_CallFromC, QTB_FACE_SUFFIX, )
#define QTB_ROW_MAJOR QTB_FACE_EXPAND(RowMajorStrg, QTB_FACE_SUFFIX, )

namespace qtb::face {
namespace {

constexpr std::size_t name_limit = 32;  // of a routine, in an array of characters

// What this thread's call told the reporters. The reporters of this library read it here, since another thread may
// report at the same time; a program's own find it in the two variables that they have always had.
struct Caller {
  bool from_c = false, row_major = false;
};
thread_local Caller caller;

void publish(const Caller &now) {
  caller = now;
  std::atomic_ref(QTB_CALL_FROM_C).store(now.from_c, std::memory_order_relaxed);
  std::atomic_ref(QTB_ROW_MAJOR).store(now.row_major, std::memory_order_relaxed);
}

// The C face reports as long as it lives.
class Report {
 public:
  explicit Report(bool row_major) { publish({true, row_major}); }
  ~Report() { publish({}); }
  Report(const Report &) = delete;
};

// Positions of a row-major call: what stands at one place of the call on transposes stands at the other of the
// caller's, counted with the layout. The first row whose name is part of the routine's holds.
struct Exchange {
  std::string_view routine;
  std::int32_t places[2][2];
};
constexpr Exchange exchanges[] = {
    {"gemm", {{4, 5}, {9, 11}}},  // m, n; lda, ldb
    {"symm", {{4, 5}}},           // m, n
    {"hemm", {{4, 5}}},           //
    {"trmm", {{6, 7}}},           // m, n
    {"trsm", {{6, 7}}},           //
    {"gemv", {{3, 4}}},           // m, n
    {"gbmv", {{3, 4}, {5, 6}}},   // m, n; kl, ku
    {"ger", {{2, 3}, {6, 8}}},    // m, n; incx, incy
    {"her2k", {}},                //
    {"her2", {{6, 8}}},           // incx, incy
    {"hpr2", {{6, 8}}},           //
};

std::int32_t caller_position(std::string_view routine, std::int32_t position) {
  for (const Exchange &exchange : exchanges) {
    if (routine.find(exchange.routine) == routine.npos) continue;
    for (const auto &[one, other] : exchange.places) {
      if (position == one) return other;
      if (position == other) return one;
    }
    break;
  }
  return position;
}

// cblas_<routine> of a name in upper case and blanks.
struct CName {
  char text[name_limit] = "cblas_";
  CName(const char *fortran, std::size_t length) {
    std::size_t end = std::strlen(text);
    for (std::size_t i = 0; i < length && end + 1 < name_limit && fortran[i] != ' ' && fortran[i] != '\0'; i++)
      text[end++] = static_cast<char>(fortran[i] | ('a' ^ 'A'));
    text[end] = '\0';
  }
};

void print(const char *name, std::int64_t number, std::int32_t length) {
  const QtbInt info = number;
  qtb_serv_xerbla(name, &info, length);
}

}  // namespace

void report_rule(bool row_major, const char *fortran_name, QtbInt number) {
  const Int info = static_cast<Int>(number);
  const Report report(row_major);
  QTB_FORTRAN_NAME(xerbla)(fortran_name, &info, std::strlen(fortran_name));
}

void report_option(bool row_major, int position, const char *c_name, const char *what, int value) {
  const Report report(row_major);
  char text[64];
  std::snprintf(text, sizeof text, "Illegal %s setting, %d\n", what, value);
  QTB_C_NAME(xerbla)(position, c_name, "%s", text);
}

void report_no_memory(const char *c_name) {
  constexpr std::int64_t condition_no_memory = 1000;
  print(c_name, condition_no_memory, -1);
}

}  // namespace qtb::face

extern "C" {

int QTB_CALL_FROM_C = 0;
int QTB_ROW_MAJOR = 0;

void QTB_FORTRAN_NAME(xerbla)(const char *name, const QTB_FACE_INT *info, std::size_t length) {
  if (qtb::face::caller.from_c) return QTB_C_NAME(xerbla)(*info + 1, qtb::face::CName(name, length).text, "");
  qtb::face::print(name, *info, static_cast<std::int32_t>(std::min(length, qtb::face::name_limit)));
}

// The name as an array of single characters.
QTB_EXPORT void QTB_FORTRAN_NAME(xerbla_array)(const char *name, const QTB_FACE_INT *length, const QTB_FACE_INT *info);
void QTB_FORTRAN_NAME(xerbla_array)(const char *name, const QTB_FACE_INT *length, const QTB_FACE_INT *info) {
  char text[qtb::face::name_limit];
  const std::size_t count = *length < 0 ? 0 : std::min(static_cast<std::size_t>(*length), sizeof text);
  std::memset(text, ' ', sizeof text);
  std::memcpy(text, name, count);
  QTB_FORTRAN_NAME(xerbla)(text, info, sizeof text);
}

QTB_EXPORT QTB_FACE_INT QTB_FORTRAN_NAME(lsame)(const char *a, const char *b);
QTB_FACE_INT QTB_FORTRAN_NAME(lsame)(const char *a, const char *b) { return qtb::same_option(*a, *b) ? 1 : 0; }

void QTB_C_NAME(xerbla)(QTB_FACE_INT position, const char *routine, const char *format, ...) {
  std::int32_t shown = static_cast<std::int32_t>(position);
  if (qtb::face::caller.row_major) shown = qtb::face::caller_position(routine, shown);
  qtb::face::print(routine, shown, -1);
  if (format == nullptr || *format == '\0') return;
  std::va_list arguments;
  va_start(arguments, format);
  std::vprintf(format, arguments);
  va_end(arguments);
  std::fflush(stdout);
}

QTB_SECOND_NAME(xerbla)

}  // extern "C"
