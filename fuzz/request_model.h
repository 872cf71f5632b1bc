#ifndef FUZZ_REQUEST_MODEL_H
#define FUZZ_REQUEST_MODEL_H

#include <string>

#include <ssoclient/token_spec.h>

#include "xml_elements.h"

namespace Fuzz {

enum class Operation { kPassword, kFirstLeg, kNextLeg, kCertificate, kToken, kValidate, kRenew };

/// A request as its caller describes it.
struct RequestCase {
  Operation operation = Operation::kPassword;
  SsoClient::TokenSpec spec;
  std::string userName;
  std::string password;
  std::string leg;
  std::string contextId;
  std::string token;
  std::string actAs;
  std::string tokenId;
  /// Base64 of the certificate; empty without a key.
  std::string certificate;
  /// Microseconds since 1970.
  long now = 0;

  bool HasKey() const { return !certificate.empty(); }
  bool IsForKey() const;
  bool IsSigned() const;
  bool SendsToken() const { return operation >= Operation::kToken; }
  bool SendsSpec() const;
};

/// The request that a service must be able to read: written from the standards, not from the code
/// that builds it. The certificate must be valid, and the token well-formed.
Element ExpectedRequest(const RequestCase& request);

/// `element` with empty values in all signatures.
Element WithoutValues(Element element);

}  // namespace Fuzz

#endif
