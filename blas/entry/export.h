// How a name is exported, and how a second name is given to the same routine.
#pragma once

#if defined(_WIN32)
#define QTB_EXPORT __declspec(dllexport)
#else
#define QTB_EXPORT __attribute__((visibility("default")))
#endif

// Behind a declaration: the declared name is another name of routine, which this source defines with C linkage.
#define QTB_SAME_ROUTINE(routine) __attribute__((alias(#routine)))
