// xerbla, XERBLA: the error reporter as the exported routine and as the checkers reach it.

#include "blas/entry/xerbla.h"

#include <algorithm>
#include <cstring>

#include "blas/entry/export.h"
#include "service/messages.h"

namespace {

constexpr std::int32_t name_limit = 20;

// The values of info that name a condition and no parameter.
constexpr std::int32_t info_no_memory = 1000;
constexpr std::int32_t info_incompatible_options = 1001;
constexpr std::int32_t info_no_work_memory = 1079;

}  // namespace

extern "C" {

XerblaHandler qtb_serv_xerbla_handler = nullptr;

void qtb_serv_xerbla(const char *name, const QtbInt *info, std::int32_t length) {
  char shown[name_limit + 1] = {};
  const std::int32_t count = length < 0 ? name_limit : std::min(length, name_limit);
  std::strncpy(shown, name, static_cast<std::size_t>(count));
  std::int32_t code;
  std::memcpy(&code, info, sizeof code);

  qtb_serv_print(1, message_line_end, 0);
  if (code == info_no_memory)
    qtb_serv_print(1, message_no_memory, 1, shown);
  else if (code == info_incompatible_options)
    qtb_serv_print(1, message_incompatible_options, 1, shown);
  else if (code == info_no_work_memory)
    qtb_serv_print(1, message_no_work_memory, 1, shown);
  else if (code >= 1)
    qtb_serv_print(1, message_parameter, 2, code, shown);
  else  // the negation of the smallest number is that number itself
    qtb_serv_print(1, message_condition, 2, static_cast<std::int32_t>(0U - static_cast<std::uint32_t>(code)), shown);
}

QTB_EXPORT int xerbla(const char *name, const QtbInt *info, std::int32_t length);
int xerbla(const char *name, const QtbInt *info, std::int32_t length) {
  if (qtb_serv_xerbla_handler != nullptr) return qtb_serv_xerbla_handler(name, info, length);
  qtb_serv_xerbla(name, info, length);
  return 0;
}
QTB_EXPORT int XERBLA(const char *name, const QtbInt *info, std::int32_t length) QTB_SAME_ROUTINE(xerbla);

}  // extern "C"
