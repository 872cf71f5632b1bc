// Sends the library's log lines, including the steps of each operation, to the server's own log:
// to standard output, with the priority that the systemd journal reads at the start of a line.
#include <iostream>
#include <string>

#include <syslog.h>

#include <ssoclient/ssoclient.h>
#include <tarnik/service/log.h>

// The priority of a line for syslog, whose scale ends earlier and is finer at its start.
static int SyslogPriority(int level) {
  constexpr int kPriorities[] = {LOG_CRIT,   LOG_CRIT, LOG_ERR,   LOG_ERR,   LOG_WARNING,
                                 LOG_NOTICE, LOG_INFO, LOG_DEBUG, LOG_DEBUG, LOG_DEBUG};
  return kPriorities[level];
}

int main(int argc, char** argv) {
  if (argc != 5) {
    std::cerr << "usage: log_operations URL CA_FILE STS_CERTIFICATE_FILE USER < password\n";
    return 2;
  }
  std::string password;
  std::getline(std::cin, password);
  // First, so that no line goes to the default sink.
  Tarnik::Service::SetLogLevel("SsoClient", 7);
  Tarnik::Service::SetLogSink([](const Tarnik::Service::LogRecord& line) {
    std::cout << '<' << SyslogPriority(line.level) << '>' << line.text << '\n';
  });
  try {
    Tarnik::Ssl::SSLContextConfig tls;
    tls.caFiles = {argv[2]};
    const auto sslContext = Tarnik::Ssl::CreateSSLContext(tls);
    const auto trustedKeys = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
        Tarnik::Crypto::LoadCertificates(argv[3]));
    SsoClient::SecurityTokenServiceConfig config;
    config.url = argv[1];
    config.sslContext = sslContext.get();
    config.tokenFactory = SsoClient::CreateSamlTokenFactory(trustedKeys.get());

    SsoClient::TokenSpec spec;
    spec.tokenLifetimeSec = 3600;
    SsoClient::CreateSecurityTokenService(config)->AcquireToken(argv[4], password, spec);
    return 0;
  } catch (const std::exception& e) {
    std::cerr << "No token: " << e.what() << '\n';
    return 1;
  }
}
