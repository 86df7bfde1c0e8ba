// The product takes its tier by its published rules.
#include "service/cpu.h"

const bool qtb_serv_takes_best_tier = false;
