#ifndef SSOCLIENT_TESTS_PLUGIN_HOST_CYCLES_H
#define SSOCLIENT_TESTS_PLUGIN_HOST_CYCLES_H

#include <cstdlib>
#include <iostream>

#include <dlfcn.h>

namespace SsoClient::Testing {

inline bool IsLoaded(const char* library) {
  void* handle = dlopen(library, RTLD_NOW | RTLD_NOLOAD);
  if (handle != nullptr) {
    dlclose(handle);
  }
  return handle != nullptr;
}

/// Loads the plug-in, calls `use` with its handle, and unloads it. False if `use` returned that, or
/// if the plug-in is still there.
template <class Use>
bool RunCycle(const char* plugin, const Use& use) {
  void* handle = dlopen(plugin, RTLD_NOW | RTLD_LOCAL);
  if (handle == nullptr) {
    std::cerr << dlerror() << '\n';
    return false;
  }
  if (!use(handle)) {
    return false;
  }
  dlclose(handle);
  if (IsLoaded(plugin)) {
    std::cerr << "The plug-in was not unloaded.\n";
    return false;
  }
  return true;
}

/// What a host with the arguments PLUGIN CYCLES LIBRARY... does. Returns its exit status: 1 if a
/// cycle failed, or if a library was unloaded with the plug-in.
template <class Use>
int RunCycles(int argc, char** argv, const Use& use) {
  if (argc < 4) {
    return 2;
  }
  const int cycles = std::atoi(argv[2]);
  for (int i = 0; i < cycles; ++i) {
    if (!RunCycle(argv[1], use)) {
      return 1;
    }
  }
  int status = 0;
  for (int i = 3; i < argc; ++i) {
    if (!IsLoaded(argv[i])) {
      std::cerr << argv[i] << " was unloaded.\n";
      status = 1;
    }
  }
  return status;
}

}  // namespace SsoClient::Testing

#endif
