// Loads a plug-in that uses a token source, and unloads it, again and again; the host has only the
// service. The plug-in goes away each time, and the libraries that it is linked to stay, since
// their threads go on: host PLUGIN CYCLES LIBRARY...
#include <iostream>

#include <dlfcn.h>

#include <devsts/server.h>

#include "plugin/host_cycles.h"
#include "plugin/plugin.h"

namespace {

bool UsePlugin(void* handle, const DevSts::Server& sts) {
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
  return true;
}

}  // namespace

int main(int argc, char** argv) {
  const DevSts::Server sts;
  return SsoClient::Testing::RunCycles(argc, argv,
                                       [&](void* handle) { return UsePlugin(handle, sts); });
}
