// Version, tiers, caches, threads and buffers, asked of the library's own services, which this program holds.
#include "tools/info/machine.h"

#include <omp.h>

#include <bit>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "blas/dispatch/slots.h"
#include "blas/tier_names.h"
#include "service/cache.h"
#include "service/cpu.h"
#include "service/cpuid.h"
#include "service/memory_held.h"
#include "service/platform/platform.h"
#include "service/thread_settings.h"
#include "service/threads.h"
#include "tests/support/tiers.h"

extern "C" void QTBGetVersionString(char *buffer, std::int32_t length);

namespace qtb::info {
namespace {

// ---- tiers ----

std::string vendor() {
  const CpuidRegisters r = platform_cpuid(cpuid::leaf_vendor, 0);
  char text[13] = {};
  std::memcpy(text, &r.ebx, 4);
  std::memcpy(text + 4, &r.edx, 4);
  std::memcpy(text + 8, &r.ecx, 4);
  return text;
}

struct TierRow {
  const char *bit;
  bool has, by_itself;
};
std::vector<TierRow> tier_rows() {
  constexpr auto qtb_serv_cpu_has_baseline = [] { return 1; };
#define QTB_INFO_TIER(tier, TIER, flags, processor, taken, ...) \
  {#processor, qtb_serv_cpu_has_##processor() != 0, std::strcmp(#taken, "by_itself") == 0},
  return {QTB_TIER_ROWS(QTB_INFO_TIER)};
#undef QTB_INFO_TIER
}

// An environment variable as the services read it, "" where it is absent.
std::string variable(const char *name) {
  const char *const text = std::getenv(name);
  return text != nullptr ? text : "";
}
void print_variable(const char *name) {
  if (const std::string value = variable(name); !value.empty()) std::printf("  %s=%s\n", name, value.c_str());
}

// The variable that decided the tier, "" if none did. The services decide the same way: here it is said why.
std::string deciding_variable(const std::string &tier) {
  const std::string number = variable("QTB_DEBUG_CPU_TYPE"), name = variable("QTB_TIER");
  const int value = std::atoi(number.c_str());
  if (number == "0" || (value > 0 && value <= largest_asked_tier)) return "QTB_DEBUG_CPU_TYPE";
  return name == "native" || name == tier ? "QTB_TIER" : "";
}

void print_tiers() {
  const int best = qtb_serv_cpu_detect();
  int by_rules = tier_def;
  const std::vector<TierRow> rows = tier_rows();
  if (qtb_serv_cpu_is_belmo())
    for (int tier = 0; tier < tier_count; ++tier)
      if (const TierRow &row = rows[static_cast<std::size_t>(tier)]; row.has && row.by_itself) by_rules = tier;
  std::printf("processor\n  vendor        %s\n  instructions ", vendor().c_str());
  for (const TierRow &row : rows)
    if (std::strcmp(row.bit, "baseline") != 0) std::printf(" %s %s;", row.bit, row.has ? "yes" : "no");
  const bool extended = cpuid::bits(platform_cpuid(cpuid::leaf_features, 0).ecx, 27, 27) != 0;
  std::printf(" registers saved by the system: %s\n",
              extended && (platform_saved_state() & 6) == 6 ? "16 and 32 bytes" : "16 bytes");

  std::printf("\ntier\n");
  const char *const best_name = tier_names[best];
  for (const char *name : {"QTB_DEBUG_CPU_TYPE", "QTB_TIER"}) print_variable(name);
  const std::string decides = deciding_variable(best_name), as_asked = "as " + decides + " asks";
  std::printf("  companions    %s: %s\n", best_name,
              !decides.empty() ? as_asked.c_str() : "the highest whose instructions the processor and the system have");
  // Where no variable decides, the rules of the product hold.
  std::printf("  libqtb.so     %s: %s\n", !decides.empty() ? best_name : tier_names[by_rules],
              !decides.empty()          ? as_asked.c_str()
              : qtb_serv_cpu_is_belmo() ? "the highest that is taken unasked and that the processor has"
                                        : "the one for every processor, since the vendor is another");
}

// ---- caches ----

void print_caches() {
  std::uint32_t sizes[cache_size_entries];
  qtb_serv_get_cache_sizes(sizes);
  std::printf("\ncaches\n");
  if (sizes[cache_count] == 0) std::printf("  the processor does not tell; sizes for large ones are taken\n");
  for (std::uint32_t level = 1; level <= sizes[cache_count] && level < cache_size_entries; ++level)
    std::printf("  level %u       %u KiB\n", level, sizes[level] / 1024);
}

// ---- threads ----

int count(const ProcessorSet &set) {
  int sum = 0;
  for (const std::uint64_t word : set.words) sum += std::popcount(word);
  return sum;
}

const char *reason(const ThreadSettings &s, int threads, bool has_all) {
  const bool given = s.threads_blas > 0 || s.threads_all > 0;
  if (s.dynamic == 0) return given ? "the number given, with dynamic mode off" : "the OpenMP runtime's own number";
  if (threads == 1 && !has_all) return "the process may not use all of the machine's processors";
  if (s.mpi_procs_per_node != -1 && !given && s.omp_threads_env <= 0) return "a rank's share of the node's cores";
  const int asked = s.threads_blas > 0 ? s.threads_blas : s.threads_all > 0 ? s.threads_all : omp_get_max_threads();
  if (threads < asked) return "no more than there are cores, in dynamic mode";
  return s.threads_blas > 0  ? "QTB_DOMAIN_NUM_THREADS"
         : s.threads_all > 0 ? "QTB_NUM_THREADS, or QTB_ALL of QTB_DOMAIN_NUM_THREADS"
                             : "the OpenMP runtime's own number";
}

void print_threads() {
  ThreadSettings settings;
  read_thread_variables(&settings);
  ProcessorSet process = {}, online = {};
  const bool known = platform_processors(&process, &online);
  qtb_serv_count_cores(&settings.logical_processors, &settings.physical_cores);
  const int threads = qtb_serv_get_max_threads(domain_blas);
  std::printf("\nthreads\n");
  for (const char *name : {"QTB_NUM_THREADS", "QTB_DOMAIN_NUM_THREADS", "QTB_DYNAMIC", "OMP_NUM_THREADS",
                           "Q_MPI_NUMBER_OF_MPI_PROCESSES_PER_NODE", "Q_MPI_THREAD_LEVEL"})
    print_variable(name);
  std::printf("  a call takes  %d at most: %s\n", threads, reason(settings, threads, known && process == online));
  std::printf("  dynamic mode  %s\n", settings.dynamic != 0 ? "on" : "off");
  if (known) std::printf("  processors    %d of %d that are online\n", count(process), count(online));
  std::printf("  cores         %d\n", settings.physical_cores);
}

// ---- buffers ----

// What a product of an order leaves with its thread.
void print_held(QtbInt order) {
  const std::size_t size = static_cast<std::size_t>(order) * static_cast<std::size_t>(order);
  const std::vector<double> a(size, 1);
  std::vector<double> c(size);
  const double one = 1, zero = 0;
  qtb_blas_xdgemm("N", "N", &order, &order, &order, &one, a.data(), &order, a.data(), &order, &zero, c.data(), &order);
  MemoryHeld held;
  qtb_serv_get_memory_held(&held);
  std::printf("  order %-7lld %lld buffers, %.2f MiB\n", static_cast<long long>(order),
              static_cast<long long>(held.buffers), static_cast<double>(held.bytes) / (1024 * 1024));
}

void print_buffers() {
  std::printf("\nbuffers\n");
  print_variable("QTB_DISABLE_FAST_MM");
  print_variable("QTB_MM_DISABLE");
  MemoryHeld held;
  qtb_serv_get_memory_held(&held);
  if (!held.reuses_buffers) {
    std::printf("  none are kept: the environment says so\n");
    return;
  }
  std::printf("  a thread keeps up to 5 buffers of at most 40 MiB; one that has computed a dgemm holds\n");
  for (const QtbInt order : {100, 300, 1000}) print_held(order);
}

}  // namespace

const char *version() {
  static char text[256];
  QTBGetVersionString(text, sizeof text);
  return text;
}

void print_machine() {
  std::printf("%s\n\n", version());
  print_tiers();
  print_caches();
  print_threads();
  print_buffers();
}

}  // namespace qtb::info
