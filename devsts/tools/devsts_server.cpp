// Runs the service until SIGTERM or SIGINT. With --end-with-stdin, also reads commands from
// standard input, and ends when it is closed.
#include <array>
#include <chrono>
#include <csignal>
#include <cstdlib>
#include <exception>
#include <filesystem>
#include <iostream>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>

#include <poll.h>
#include <sys/signalfd.h>
#include <unistd.h>

#include "devsts/kerberos_realm.h"
#include "devsts/server.h"
#include "program.h"

namespace {

constexpr std::string_view kUsage =
    "usage: devsts_server [--http-port N] [--https-port N] [--address ADDRESS] [--out DIR]\n"
    "                     [--vendor-host HOST] [--solution-host HOST] [--end-with-stdin]\n"
    "                     [--no-resumption] [--keytab FILE | --realm] [--principal NAME=USER]\n"
    "                     [--request-mic]\n"
    "Port 0 selects a free port. DIR receives ca.pem, signing.pem, client.pem and client-key.pem;\n"
    "machine@EXAMPLE.COM may ask for tokens with the client's key and certificate.\n"
    "With --end-with-stdin, each line of standard input is a command: revoke ID, stall (requests\n"
    "are read and never answered), resume.\n"
    "With --no-resumption, TLS sessions are not resumed.\n"
    "With --keytab, users log in with Kerberos; FILE contains the service's keys. With --realm, "
    "the\n"
    "program starts a realm of its own, in which alice has a ticket. --principal, which may be\n"
    "repeated, maps a Kerberos principal to a user; other principals are the users of the same\n"
    "name. With --request-mic, a login takes two legs.\n";

constexpr char kClientUser[] = "machine@EXAMPLE.COM";

struct Arguments {
  DevSts::ServerOptions options;
  std::optional<std::string> folder;
  bool endWithStdin = false;
  bool startsRealm = false;
  bool requestMic = false;
};

std::uint16_t PortFrom(const std::string& text) {
  std::size_t used = 0;
  const unsigned long port = std::stoul(text, &used);
  if (used != text.size() || port > 65535) {
    throw std::invalid_argument("not a port: " + text);
  }
  return static_cast<std::uint16_t>(port);
}

void MapPrincipal(const std::string& text, DevSts::NegotiationOptions& options) {
  const std::size_t sign = text.find('=');
  if (sign == std::string::npos) {
    throw std::invalid_argument("not NAME=USER: " + text);
  }
  options.principals[text.substr(0, sign)] = text.substr(sign + 1);
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
  } else if (name == "--keytab") {
    options.negotiation.keytab = value;
  } else if (name == "--principal") {
    MapPrincipal(value, options.negotiation);
  } else if (name == "--out") {
    arguments.folder = value;
  } else {
    throw std::invalid_argument("unknown option: " + name);
  }
}

// Returns false if there is no such flag.
bool TakeFlag(const std::string& name, Arguments& arguments) {
  if (name == "--end-with-stdin") {
    arguments.endWithStdin = true;
  } else if (name == "--no-resumption") {
    arguments.options.tls.sessionResumption = false;
  } else if (name == "--realm") {
    arguments.startsRealm = true;
  } else if (name == "--request-mic") {
    arguments.requestMic = true;
  } else {
    return false;
  }
  return true;
}

Arguments Parse(int argc, char** argv) {
  Arguments arguments;
  for (int i = 1; i < argc; ++i) {
    const std::string name = argv[i];
    if (TakeFlag(name, arguments)) {
      continue;
    }
    if (++i == argc) {
      throw std::invalid_argument("no value for " + name);
    }
    Take(name, argv[i], arguments);
  }
  if (arguments.startsRealm && !arguments.options.negotiation.keytab.empty()) {
    throw std::invalid_argument("--keytab and --realm exclude each other");
  }
  return arguments;
}

// Threads write one line at a time.
std::mutex outputMutex;

// Leaves out the request's body, which contains the password.
void PrintRequest(const DevSts::ReceivedRequest& request) {
  const std::lock_guard lock(outputMutex);
  const auto signature = static_cast<std::size_t>(request.signature);
  constexpr std::array<const char*, 4> kSignatures{"none", "certificate", "token", "other"};
  std::cout << "request connection=" << request.connectionId << " tls=" << request.overTls
            << " resumed=" << request.tlsSessionReused << " action=" << request.Header("SOAPAction")
            << " signature=" << kSignatures.at(signature) << " status=" << request.answeredStatus;
  if (request.leg) {
    std::cout << " leg=" << request.leg->ordinal;
  }
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

void Stall(DevSts::Stall stall, DevSts::Server& server) {
  DevSts::Misbehavior misbehavior;
  misbehavior.stall = stall;
  server.SetMisbehavior(misbehavior);
}

void Execute(const std::string& command, DevSts::Server& server) {
  constexpr std::string_view kRevoke = "revoke ";
  const std::lock_guard lock(outputMutex);
  if (command == "stall" || command == "resume") {
    Stall(command == "stall" ? DevSts::Stall::BeforeAnswer : DevSts::Stall::None, server);
    std::cout << (command == "stall" ? "stalled" : "resumed") << std::endl;
    return;
  }
  if (command.rfind(kRevoke, 0) != 0) {
    std::cout << "unknown command: " << command << std::endl;
    return;
  }
  const std::string id = command.substr(kRevoke.size());
  std::cout << (server.Revoke(id) ? "revoked " : "no such token: ") << id << std::endl;
}

// Executes the complete lines and removes them from the text.
void ExecuteLines(std::string& text, DevSts::Server& server) {
  for (std::size_t end = text.find('\n'); end != std::string::npos; end = text.find('\n')) {
    Execute(text.substr(0, end), server);
    text.erase(0, end + 1);
  }
}

// Returns false at the end of standard input.
bool TakeInput(std::string& text, DevSts::Server& server) {
  std::array<char, 256> octets{};
  const ssize_t size = read(STDIN_FILENO, octets.data(), octets.size());
  if (size <= 0) {
    return false;
  }
  text.append(octets.data(), static_cast<std::size_t>(size));
  ExecuteLines(text, server);
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

// A realm in which alice has logged in and the service has a key, with alice's credential cache.
struct StartedRealm {
  DevSts::KerberosRealm realm;
  std::string cache;
};

// Changes the environment, so it must be called while there is only one thread.
std::unique_ptr<StartedRealm> StartRealm(DevSts::ServerOptions& options) {
  auto started = std::make_unique<StartedRealm>();
  options.negotiation.keytab = started->realm.AddKeytab("HTTP/localhost");
  started->realm.AddUser("alice", "secret");
  started->cache = started->realm.Login("alice", "secret", std::chrono::hours(8));
  setenv("KRB5_CONFIG", started->realm.ConfigPath().c_str(), 1);
  return started;
}

void Run(Arguments arguments) {
  const sigset_t signals = EndSignals();
  pthread_sigmask(SIG_BLOCK, &signals, nullptr);
  const int signalDescriptor = signalfd(-1, &signals, SFD_CLOEXEC);

  std::unique_ptr<StartedRealm> realm;
  if (arguments.startsRealm) {
    realm = StartRealm(arguments.options);
  }
  arguments.options.onRequest = PrintRequest;
  DevSts::Server server(std::move(arguments.options));
  server.SetNegotiationScript({.requestMic = arguments.requestMic});
  if (arguments.folder) {
    WriteFiles(*arguments.folder, server);
  }
  std::cout << "http_url=" << server.HttpUrl() << "\nhttps_url=" << server.HttpsUrl() << std::endl;
  if (realm != nullptr) {
    std::cout << "krb5_config=" << realm->realm.ConfigPath() << "\nkrb5_cache=" << realm->cache
              << "\nservice=HTTP@localhost" << std::endl;
  }
  WaitForEnd(signalDescriptor, arguments.endWithStdin, server);
  close(signalDescriptor);
}

}  // namespace

int main(int argc, char** argv) {
  if (argc == 2 && std::string(argv[1]) == "--help") {
    std::cout << kUsage;
    return 0;
  }
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
