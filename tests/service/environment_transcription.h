// The rules of the thread variables once more, character by character over fixed buffers, for comparison with the
// library's reading of them. Nothing here is shared with it but the record of results.
#pragma once

#include <cstdlib>
#include <cstring>
#include <map>
#include <string>

#include "service/thread_settings.h"

namespace qtb::test {

using Environment = std::map<std::string, std::string>;

// Copies a value into a buffer of 256 bytes and returns its length; 0 if it is absent, empty or does not fit.
inline int transcribed_value(const Environment &environment, const char *name, char (&buffer)[256]) {
  const auto found = environment.find(name);
  if (found == environment.end() || found->second.size() > 255) return 0;
  std::strcpy(buffer, found->second.c_str());
  return static_cast<int>(found->second.size());
}

inline bool transcribed_digits(const char *text) {
  for (; *text != 0; ++text)
    if (*text < '0' || *text > '9') return false;
  return true;
}

inline bool is_one_of(char c, const char *set) { return c != 0 && std::strchr(set, c) != nullptr; }

inline void transcribed_domains(const char *value, int length, ThreadSettings &s) {
  int i = 0;
  for (;;) {
    char key[256], number[256];
    while (i < length && is_one_of(value[i], " ,;:\"'")) ++i;
    int k = 0;
    while (i < length && !is_one_of(value[i], "=\"' ")) key[k++] = value[i++];
    key[k] = 0;
    if (k == 0) return;
    while (i < length && is_one_of(value[i], " =")) ++i;
    int d = 0;
    while (i < length && !is_one_of(value[i], " ,;:\"'")) number[d++] = value[i++];
    number[d] = 0;
    ++i;
    const int n = d == 0 || !transcribed_digits(number) ? 1 : std::atoi(number);
    if (n < 1) continue;
    if (std::strcmp(key, "QTB_ALL") == 0) {
      if (s.threads_all < 0) s.threads_all = n;
    } else if (std::strcmp(key, "QTB_BLAS") == 0) {
      if (s.threads_blas < 0) s.threads_blas = n;
    } else if (std::strcmp(key, "QTB_FFT") == 0) {
      if (s.threads_fft < 0) s.threads_fft = n;
    } else if (std::strcmp(key, "QTB_VML") == 0) {
      if (s.threads_vml < 0) s.threads_vml = n;
    }
  }
}

inline ThreadSettings transcribed_settings(const Environment &environment) {
  ThreadSettings s;
  char v[256];
  int length = transcribed_value(environment, "QTB_NUM_THREADS", v);
  if (length > 0) {
    const int n = transcribed_digits(v) ? std::atoi(v) : 1;
    if (n >= 1) s.threads_all = n;
  }
  length = transcribed_value(environment, "QTB_DOMAIN_NUM_THREADS", v);
  if (length > 0) transcribed_domains(v, length, s);
  s.dynamic = 1;
  length = transcribed_value(environment, "QTB_DYNAMIC", v);
  if (length > 0) {
    int i = 0, t = 0;
    char token[256];
    while (is_one_of(v[i], " \"'")) ++i;
    while (v[i] != 0 && !is_one_of(v[i], " \"'")) token[t++] = v[i++];
    token[t] = 0;
    if (std::strcmp(token, "FALSE") == 0 || std::strcmp(token, "false") == 0) s.dynamic = 0;
  }
  length = transcribed_value(environment, "OMP_NUM_THREADS", v);
  if (length > 0) {
    if (!transcribed_digits(v))
      s.omp_threads_env = 1;
    else if (std::atoi(v) >= 1)
      s.omp_threads_env = std::atoi(v);
  }
  length = transcribed_value(environment, "Q_MPI_NUMBER_OF_MPI_PROCESSES_PER_NODE", v);
  if (length > 0 && transcribed_digits(v) && std::atoi(v) > 0) s.mpi_procs_per_node = std::atoi(v);
  length = transcribed_value(environment, "Q_MPI_THREAD_LEVEL", v);
  if (length > 0) {
    s.mpi_thread_level = 0;
    if (transcribed_digits(v)) switch (std::atoi(v)) {
        case 1: s.mpi_thread_level = 1; break;
        case 2: s.mpi_thread_level = 2; break;
        case 3: s.mpi_thread_level = 3; break;
        default: break;
      }
  }
  return s;
}

}  // namespace qtb::test
