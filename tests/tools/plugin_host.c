/*
 * Loads a library as a plugin, with names of its own alone, and runs the main that it has.
 */
#include <dlfcn.h>
#include <stddef.h>

int main(int argc, char **argv) {
  void *const plugin = argc > 1 ? dlopen(argv[1], RTLD_NOW | RTLD_LOCAL) : NULL;
  if (plugin == NULL) return 10;
  int (*const run)(int, char **) = (int (*)(int, char **))dlsym(plugin, "main");
  return run != NULL ? run(1, argv) : 11;
}
