// Reads a table of comma-separated values; see table.h.
#define _POSIX_C_SOURCE 200809L  // getline

#include "table.h"

#include <errno.h>
#include <math.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>

// An array of count elements with room for one more. Ends the program where memory is out.
static void *grown(void *array, size_t count, size_t element_bytes) {
  void *larger = realloc(array, (count + 1) * element_bytes);
  if (larger == NULL) {
    fprintf(stderr, "out of memory\n");
    exit(EXIT_FAILURE);
  }
  return larger;
}

static char *copy_of(const char *text) {
  const size_t length = strlen(text);
  return memcpy(grown(NULL, length, 1), text, length + 1);
}

// The next field of a line, ended, with the line moved behind it; null when the line is used up.
static char *next_field(char **line) {
  char *field = *line;
  if (field == NULL) return NULL;
  char *comma = strchr(field, ',');
  if (comma != NULL) *comma++ = '\0';
  *line = comma;
  return field;
}

// Whether the whole field is one finite number.
static bool to_number(const char *field, double *value) {
  char *end;
  *value = strtod(field, &end);
  return end != field && end[strspn(end, " ")] == '\0' && isfinite(*value);
}

static void read_names(struct table *t, char *line) {
  for (char *field; (field = next_field(&line)) != NULL; t->columns++) {
    t->names = grown(t->names, t->columns, sizeof *t->names);
    t->names[t->columns] = copy_of(field);
  }
}

static bool read_row(struct table *t, char *line, bool first_column_is_text, const char *path, size_t number) {
  t->values = grown(t->values, t->rows, t->columns * sizeof *t->values);
  double *row = t->values + t->rows * t->columns;
  memset(row, 0, t->columns * sizeof *row);
  if (first_column_is_text) {
    t->labels = grown(t->labels, t->rows, sizeof *t->labels);
    t->labels[t->rows] = NULL;
  }
  t->rows++;

  size_t count = 0;
  for (char *field; (field = next_field(&line)) != NULL; count++) {
    if (count >= t->columns) continue;
    if (count == 0 && first_column_is_text) {
      t->labels[t->rows - 1] = copy_of(field);
    } else if (!to_number(field, &row[count])) {
      fprintf(stderr, "%s:%zu: \"%s\" in column %s is not a finite number\n", path, number, field, t->names[count]);
      return false;
    }
  }
  if (count != t->columns) {
    fprintf(stderr, "%s:%zu: %zu values, but the table has %zu columns\n", path, number, count, t->columns);
    return false;
  }
  return true;
}

bool table_read(struct table *t, const char *path, bool first_column_is_text) {
  memset(t, 0, sizeof *t);
  FILE *file = fopen(path, "r");
  if (file == NULL) {
    fprintf(stderr, "%s: %s\n", path, strerror(errno));
    return false;
  }

  char *line = NULL;
  size_t capacity = 0, number = 0;
  bool good = true;
  errno = 0;
  while (good && getline(&line, &capacity, file) >= 0) {
    number++;
    line[strcspn(line, "\r\n")] = '\0';
    if (line[0] == '\0' || line[0] == '#') continue;
    if (t->columns == 0)
      read_names(t, line);
    else
      good = read_row(t, line, first_column_is_text, path, number);
  }
  if (good && ferror(file)) {
    fprintf(stderr, "%s: %s\n", path, strerror(errno));
    good = false;
  }
  if (good && t->rows == 0) {
    fprintf(stderr, "%s: no data: a line of column names and at least one line of values are needed\n", path);
    good = false;
  }
  free(line);
  fclose(file);
  return good;
}

void table_free(struct table *t) {
  for (size_t i = 0; i < t->columns; i++) free(t->names[i]);
  if (t->labels != NULL)
    for (size_t i = 0; i < t->rows; i++) free(t->labels[i]);
  free(t->names);
  free(t->labels);
  free(t->values);
}
