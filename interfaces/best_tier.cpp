// A companion's choice of the tier: the best that the processor has, whoever made it.
#include "service/cpu.h"

const bool qtb_serv_takes_best_tier = true;
