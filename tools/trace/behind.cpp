// The library behind: where the names that this library stands ahead of are, and what is known of it.
#include <dlfcn.h>
#include <link.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string_view>

#include "blas/entry/export.h"
#include "tools/trace/forward.h"
#include "tools/trace/report.h"

namespace qtb::trace {

std::atomic<bool> integers_have_64_bits{false};

namespace {

Behind the_one_behind;
std::atomic<bool> behind_is_known{false};

const void *own_base() {
  static const char inside = 0;
  Dl_info information;
  return dladdr(&inside, &information) != 0 ? information.dli_fbase : nullptr;
}

bool is_own(void *procedure) {
  Dl_info information;
  return dladdr(procedure, &information) != 0 && information.dli_fbase == own_base();
}

// A program that loads its BLAS by hand keeps it out of the order that RTLD_NEXT walks: then every file is asked.
struct Search {
  const char *name;
  void *found;
};
int look_into(dl_phdr_info *object, std::size_t, void *given) {
  Search &search = *static_cast<Search *>(given);
  void *const handle = dlopen(object->dlpi_name, RTLD_LAZY | RTLD_NOLOAD);
  if (handle == nullptr) return 0;
  void *const found = dlsym(handle, search.name);
  if (found != nullptr && !is_own(found)) search.found = found;
  dlclose(handle);
  return search.found != nullptr ? 1 : 0;
}
void *procedure_behind(const char *name) {
  void *const next = dlsym(RTLD_NEXT, name);
  if (next != nullptr) return next;
  Search search{name, nullptr};
  dl_iterate_phdr(&look_into, &search);
  return search.found;
}

// A name in the very file that a procedure is in.
void *beside(void *procedure, const char *name) {
  Dl_info information;
  if (dladdr(procedure, &information) == 0) return nullptr;
  void *const handle = dlopen(information.dli_fname, RTLD_LAZY | RTLD_NOLOAD);
  if (handle == nullptr) return nullptr;
  void *const found = dlsym(handle, name);
  dlclose(handle);
  return found;
}

bool file_name_has_64(std::string_view path) {
  std::string_view file = path.substr(path.rfind('/') + 1);
  if (const std::size_t machine = file.find("x86_64"); machine != file.npos) file = file.substr(0, machine);
  return file.find("64") != file.npos;
}

// Racing first calls write the same.
void look_at_library(void *procedure) {
  if (behind_is_known.load(std::memory_order_acquire)) return;
  Dl_info information;
  Behind behind;
  if (dladdr(procedure, &information) != 0) {
    std::snprintf(behind.file, sizeof behind.file, "%s", information.dli_fname);
    const char *const told = std::getenv("QTB_TRACE_INTEGERS");
    integers_have_64_bits = told != nullptr ? std::strcmp(told, "64") == 0 : file_name_has_64(behind.file);
  }
  if (void *const tier = beside(procedure, "qtb_get_tier")) behind.tier = reinterpret_cast<const char *(*)()>(tier)();
  static std::atomic<bool> writes{false};
  if (writes.exchange(true)) return;
  the_one_behind = behind;
  behind_is_known.store(true, std::memory_order_release);
}

}  // namespace

const Behind &library_behind() { return the_one_behind; }

void *find_target(Target &target) {
  void *const procedure = procedure_behind(target.name);
  if (procedure == nullptr) {
    std::fprintf(stderr, "qtb-trace: no library has %s\n", target.name);
    std::abort();
  }
  look_at_library(procedure);
  target.procedure.store(procedure, std::memory_order_release);
  return procedure;
}

}  // namespace qtb::trace

// Where a team of the GNU OpenMP runtime begins: how large it was asked to be belongs to the call that asked.
extern "C" QTB_EXPORT void GOMP_parallel(void (*body)(void *), void *data, unsigned threads, unsigned flags) {
  using namespace qtb::trace;
  static constinit Target begin{"GOMP_parallel"}, most{"omp_get_max_threads"};
  const auto procedure = [](Target &target) {
    void *known = target.procedure.load(std::memory_order_acquire);
    if (known == nullptr) target.procedure.store(known = procedure_behind(target.name), std::memory_order_release);
    return known;
  };
  if (this_thread.frame != 0) {
    unsigned team = threads;
    if (team == 0) team = static_cast<unsigned>(reinterpret_cast<int (*)()>(procedure(most))());
    if (team > this_thread.team) this_thread.team = team;
  }
  reinterpret_cast<void (*)(void (*)(void *), void *, unsigned, unsigned)>(procedure(begin))(body, data, threads,
                                                                                             flags);
}
