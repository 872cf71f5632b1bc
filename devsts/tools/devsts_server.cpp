// Runs the service until SIGTERM or SIGINT, or the end of standard input if so asked. Standard
// input carries commands then.
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
#include <string>
#include <string_view>

#include "devsts/server.h"
#include "program.h"

namespace {

constexpr std::string_view kUsage =
    "usage: devsts_server [--http-port N] [--https-port N] [--address ADDRESS] [--out DIR]\n"
    "                     [--vendor-host HOST] [--solution-host HOST] [--end-with-stdin]\n"
    "                     [--no-resumption]\n"
    "Port 0 takes a free one. DIR receives ca.pem and signing.pem, and client.pem and\n"
    "client-key.pem, by which machine@EXAMPLE.COM may ask for tokens.\n"
    "With --end-with-stdin, each line of standard input is a command: revoke ID.\n"
    "With --no-resumption, TLS sessions are not resumed.\n";

constexpr char kClientUser[] = "machine@EXAMPLE.COM";

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
    if (name == "--no-resumption") {
      arguments.options.tls.sessionResumption = false;
      continue;
    }
    if (++i == argc) {
      throw std::invalid_argument("no value for " + name);
    }
    Take(name, argv[i], arguments);
  }
  return arguments;
}

// One line at a time, whichever thread writes it.
std::mutex outputMutex;

// The request's body is left out: it holds the password.
void PrintRequest(const DevSts::ReceivedRequest& request) {
  const std::lock_guard lock(outputMutex);
  const auto signature = static_cast<std::size_t>(request.signature);
  constexpr std::array<const char*, 4> kSignatures{"none", "certificate", "token", "other"};
  std::cout << "request connection=" << request.connectionId << " tls=" << request.overTls
            << " resumed=" << request.tlsSessionReused << " action=" << request.Header("SOAPAction")
            << " signature=" << kSignatures.at(signature) << " status=" << request.answeredStatus;
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

void Obey(const std::string& command, DevSts::Server& server) {
  constexpr std::string_view kRevoke = "revoke ";
  const std::lock_guard lock(outputMutex);
  if (command.rfind(kRevoke, 0) != 0) {
    std::cout << "unknown command: " << command << std::endl;
    return;
  }
  const std::string id = command.substr(kRevoke.size());
  std::cout << (server.Revoke(id) ? "revoked " : "no such token: ") << id << std::endl;
}

// Takes the complete lines off the text.
void ObeyLines(std::string& text, DevSts::Server& server) {
  for (std::size_t end = text.find('\n'); end != std::string::npos; end = text.find('\n')) {
    Obey(text.substr(0, end), server);
    text.erase(0, end + 1);
  }
}

// False at the end of standard input.
bool TakeInput(std::string& text, DevSts::Server& server) {
  std::array<char, 256> octets{};
  const ssize_t size = read(STDIN_FILENO, octets.data(), octets.size());
  if (size <= 0) {
    return false;
  }
  text.append(octets.data(), static_cast<std::size_t>(size));
  ObeyLines(text, server);
  return true;
}

void WaitForEnd(int signalDescriptor, bool watchStdin, DevSts::Server& server) {
  std::array<pollfd, 2> entries{
      {{signalDescriptor, POLLIN, 0}, {watchStdin ? STDIN_FILENO : -1, POLLIN, 0}}};
  std::string input;
  for (;;) {
    if (poll(entries.data(), entries.size(), -1) < 0 || entries[0].revents != 0) {
      return;
    }
    if (entries[1].revents != 0 && !TakeInput(input, server)) {
      return;
    }
  }
}

void WriteFiles(const std::string& folder, DevSts::Server& server) {
  const DevSts::Credential client = server.MakeClientCredential("machine");
  server.RegisterCertificate(kClientUser, client.certificatePem);
  std::filesystem::create_directories(folder);
  DevSts::WriteFile(folder + "/ca.pem", server.CaCertificatePem());
  DevSts::WriteFile(folder + "/signing.pem", server.SigningCertificatePem());
  DevSts::WriteFile(folder + "/client.pem", client.certificatePem);
  DevSts::WriteSecretFile(folder + "/client-key.pem", client.privateKeyPem);
}

void Run(Arguments arguments) {
  const sigset_t signals = EndSignals();
  pthread_sigmask(SIG_BLOCK, &signals, nullptr);
  const int signalDescriptor = signalfd(-1, &signals, SFD_CLOEXEC);

  arguments.options.onRequest = PrintRequest;
  DevSts::Server server(std::move(arguments.options));
  if (arguments.folder) {
    WriteFiles(*arguments.folder, server);
  }
  std::cout << "http_url=" << server.HttpUrl() << "\nhttps_url=" << server.HttpsUrl() << std::endl;
  WaitForEnd(signalDescriptor, arguments.endWithStdin, server);
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
