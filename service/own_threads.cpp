// The product has no call that sets a number of threads: the environment alone does.
#include "service/threads.h"

std::int32_t qtb_serv_threads_asked_for() { return 0; }
