#include "doctor/tls_findings.h"

#include <algorithm>

#include <openssl/ssl.h>

#include <tarnik/text/display_text.h>

#include "doctor/tls_probe.h"

namespace SsoClient::Tool::Doctor {
namespace {

constexpr std::size_t kShownOctets = 40;

std::string FirstLine(const std::string& octets) {
  const std::string line = octets.substr(0, octets.find_first_of("\r\n"));
  return Tarnik::ToDisplayText(line, kShownOctets);
}

Finding NotTls(const TlsFacts& facts, const std::string& where) {
  if (IsHttp(facts.firstOctets) || IsHttp(facts.plainAnswer)) {
    return Failure(ExitStatus::kUnreachable, "http-on-https-port",
                   where + " speaks plain HTTP, not TLS",
                   "use the https port of the service, or an http URL if the service runs on this "
                   "machine");
  }
  return Failure(ExitStatus::kUnreachable, "not-tls",
                 where + " does not speak TLS; it sends '" + FirstLine(facts.firstOctets) + "'",
                 "check the port of the URL: another service answers there");
}

Finding Refused(const TlsFacts& facts, const std::string& where) {
  const std::string reason = facts.alert >= 0 ? "the alert " + AlertName(facts.alert) : facts.error;
  if (facts.asksForCertificate) {
    return Failure(ExitStatus::kUnreachable, "client-certificate-required",
                   where + " requires a TLS certificate of the client (" + reason + ")",
                   "use a port of the service that requires none");
  }
  if (!facts.oldProtocol.empty()) {
    return Failure(ExitStatus::kUnreachable, "tls-too-old",
                   where + " speaks only " + facts.oldProtocol + ", which is insecure (RFC 8996)",
                   "enable TLS 1.2 or 1.3 at the service");
  }
  if (!facts.weakCipher.empty()) {
    return Failure(ExitStatus::kUnreachable, "tls-weak-ciphers",
                   where + " offers only weak cipher suites, such as " + facts.weakCipher,
                   "enable suites with ECDHE and AES-GCM or ChaCha20-Poly1305 at the service");
  }
  return Failure(ExitStatus::kUnreachable, "tls-refused",
                 where + " refuses the TLS handshake: " + reason,
                 "look into the log of the service; a name that it does not serve is a common "
                 "reason");
}

}  // namespace

Finding FindingOfTls(const TlsFacts& facts, int port) {
  const std::string where = "port " + std::to_string(port);
  if (!facts.protocol.empty()) {
    return Fine(facts.protocol + " with " + facts.cipher);
  }
  if (!facts.isConnected) {
    return Failure(ExitStatus::kUnreachable, "tls-no-connection",
                   where + " did not accept a second connection",
                   "check whether the service or a firewall limits connections");
  }
  if (!facts.firstOctets.empty() && !IsTlsRecord(facts.firstOctets)) {
    return NotTls(facts, where);
  }
  if (facts.isTimedOut) {
    return Failure(ExitStatus::kUnreachable, "tls-timed-out",
                   where + " accepts connections but does not answer a TLS handshake in time",
                   "check the port of the URL, and whether the service hangs or is overloaded");
  }
  if (facts.isClosed && facts.alert < 0) {
    if (IsHttp(facts.plainAnswer)) {
      return NotTls(facts, where);
    }
    if (facts.oldProtocol.empty() && facts.weakCipher.empty()) {
      return Failure(ExitStatus::kUnreachable, "tls-closed",
                     where + " ends the connection instead of a TLS handshake",
                     "check the port of the URL, and whether a firewall ends connections");
    }
  }
  return Refused(facts, where);
}

std::string AlertName(int alert) {
  std::string name = SSL_alert_desc_string_long(alert);
  if (name == "unknown") {
    return std::to_string(alert);
  }
  std::replace(name.begin(), name.end(), ' ', '_');
  return name;
}

}  // namespace SsoClient::Tool::Doctor
