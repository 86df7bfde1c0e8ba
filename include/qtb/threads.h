/*
 * How many threads the calls of a program take, and which kernels: what the companions of QTB (libblas.so.3,
 * libblas64.so.3 and libqtb64.so) have beside their routines. For C from C99 on and C++.
 *
 * A number that is set stands in the place of what the environment gives (QTB_NUM_THREADS and its kin), and everything
 * else stays as it is: a routine takes no more threads than pay for its problem; in dynamic mode, which QTB_DYNAMIC
 * alone turns off, no more than the machine has cores, one inside a parallel region of the caller and one where the
 * process may not use all processors; and one in a process that was forked from one with several threads.
 *
 * Any thread may call these at any time, also while others compute: a call takes the number that it finds when it
 * begins. A forked child has the numbers of the thread that forked. Each library keeps numbers of its own: where a
 * program has loaded two companions, the names here set the one that the loader finds first.
 */
#ifndef QTB_THREADS_H
#define QTB_THREADS_H

#ifdef __cplusplus
extern "C" {
#endif

/* The number of threads for calls of all threads of the process. 0 and less give the choice back to the environment. */
void qtb_set_num_threads(int threads);

/* The same for calls of the calling thread alone; it goes before the number for all. 0 and less take it back. Returns
 * the former number, 0 where there was none, which can be handed in again to restore it. */
int qtb_set_num_threads_local(int threads);

/* The most threads that a call from here may take now, at least 1: what was set, or the environment gives, as far as
 * the rules above allow it. */
int qtb_get_num_threads(void);

/* The first and the third under the names that belong to no library, which switches between libraries look for. */
void blas_set_num_threads(int threads);
int blas_get_num_threads(void);

/* The tier of kernels that this process runs, by its name: "def", "sse3", "ssse3", "sse42" or "avx". */
const char *qtb_get_tier(void);

#ifdef __cplusplus
}
#endif

#endif
