#ifndef SSOCLIENT_TOOL_DOCTOR_EXAMINATION_H
#define SSOCLIENT_TOOL_DOCTOR_EXAMINATION_H

#include <chrono>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include <ssoclient/holder_of_key_config.h>
#include <ssoclient/negotiation_handler.h>
#include <ssoclient/saml_token.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/ssl/ssl_context.h>

#include "doctor/address.h"
#include "doctor/report.h"
#include "doctor/time_limit.h"
#include "doctor/tls_probe.h"
#include "input/secret_text.h"
#include "output/console.h"
#include "service/service_address.h"

namespace SsoClient::Tool::Doctor {

enum class LoginKind { kNone, kPassword, kCertificate, kKerberos };

/// What the user asked for.
struct Plan {
  std::string url{};
  std::string peerName{};
  std::vector<std::string> caFiles{};
  std::vector<std::string> crlFiles{};
  std::vector<std::string> stsCertificateFiles{};
  std::string user{};
  std::string certificateFile{};
  /// May be that of the certificate; empty if the key is not in a file.
  std::string keyFile{};
  std::string keytabFile{};
  std::chrono::milliseconds timeout{30000};
  LoginKind login = LoginKind::kNone;
  bool isHttpAllowed = false;  ///< for a login
  /// The TLS trust of the options. Throws an exception when it cannot be made.
  std::function<Tarnik::Ref<Tarnik::Ssl::SSLContext>()> makeSslContext{};
  /// The password. May ask the user; throws `ToolException`.
  std::function<SecretText()> readPassword{};
  /// The key and its certificate. May ask the user for a passphrase; throws `ToolException`.
  std::function<HolderOfKeyConfig()> loadIdentity{};
  /// Throws `ToolException` when others can use the keytab.
  std::function<void()> checkKeytab{};
  /// The legs of a login by Kerberos to the service on `host`. Throws `ToolException`.
  std::function<std::shared_ptr<NegotiationHandler>(const std::string& host)> makeKerberosHandler{};
};

/// The answer to the harmless request.
struct HttpAnswer {
  std::string reason{};
  std::string contentType{};
  std::string location{};
  std::string server{};
  std::string body{};
  std::optional<std::string> date{};
  /// Unix time in microseconds on this machine before and after the exchange.
  long sentAt = 0;
  long receivedAt = 0;
  int status = 0;
};

/// What the steps have found out for those after them.
struct Examination {
  Examination(const Plan& thePlan, const Console& theConsole)
      : plan(thePlan), console(theConsole), limit(thePlan.timeout) {}

  const Plan& plan;
  const Console& console;
  TimeLimit limit;
  ServiceAddress service{};
  Tarnik::Ref<Tarnik::Ssl::SSLContext> sslContext{};
  std::vector<Tarnik::Ref<const Tarnik::Crypto::Certificate>> signers{};
  std::optional<HolderOfKeyConfig> identity{};
  std::vector<Address> addresses{};
  /// The first address that accepts connections.
  Address reachable{};
  TlsAttempt tls{};
  std::optional<HttpAnswer> answer{};
  std::shared_ptr<const SamlToken> token{};

  /// The name that the certificate of the service must have.
  const std::string& ExpectedName() const {
    return plan.peerName.empty() ? service.host : plan.peerName;
  }
};

}  // namespace SsoClient::Tool::Doctor

#endif
