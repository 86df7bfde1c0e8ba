// A team of threads: the one parallel region of the library, and what its body needs inside.
//
// run_team(nthreads, body) asks the runtime for nthreads threads, at least 1, and calls body(team) on each thread of
// the team that it gives, which may be smaller, down to the caller alone; so a body cuts its work by team.size and
// never by what was asked for. Every thread works with the caller's floating-point choice. The end of run_team orders
// all that the bodies wrote before what the caller reads; nothing else waits but team.meet().
//
//   run_team(nthreads, [&](const Team &team) {
//     const Range part = share(n, team.size, team.rank);    // a cut of its own for each thread,
//     for (QtbInt b : team.shares(blocks)) ...               // or blocks that are dealt out in turn
//     team.meet();
//   });
//
// A procedure that the threads of a team call together, as a strategy of gemm is, finds the team by this_team().
#pragma once

#include <omp.h>

#include "blas/thread/floating_state.h"
#include "blas/types.h"

namespace qtb {

// The numbers from first below count in steps: for a range-based loop.
struct Shares {
  QtbInt first, count, step;

  struct Iterator {
    QtbInt i, step;
    QtbInt operator*() const { return i; }
    void operator++() { i += step; }
    bool operator!=(QtbInt count) const { return i < count; }
  };
  Iterator begin() const { return {first, step}; }
  QtbInt end() const { return count; }
};

struct Team {
  QtbInt size, rank;  // the caller's own thread has rank 0

  // The shares of this thread out of count: number i belongs to the thread of rank i, and where there are more shares
  // than threads, to the one of rank i % size. A thread beyond count has none. No thread waits for another.
  Shares shares(QtbInt count) const { return {rank, count, size}; }

  // Every thread of the team waits here for the others; what they wrote before is seen by all behind it. All threads
  // must come by, those without a share too.
  void meet() const {
#pragma omp barrier
  }

  // Runs work on the caller's own thread, and all meet behind it. What it allocates belongs to the caller's thread,
  // which can give it back behind the region.
  template <class Work>
  void once(const Work &work) const {
    if (rank == 0) work();
    meet();
  }
};

// The team that the calling thread is in; outside of any region, a team of one.
inline Team this_team() { return {omp_get_num_threads(), omp_get_thread_num()}; }

template <class Body>
void run_team(QtbInt nthreads, const Body &body) {
  const int requested = static_cast<int>(nthreads);
  const unsigned callers_choice = floating_choice();
#pragma omp parallel num_threads(requested)
  {
    const unsigned own_choice = take_floating_choice(callers_choice);
    body(this_team());
    take_floating_choice(own_choice);
  }
}

}  // namespace qtb
