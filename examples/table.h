// A table of numbers, read from a file of comma-separated values.
//
// The first line names the columns; every further line holds one finite number per column, or, where asked for, a text
// in the first column. Lines that start with "#" and empty lines are skipped.
#pragma once

#include <stdbool.h>
#include <stddef.h>

struct table {
  size_t columns, rows;
  char **names;    // columns texts
  char **labels;   // rows texts, where the first column is text; else null
  double *values;  // rows times columns, one row after another; 0 where the column is text
};

// Reads path into t and returns true. Otherwise prints what is wrong, with the line, to the error stream and returns
// false. table_free releases t in both cases.
bool table_read(struct table *t, const char *path, bool first_column_is_text);
void table_free(struct table *t);
