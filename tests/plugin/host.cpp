// Loads a plug-in, runs failing calls in it on several threads, and unloads it, again and again.
// The plug-in goes away each time, and the libraries that it is linked to stay, since their threads
// may still end the calls: host PLUGIN CYCLES LIBRARY...
#include <atomic>
#include <cstdlib>
#include <iostream>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include <arpa/inet.h>
#include <dlfcn.h>
#include <netinet/in.h>
#include <sys/socket.h>

#include "plugin/host_cycles.h"
#include "plugin/plugin.h"

namespace {

constexpr int kSyncCalls = 3;
constexpr int kAsyncCalls = 3;

/// A URL at a port of the loopback interface that this process keeps without listening.
std::string ClosedUrl() {
  const int socket = ::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
  sockaddr_in address = {};
  address.sin_family = AF_INET;
  address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
  socklen_t size = sizeof(address);
  if (bind(socket, reinterpret_cast<sockaddr*>(&address), size) != 0 ||
      getsockname(socket, reinterpret_cast<sockaddr*>(&address), &size) != 0) {
    std::abort();
  }
  return "http://127.0.0.1:" + std::to_string(ntohs(address.sin_port)) + "/sts";
}

struct Counts {
  std::atomic<int> failures{0};
  std::atomic<int> callbacks{0};
};

/// Returns the number of calls that failed as they should.
int RunCalls(decltype(RunFailingCall)* run, const std::string& url) {
  // Shared with the callbacks, which may return later than this function.
  const auto counts = std::make_shared<Counts>();
  const SsoClient::SecurityTokenService::TokenCallback callback =
      [counts](const auto& token, const Tarnik::Exception* error) {
        counts->failures += token == nullptr && error != nullptr ? 1 : 0;
        ++counts->callbacks;
        counts->callbacks.notify_one();
      };
  for (int i = 0; i < kAsyncCalls; ++i) {
    run(url.c_str(), &callback);
  }
  std::vector<std::thread> threads;
  for (int i = 0; i < kSyncCalls; ++i) {
    threads.emplace_back([&] { counts->failures += run(url.c_str(), nullptr) ? 1 : 0; });
  }
  for (auto& thread : threads) {
    thread.join();
  }
  for (int ended = counts->callbacks; ended < kAsyncCalls; ended = counts->callbacks) {
    counts->callbacks.wait(ended);
  }
  return counts->failures;
}

bool UsePlugin(void* handle, const std::string& url) {
  const auto run = reinterpret_cast<decltype(RunFailingCall)*>(dlsym(handle, "RunFailingCall"));
  const int failures = run == nullptr ? 0 : RunCalls(run, url);
  if (failures != kSyncCalls + kAsyncCalls) {
    std::cerr << failures << " calls failed as they should\n";
    return false;
  }
  return true;
}

}  // namespace

int main(int argc, char** argv) {
  const std::string url = ClosedUrl();
  return SsoClient::Testing::RunCycles(argc, argv,
                                       [&](void* handle) { return UsePlugin(handle, url); });
}
