// Knows nothing of the library: loads plugins that use it, as argument or not at all.
#include <dlfcn.h>

#include <cstdio>

int main(int argc, char** argv) {
  for (int i = 1; i < argc; ++i) {
    void* const plugin = dlopen(argv[i], RTLD_NOW | RTLD_LOCAL);
    if (!plugin) {
      std::fprintf(stderr, "%s\n", dlerror());
      return 1;
    }
    std::printf("%d\n", reinterpret_cast<int (*)()>(dlsym(plugin, "plugin"))());
    dlclose(plugin);
  }
}
