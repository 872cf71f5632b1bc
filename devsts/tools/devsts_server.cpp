// Runs the service until SIGTERM or SIGINT, or the end of standard input if so asked.
#include <poll.h>
#include <sys/signalfd.h>
#include <unistd.h>

#include <array>
#include <csignal>
#include <exception>
#include <filesystem>
#include <iostream>
#include <mutex>
#include <optional>
#include <string_view>

#include "devsts/server.h"
#include "program.h"

namespace {

constexpr std::string_view kUsage =
    "usage: devsts_server [--http-port N] [--https-port N] [--address ADDRESS] [--out DIR]\n"
    "                     [--vendor-host HOST] [--solution-host HOST] [--end-with-stdin]\n"
    "Port 0 takes a free one. DIR receives ca.pem and signing.pem.\n";

struct Arguments {
  DevSts::ServerOptions options;
  std::optional<std::string> folder;
  bool endWithStdin = false;
};

std::uint16_t PortFrom(const std::string& text) {
  std::size_t used = 0;
  const unsigned long port = std::stoul(text, &used);
  if (used != text.size() || port > 65535) {
    throw std::invalid_argument("not a port: " + text);
  }
  return static_cast<std::uint16_t>(port);
}

void Take(const std::string& name, const std::string& value, Arguments& arguments) {
  DevSts::ServerOptions& options = arguments.options;
  if (name == "--http-port") {
    options.httpPort = PortFrom(value);
  } else if (name == "--https-port") {
    options.httpsPort = PortFrom(value);
  } else if (name == "--address") {
    options.address = value;
  } else if (name == "--vendor-host") {
    options.vendorHost = value;
  } else if (name == "--solution-host") {
    options.solutionHost = value;
  } else if (name == "--out") {
    arguments.folder = value;
  } else {
    throw std::invalid_argument("unknown option: " + name);
  }
}

Arguments Parse(int argc, char** argv) {
  Arguments arguments;
  for (int i = 1; i < argc; ++i) {
    const std::string name = argv[i];
    if (name == "--end-with-stdin") {
      arguments.endWithStdin = true;
      continue;
    }
    if (++i == argc) {
      throw std::invalid_argument("no value for " + name);
    }
    Take(name, argv[i], arguments);
  }
  return arguments;
}

// The request's body is left out: it holds the password.
void PrintRequest(const DevSts::ReceivedRequest& request) {
  static std::mutex mutex;
  const std::lock_guard lock(mutex);
  std::cout << "request connection=" << request.connectionId << " tls=" << request.overTls
            << " action=" << request.Header("SOAPAction") << " status=" << request.answeredStatus;
  if (!request.answeredFault.empty()) {
    std::cout << " fault=" << request.answeredFault;
  }
  std::cout << std::endl;
}

sigset_t EndSignals() {
  sigset_t signals;
  sigemptyset(&signals);
  sigaddset(&signals, SIGTERM);
  sigaddset(&signals, SIGINT);
  return signals;
}

void WaitForEnd(int signalDescriptor, bool watchStdin) {
  std::array<pollfd, 2> entries{
      {{signalDescriptor, POLLIN, 0}, {watchStdin ? STDIN_FILENO : -1, POLLIN, 0}}};
  for (;;) {
    if (poll(entries.data(), entries.size(), -1) < 0 || entries[0].revents != 0) {
      return;
    }
    std::array<char, 256> ignored{};
    if (entries[1].revents != 0 && read(STDIN_FILENO, ignored.data(), ignored.size()) <= 0) {
      return;
    }
  }
}

void Run(Arguments arguments) {
  const sigset_t signals = EndSignals();
  pthread_sigmask(SIG_BLOCK, &signals, nullptr);
  const int signalDescriptor = signalfd(-1, &signals, SFD_CLOEXEC);

  arguments.options.onRequest = PrintRequest;
  const DevSts::Server server(std::move(arguments.options));
  if (arguments.folder) {
    std::filesystem::create_directories(*arguments.folder);
    DevSts::WriteFile(*arguments.folder + "/ca.pem", server.CaCertificatePem());
    DevSts::WriteFile(*arguments.folder + "/signing.pem", server.SigningCertificatePem());
  }
  std::cout << "http_url=" << server.HttpUrl() << "\nhttps_url=" << server.HttpsUrl() << std::endl;
  WaitForEnd(signalDescriptor, arguments.endWithStdin);
  close(signalDescriptor);
}

}  // namespace

int main(int argc, char** argv) {
  try {
    Run(Parse(argc, argv));
    return 0;
  } catch (const std::invalid_argument& error) {
    std::cerr << "devsts_server: " << error.what() << '\n' << kUsage;
    return 2;
  } catch (const std::exception& error) {
    std::cerr << "devsts_server: " << error.what() << '\n';
    return 1;
  }
}
