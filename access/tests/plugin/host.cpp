// Loads a plug-in that uses a token source, and unloads it, again and again; the host has only the
// service. The plug-in goes away each time, and the libraries that it is linked to stay, since
// their threads go on: host PLUGIN CYCLES LIBRARY...
#include <cstdlib>
#include <iostream>

#include <dlfcn.h>

#include <devsts/server.h>

#include "plugin/plugin.h"

namespace {

bool IsLoaded(const char* library) {
  void* handle = dlopen(library, RTLD_NOW | RTLD_NOLOAD);
  if (handle != nullptr) {
    dlclose(handle);
  }
  return handle != nullptr;
}

bool RunCycle(const char* plugin, const DevSts::Server& sts) {
  void* handle = dlopen(plugin, RTLD_NOW | RTLD_LOCAL);
  if (handle == nullptr) {
    std::cerr << dlerror() << '\n';
    return false;
  }
  const auto use = reinterpret_cast<decltype(UseTokenSource)*>(dlsym(handle, "UseTokenSource"));
  if (use == nullptr) {
    std::cerr << dlerror() << '\n';
    return false;
  }
  const char* const failure = use(sts.HttpsUrl().c_str(), sts.CaCertificatePem().c_str(),
                                  sts.SigningCertificatePem().c_str());
  if (failure != nullptr) {
    std::cerr << failure << '\n';
    return false;
  }
  dlclose(handle);
  if (IsLoaded(plugin)) {
    std::cerr << "The plug-in was not unloaded.\n";
    return false;
  }
  return true;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc < 4) {
    return 2;
  }
  const DevSts::Server sts;
  const int cycles = std::atoi(argv[2]);
  for (int i = 0; i < cycles; ++i) {
    if (!RunCycle(argv[1], sts)) {
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
