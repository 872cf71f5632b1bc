#ifndef SSOCLIENT_TOOL_DOCTOR_TLS_PROBE_H
#define SSOCLIENT_TOOL_DOCTOR_TLS_PROBE_H

#include <memory>
#include <string>
#include <vector>

#include <openssl/x509.h>

#include "doctor/address.h"
#include "doctor/time_limit.h"

namespace SsoClient::Tool::Doctor {

struct FreeX509 {
  void operator()(X509* certificate) const noexcept { X509_free(certificate); }
};
using OwnedX509 = std::unique_ptr<X509, FreeX509>;

/// What a probe offers to the service.
enum class TlsOffer {
  kLibrary,     ///< what the library offers: TLS 1.2 and 1.3 with authenticated encryption
  kOldVersion,  ///< TLS 1.0 and 1.1 only, which no client should speak any longer (RFC 8996)
  kAnySuite,    ///< TLS 1.2 with every cipher suite, also those without encryption
};

/// How a handshake went.
struct TlsAttempt {
  std::string protocol{};  ///< such as "TLSv1.3", if it is done
  std::string cipher{};
  /// What the service sent first, at most 64 octets.
  std::string firstOctets{};
  std::string error{};  ///< of OpenSSL, if it failed
  /// The certificates that the service sent, its own first.
  std::vector<OwnedX509> chain{};
  int alert = -1;  ///< the fatal alert of the service (RFC 8446, section 6), -1 if none
  bool isConnected = false;
  bool isDone = false;
  bool isTimedOut = false;
  bool isClosed = false;  ///< the service ended the connection
  bool asksForCertificate = false;
};

/// Begins a TLS connection without verifying the peer, sends nothing on it and closes it.
/// `serverName` is sent as SNI unless it is an address.
TlsAttempt TryTls(const Address& address, const std::string& serverName, TlsOffer offer,
                  TimeLimit::Clock::time_point end);

/// Sends a plain HTTP request without a body for "/" and returns the beginning of the answer.
std::string TryPlainHttp(const Address& address, const std::string& host,
                         TimeLimit::Clock::time_point end);

/// Whether octets are the start of an HTTP answer, or of a TLS record (RFC 8446, section 5.1).
bool IsHttp(const std::string& octets);
bool IsTlsRecord(const std::string& octets);

}  // namespace SsoClient::Tool::Doctor

#endif
