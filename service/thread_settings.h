// What the environment and the machine say about threads, as one record.
#pragma once

#include <cstdint>

namespace qtb {

// Every field is a 32-bit number; -1 stands for not given.
struct ThreadSettings {
  std::int32_t threads_all = -1;         // QTB_NUM_THREADS, or the key QTB_ALL of QTB_DOMAIN_NUM_THREADS
  std::int32_t threads_blas = -1;        // the key QTB_BLAS
  std::int32_t threads_fft = -1;         // the key QTB_FFT
  std::int32_t threads_vml = -1;         // the key QTB_VML
  std::int32_t dynamic = -1;             // 1, or 0 if QTB_DYNAMIC is FALSE or false; -1 until it was read
  std::int32_t dynamic_override = -1;    // a place for a setter, which does not exist: 0 would mean one thread
  std::int32_t omp_threads_env = -1;     // OMP_NUM_THREADS, to know that the user gave it
  std::int32_t mpi_procs_per_node = -1;  // Q_MPI_NUMBER_OF_MPI_PROCESSES_PER_NODE
  std::int32_t mpi_thread_level = -1;    // Q_MPI_THREAD_LEVEL, 0 to 3
  std::int32_t physical_cores = 1;
  std::int32_t logical_processors = 1;  // for whoever looks at a process; no rule asks it

  bool operator==(const ThreadSettings &) const = default;
};

// Reads the variables into a record as it is initially; a value that is absent, empty or 256 characters and more leaves
// its fields as they are. The counts of processors are not touched.
void read_thread_variables(ThreadSettings *settings);

}  // namespace qtb
