// What runs when the library is loaded: the choice of the allocator, and the registration that keeps a forked child
// able to call any routine. All else is made at its first use.

#include "service/memory.h"

namespace {

[[gnu::constructor]] void load() {
  qtb_serv_select_allocator();
  qtb_serv_prepare_fork();
}

}  // namespace
