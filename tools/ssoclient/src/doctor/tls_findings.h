#ifndef SSOCLIENT_TOOL_DOCTOR_TLS_FINDINGS_H
#define SSOCLIENT_TOOL_DOCTOR_TLS_FINDINGS_H

#include <string>

#include "doctor/report.h"

namespace SsoClient::Tool::Doctor {

/// What the probes of TLS have shown.
struct TlsFacts {
  std::string protocol{};  ///< of a handshake that is done, such as "TLSv1.3"
  std::string cipher{};
  std::string oldProtocol{};  ///< what is spoken instead, below TLS 1.2
  std::string weakCipher{};   ///< the suite that is spoken instead
  std::string firstOctets{};  ///< what the service sent first
  std::string plainAnswer{};  ///< its answer to a plain HTTP request
  std::string error{};
  int alert = -1;
  bool isConnected = true;
  bool isTimedOut = false;
  bool isClosed = false;
  bool asksForCertificate = false;
};

/// What that means.
Finding FindingOfTls(const TlsFacts& facts, int port);

/// The name of an alert (RFC 8446, section 6), such as "protocol_version", or its number.
std::string AlertName(int alert);

}  // namespace SsoClient::Tool::Doctor

#endif
