// Addresses of procedures as the running program has them.
#pragma once

namespace qtb::test {

// A compiler that knows two names takes them for two procedures and answers their comparison itself; a volatile pointer
// makes it look.
template <class Procedure>
const void *address_of(Procedure *procedure) {
  Procedure *volatile found = procedure;
  return reinterpret_cast<const void *>(found);
}

}  // namespace qtb::test
