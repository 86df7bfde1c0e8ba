// The answer to how many threads, from settings that are read once.
//
// There is no lock: threads that race on the first call read the same environment, count the same cores and store the
// same words, and each clears env_pending behind its own stores.

#include "service/threads.h"

#include <omp.h>

#include <algorithm>
#include <array>
#include <atomic>
#include <bit>

#include "service/platform/platform.h"
#include "service/thread_settings.h"

namespace {

using qtb::ThreadSettings;

// The record of settings, word by word, since racing threads may write it.
using Words = std::array<std::int32_t, sizeof(ThreadSettings) / sizeof(std::int32_t)>;
std::atomic<std::int32_t> cells[std::tuple_size_v<Words>];
std::atomic<std::int32_t> env_pending{1};

void store_settings(const ThreadSettings &settings) {
  const Words words = std::bit_cast<Words>(settings);
  for (std::size_t i = 0; i < words.size(); ++i) cells[i].store(words[i], std::memory_order_relaxed);
}

ThreadSettings thread_settings() {
  if (env_pending.load(std::memory_order_acquire) != 0) {
    qtb_serv_read_thread_env();
    env_pending.store(0, std::memory_order_release);
  }
  Words words;
  for (std::size_t i = 0; i < words.size(); ++i) words[i] = cells[i].load(std::memory_order_relaxed);
  return std::bit_cast<ThreadSettings>(words);
}

// What a domain was given: its own number, or the one for all; not above 0 if neither.
std::int32_t given_threads(const ThreadSettings &settings, std::int32_t domain) {
  const std::int32_t own = domain == domain_blas  ? settings.threads_blas
                           : domain == domain_fft ? settings.threads_fft
                           : domain == domain_vml ? settings.threads_vml
                                                  : -1;
  return own > 0 ? own : settings.threads_all;
}

}  // namespace

std::int32_t qtb_serv_get_max_threads(std::int32_t domain) {
  if (platform_forked_from_threads()) return 1;
  const ThreadSettings settings = thread_settings();
  if (settings.dynamic != 0 && omp_in_parallel()) return 1;

  const std::int32_t asked = qtb_serv_threads_asked_for();
  const std::int32_t given = asked > 0 ? asked : given_threads(settings, domain);
  const bool is_explicit = given > 0;
  const std::int32_t requested = is_explicit ? given : omp_get_max_threads();
  if (settings.dynamic == 0) return requested;

  const std::int32_t limited = static_cast<std::int32_t>(
      std::min(static_cast<std::uint32_t>(requested), static_cast<std::uint32_t>(settings.physical_cores)));
  if (settings.dynamic_override != -1) return settings.dynamic_override == 0 ? 1 : limited;

  // One of several ranks on a node whose user named no number: its share of the cores, if the ranks may use threads.
  if (settings.mpi_procs_per_node != -1 && !is_explicit && settings.omp_threads_env <= 0)
    return settings.mpi_thread_level > 0 ? std::max(settings.physical_cores / settings.mpi_procs_per_node, 1) : 1;
  return limited;
}

std::int32_t qtb_serv_get_dynamic() { return thread_settings().dynamic; }

void qtb_serv_read_thread_env() {
  ThreadSettings settings;
  qtb::read_thread_variables(&settings);
  qtb_serv_count_cores(&settings.logical_processors, &settings.physical_cores);
  store_settings(settings);
}
