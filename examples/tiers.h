// A program on every tier: the library takes its tier once per process, from QTB_DEBUG_CPU_TYPE where that is set, so
// that a program which shows them all starts itself anew for each.
#pragma once

#include <string>

// The results of a program, the worst last.
enum { right = 0, wrong = 1, bad_argument = 2 };

// The order of the matrices, the program's first argument: from 1 to largest, usual where it is not given. Prints how
// to call the program and returns 0 where it is no such number.
long long order_argument(int count, char **arguments, long long usual, long long largest);

// Runs this program in a process of its own for each tier that the processor has, with the arguments order and the
// tier's name, and returns the worst result. Prints a line for each tier that the processor lacks.
int on_every_tier(const char *program, const std::string &order);
