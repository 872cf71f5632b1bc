// A server over TLS for callers whose tokens a gate accepts. Prints its port, and logs to the
// standard error stream. SIGHUP reads the trusted certificates, which are otherwise read when they
// have changed; SIGTERM and SIGINT end the server.
#include <chrono>
#include <csignal>
#include <cstdlib>
#include <exception>
#include <iostream>
#include <memory>
#include <string>

#include <boost/asio/signal_set.hpp>
#include <boost/asio/thread_pool.hpp>

#include <ssoclient/access/token_gate.h>

#include "server.h"
#include "tls.h"

namespace {

using SsoClient::Access::BearerTokens;
using SsoClient::Access::TrustStore;

constexpr std::size_t kThreads = 2;

std::shared_ptr<TrustStore> MakeTrustStore(const std::string& issuerName,
                                           const std::string& certificatePath) {
  SsoClient::Access::TrustedIssuer issuer;
  issuer.issuer = issuerName;
  issuer.certificatePaths = {certificatePath};
  SsoClient::Access::TrustStoreConfig config;
  config.name = "guarded_server";
  config.issuers = {issuer};
  config.listener = SsoClient::Access::CreateTrustLogListener();
  return SsoClient::Access::CreateTrustStore(config);
}

void Reload(TrustStore& trust) {
  try {
    trust.Reload();
    std::cerr << "the trust was read\n";
  } catch (const std::exception& e) {
    std::cerr << "the trust stays as it was: " + std::string(e.what()) + '\n';
  }
}

void HandleSignals(boost::asio::signal_set& signals, TrustStore& trust,
                   GuardedServer::Server& server) {
  signals.async_wait([&](const boost::system::error_code&, int signal) {
    if (signal != SIGHUP) {
      server.Stop();
      return;
    }
    Reload(trust);
    HandleSignals(signals, trust, server);
  });
}

}  // namespace

int main(int argc, char** argv) try {
  const std::string rule = argc < 7 ? "" : argv[6];
  if ((argc != 7 && argc != 8) || (rule != "refuse" && rule != "accept")) {
    std::cerr << "usage: guarded_server CERTIFICATE_FILE KEY_FILE ISSUER STS_CERTIFICATES OWN_NAME"
                 " refuse|accept [TIME_LIMIT_IN_MILLISECONDS]\n"
                 "The word before the last says what to do with bearer tokens.\n";
    return 2;
  }
  std::signal(SIGPIPE, SIG_IGN);  // when nobody reads the log
  const auto trust = MakeTrustStore(argv[3], argv[4]);
  SsoClient::Access::GateConfig config;
  config.name = "guarded_server";
  config.trust = trust;
  config.audiences = {argv[5]};
  config.bearerTokens = rule == "accept" ? BearerTokens::kAccept : BearerTokens::kRefuse;
  GuardedServer::ConnectionConfig connection;
  connection.guard =
      std::make_shared<GuardedServer::Guard>(SsoClient::Access::CreateTokenGate(config));
  connection.tls = GuardedServer::MakeTlsContext(argv[1], argv[2]);
  if (argc == 8) {
    connection.timeLimit = std::chrono::milliseconds(std::stoi(argv[7]));
  }

  boost::asio::thread_pool pool(kThreads);
  GuardedServer::Server server(pool, connection);
  boost::asio::signal_set signals(pool, SIGHUP, SIGTERM, SIGINT);
  HandleSignals(signals, *trust, server);
  server.Start();
  std::cout << "port=" << server.Port() << std::endl;
  pool.join();
  return 0;
} catch (const std::exception& e) {
  std::cerr << "guarded_server: " << e.what() << '\n';
  return 1;
}
