#ifndef SSOCLIENT_TESTS_INTEGRATION_WIRE_REQUEST_H
#define SSOCLIENT_TESTS_INTEGRATION_WIRE_REQUEST_H

#include <string>
#include <vector>

namespace SsoClient::Testing {

/// The properties that distinguish requests, read from the octets that a server received.
struct WireRequest {
  /// Local names of the entries of the Security header, in order.
  std::vector<std::string> securityEntries;
  /// The local name of the child of the SecurityTokenReference in the signature's KeyInfo; empty
  /// without a signature.
  std::string keyReference;
  /// "PublicKey" or "Bearer"; empty without a KeyType.
  std::string keyType;
  /// The Sig attribute of UseKey; empty without one.
  std::string useKey;
};

WireRequest ReadWireRequest(const std::string& body);

/// The octets of the first assertion in `text`.
std::string AssertionIn(const std::string& text);

}  // namespace SsoClient::Testing

#endif
