#include "support/software_tpm.h"

#include <chrono>
#include <cstdlib>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include <arpa/inet.h>
#include <fcntl.h>
#include <netinet/in.h>
#include <signal.h>
#include <spawn.h>
#include <sys/socket.h>
#include <sys/wait.h>
#include <unistd.h>

#include "support/child_process.h"

extern char** environ;

namespace Tarnik::Testing {
namespace {

constexpr int kAttempts = 20;
constexpr std::chrono::seconds kStartLimit{20};

class Socket {
 public:
  Socket() : descriptor_(socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {}
  ~Socket() { close(descriptor_); }
  Socket(const Socket&) = delete;
  Socket& operator=(const Socket&) = delete;

  bool Bind(int port) const {
    const sockaddr_in address = Loopback(port);
    return bind(descriptor_, reinterpret_cast<const sockaddr*>(&address), sizeof(address)) == 0;
  }
  bool Connect(int port) const {
    const sockaddr_in address = Loopback(port);
    return connect(descriptor_, reinterpret_cast<const sockaddr*>(&address), sizeof(address)) == 0;
  }
  int Port() const {
    sockaddr_in address{};
    socklen_t length = sizeof(address);
    getsockname(descriptor_, reinterpret_cast<sockaddr*>(&address), &length);
    return ntohs(address.sin_port);
  }

 private:
  static sockaddr_in Loopback(int port) {
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    address.sin_port = htons(static_cast<in_port_t>(port));
    return address;
  }

  int descriptor_;
};

/// The first of two free ports in a row: clients use the second for the control channel.
int FreePortPair() {
  for (int i = 0; i < kAttempts; ++i) {
    const Socket first;
    const Socket second;
    if (first.Bind(0) && first.Port() < 65535 && second.Bind(first.Port() + 1)) {
      return first.Port();
    }
  }
  throw std::runtime_error("test set-up failed: no two free ports");
}

}  // namespace

bool SoftwareTpm::IsInstalled() {
  return std::system("command -v swtpm tpm2_createprimary >/dev/null") == 0;
}

SoftwareTpm::SoftwareTpm() {
  // Another process may take the ports in between: then the program ends and other ports are tried.
  for (int i = 0; i < kAttempts; ++i) {
    const int port = FreePortPair();
    StartOn(port);
    if (AwaitConnections(port)) {
      location_ = "swtpm:host=127.0.0.1,port=" + std::to_string(port);
      return;
    }
    Stop();
  }
  throw std::runtime_error("test set-up failed: the TPM does not start");
}

SoftwareTpm::~SoftwareTpm() {
  Stop();
}

void SoftwareTpm::StartOn(int port) {
  std::vector<std::string> words = {"swtpm",
                                    "socket",
                                    "--tpm2",
                                    "--tpmstate",
                                    "dir=" + folder_.Path(),
                                    "--server",
                                    "type=tcp,bindaddr=127.0.0.1,port=" + std::to_string(port),
                                    "--ctrl",
                                    "type=tcp,bindaddr=127.0.0.1,port=" + std::to_string(port + 1),
                                    "--flags",
                                    "not-need-init,startup-clear"};
  std::vector<char*> arguments;
  for (std::string& word : words) {
    arguments.push_back(word.data());
  }
  arguments.push_back(nullptr);
  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  posix_spawn_file_actions_addopen(&actions, STDERR_FILENO, "/dev/null", O_WRONLY, 0);
  const int failed =
      posix_spawnp(&process_, words[0].c_str(), &actions, nullptr, arguments.data(), environ);
  posix_spawn_file_actions_destroy(&actions);
  if (failed != 0) {
    process_ = -1;
    throw std::runtime_error("test set-up failed: the TPM cannot be run");
  }
}

bool SoftwareTpm::AwaitConnections(int port) {
  const auto limit = std::chrono::steady_clock::now() + kStartLimit;
  while (std::chrono::steady_clock::now() < limit) {
    if (Socket().Connect(port)) {
      return true;
    }
    if (waitpid(process_, nullptr, WNOHANG) != 0) {
      process_ = -1;
      return false;
    }
    std::this_thread::sleep_for(std::chrono::milliseconds(5));
  }
  return false;
}

void SoftwareTpm::Stop() {
  if (process_ > 0) {
    kill(process_, SIGTERM);
    waitpid(process_, nullptr, 0);
    process_ = -1;
  }
}

void SoftwareTpm::MakeKey(const std::string& algorithm, const std::string& attributes,
                          const std::string& pin, const std::string& handle) const {
  const std::string context = folder_.Path() + "/key.ctx";
  const std::string output =
      Run("tpm2_createprimary -Q -C o -G " + algorithm + " -a '" + attributes + "' -p " + pin +
          " -c " + context + " && tpm2_evictcontrol -Q -C o -c " + context + " " + handle +
          " && tpm2_flushcontext -t && echo made");
  if (output != "made\n") {
    throw std::runtime_error("test set-up failed: " + output);
  }
}

std::string SoftwareTpm::Run(const std::string& command) const {
  const std::string located = "export TPM2TOOLS_TCTI=" + location_ +
                              " TPM2OPENSSL_TCTI=" + location_ + " TSS2_LOG=all+none; " + command;
  return RunInShell(located).output;
}

}  // namespace Tarnik::Testing
