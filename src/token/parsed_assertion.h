#ifndef SSOCLIENT_TOKEN_PARSED_ASSERTION_H
#define SSOCLIENT_TOKEN_PARSED_ASSERTION_H

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include <ssoclient/advice.h>
#include <ssoclient/confirmation_type.h>
#include <ssoclient/delegate.h>
#include <ssoclient/principal_id.h>
#include <ssoclient/saml_token.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/system/date_time.h>
#include <tarnik/xml/security/signature.h>

namespace SsoClient {

/// The content of an Issuer or NameID element.
struct NameId {
  std::string format;  ///< empty when the attribute is absent
  std::string value;
};

struct ParsedSubject {
  PrincipalId principal;
  TokenConfirmationType confirmationMethod = BEARER;
  std::optional<PrincipalId> delegateId;
  Tarnik::System::DateTime notOnOrAfter;
  /// Null unless the method is holder-of-key.
  Tarnik::Ref<const Tarnik::Crypto::Certificate> holderOfKeyCertificate;
};

struct RenewRestriction {
  std::uint32_t count = 0;
  bool postdatable = false;
  bool renewExpired = false;
};

struct ParsedConditions {
  Tarnik::System::DateTime notBefore;
  Tarnik::System::DateTime notOnOrAfter;
  std::optional<std::vector<std::string>> audiences;
  std::optional<RenewRestriction> renewRestriction;
  /// Count of the proxy restriction.
  std::optional<std::uint32_t> proxyCount;
  std::optional<std::vector<Delegate>> delegationChain;
};

struct AuthnStatement {
  Tarnik::System::DateTime instant;
  std::string contextClass;
};

/// The values of the attribute statement.
struct SubjectAttributes {
  std::vector<PrincipalId> groups;
  bool isSolution = false;
  SubjectNames names;
};

/// The content of one assertion, before its validity is checked.
struct ParsedAssertion {
  std::string version;
  std::string id;
  Tarnik::System::DateTime issueInstant;
  NameId issuer;
  Tarnik::Ref<Tarnik::Xml::Security::Signature> signature;
  ParsedSubject subject;
  ParsedConditions conditions;
  std::vector<Advice> advice;
  std::optional<AuthnStatement> authnStatement;
  SubjectAttributes attributes;
};

}  // namespace SsoClient

#endif
