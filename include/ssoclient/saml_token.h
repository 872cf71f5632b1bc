#ifndef SSOCLIENT_SAML_TOKEN_H
#define SSOCLIENT_SAML_TOKEN_H

#include <functional>
#include <memory>
#include <set>
#include <string>
#include <vector>

#include <ssoclient/advice.h>
#include <ssoclient/confirmation_type.h>
#include <ssoclient/delegate.h>
#include <ssoclient/exceptions.h>
#include <ssoclient/principal_id.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/system/date_time.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/security/key_info_resolver.h>
#include <tarnik/xml/security/signature.h>

namespace SsoClient {

/// The subject's names from the claims "givenname" and "surname"; empty when the token has none.
struct SubjectNames {
  std::string givenName;
  std::string surname;
};

/// An accepted SAML 2.0 assertion, read only. Owned only through the `std::shared_ptr` that the
/// functions below return; may be read from any number of threads at once. References that it
/// returns live as long as the token. The order of the operations is part of the binary interface.
class SamlToken {
 public:
  /// The assertion's ID attribute.
  virtual const std::string& Id() const = 0;
  /// The start of validity: NotBefore of the Conditions.
  virtual const Tarnik::System::DateTime& StartTime() const = 0;
  /// The end of validity: NotOnOrAfter of the Conditions.
  virtual const Tarnik::System::DateTime& ExpirationTime() const = 0;
  /// The end of validity plus the clock tolerance that the token was created with.
  virtual Tarnik::System::DateTime ExpirationTimeWithTolerance() const = 0;
  virtual const PrincipalId& Subject() const = 0;
  /// True when the token carries a renew restriction with a count other than zero.
  virtual bool IsRenewable() const = 0;
  /// True when the token carries a proxy restriction with a count other than zero.
  virtual bool IsDelegable() const = 0;
  /// True when the subject is a solution user.
  virtual bool IsSolution() const = 0;
  virtual TokenConfirmationType ConfirmationType() const = 0;
  /// These five replace what the argument held.
  virtual void GetSubjectNames(SubjectNames& names) const = 0;
  virtual void GetGroups(std::vector<PrincipalId>& groups) const = 0;
  /// In document order: the last one is the most recent delegate.
  virtual void GetDelegationChain(std::vector<Delegate>& chain) const = 0;
  virtual void GetAudiences(std::set<std::string>& audiences) const = 0;
  virtual void GetAdvice(std::vector<Advice>& advice) const = 0;
  /// The certificate whose key the holder must prove to have; null for a bearer token.
  virtual Tarnik::Ref<const Tarnik::Crypto::Certificate> HolderOfKeyCertificate() const = 0;
  /// The name of the assertion's Issuer.
  virtual const std::string& Issuer() const = 0;
  /// The token's signature, for verification after creation.
  virtual Tarnik::Ref<Tarnik::Xml::Security::Signature> GetSignature() const = 0;
  /// The token's XML: the text that it was created from, or the canonical text of the element that
  /// it was created from (Canonical XML 1.0). This is the secret of a bearer token.
  virtual const std::string& Xml() const = 0;

 protected:
  ~SamlToken() = default;
};

/// Chooses the key source for a parsed, not yet verified token, by its issuer for instance.
using KeyInfoResolverSource =
    std::function<Tarnik::Ref<const Tarnik::Xml::Security::KeyInfoResolver>(const SamlToken*)>;

/// The functions below read one SAML 2.0 assertion strictly, judge its validity against the system
/// clock, and verify its signature where a resolver is given. Safe from many threads.
///
/// `clockToleranceSec` widens the validity period on both ends; 600 where it is not given. A null
/// `resolver` means that the signature is NOT verified, only its form and that it covers the token.
///
/// Throw `Tarnik::Xml::XMLParseException` for text that is not well-formed, `ParseException` for a
/// structure or validity fault, and `InvalidSignatureException` for a signature that does not
/// verify.
SSOCLIENT_EXPORT std::shared_ptr<const SamlToken> CreateSamlToken(const std::string& xml);
SSOCLIENT_EXPORT std::shared_ptr<const SamlToken> CreateSamlToken(const std::string& xml,
                                                                  long clockToleranceSec);
SSOCLIENT_EXPORT std::shared_ptr<const SamlToken> CreateSamlToken(
    const std::string& xml, const Tarnik::Xml::Security::KeyInfoResolver* resolver);
SSOCLIENT_EXPORT std::shared_ptr<const SamlToken> CreateSamlToken(
    const std::string& xml, const Tarnik::Xml::Security::KeyInfoResolver* resolver,
    long clockToleranceSec);
/// Verifies with the resolver that `resolverFor` returns for the parsed token. A null one is
/// refused with `InvalidSignatureException`; what `resolverFor` throws passes through.
SSOCLIENT_EXPORT std::shared_ptr<const SamlToken> CreateSamlToken(
    const std::string& xml, const KeyInfoResolverSource& resolverFor);

SSOCLIENT_EXPORT std::shared_ptr<const SamlToken> CreateSamlTokenFromDom(
    Tarnik::Xml::ElementNode* assertion);
SSOCLIENT_EXPORT std::shared_ptr<const SamlToken> CreateSamlTokenFromDom(
    Tarnik::Xml::ElementNode* assertion, long clockToleranceSec);
SSOCLIENT_EXPORT std::shared_ptr<const SamlToken> CreateSamlTokenFromDom(
    Tarnik::Xml::ElementNode* assertion, const Tarnik::Xml::Security::KeyInfoResolver* resolver);
SSOCLIENT_EXPORT std::shared_ptr<const SamlToken> CreateSamlTokenFromDom(
    Tarnik::Xml::ElementNode* assertion, const Tarnik::Xml::Security::KeyInfoResolver* resolver,
    long clockToleranceSec);

/// One line that describes the token for logs; names the subject and its groups, never the XML.
SSOCLIENT_EXPORT std::string CreateSamlTokenDescription(const SamlToken& token);

}  // namespace SsoClient

#endif
