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
  /// The assertion's ID attribute (SAML 2.0 core, section 2.3.3); begins with an underscore.
  virtual const std::string& Id() const = 0;
  /// The start of validity: NotBefore of the Conditions (SAML 2.0 core, section 2.5.1.2).
  virtual const Tarnik::System::DateTime& StartTime() const = 0;
  /// The end of validity: NotOnOrAfter of the Conditions, the first instant that is too late.
  virtual const Tarnik::System::DateTime& ExpirationTime() const = 0;
  /// The end of validity plus the clock tolerance that the token was created with; held at the ends
  /// of the range of `DateTime`.
  virtual Tarnik::System::DateTime ExpirationTimeWithTolerance() const = 0;
  /// Whom the token speaks of: the Subject's NameID, a user principal name (SAML 2.0 core, section
  /// 2.4.1).
  virtual const PrincipalId& Subject() const = 0;
  /// True when the token carries a renew restriction with a count other than zero.
  virtual bool IsRenewable() const = 0;
  /// True when the token carries a proxy restriction with a count other than zero.
  virtual bool IsDelegable() const = 0;
  /// True when the subject is a solution user.
  virtual bool IsSolution() const = 0;
  /// How the subject is confirmed: the Method of its SubjectConfirmation.
  virtual TokenConfirmationType ConfirmationType() const = 0;
  /// This and the four below replace what their argument held with copies. Of names that the token
  /// tells twice, the later ones.
  virtual void GetSubjectNames(SubjectNames& names) const = 0;
  /// The groups that the subject is in, in the order of the token; none if it names none.
  virtual void GetGroups(std::vector<PrincipalId>& groups) const = 0;
  /// To whom the token was delegated, in document order: the last one is the most recent delegate.
  /// Empty for a token that was not delegated.
  virtual void GetDelegationChain(std::vector<Delegate>& chain) const = 0;
  /// For whom the token is meant (SAML 2.0 core, section 2.5.1.4); empty when it is not restricted.
  /// That the caller is among them is for the caller to check.
  virtual void GetAudiences(std::set<std::string>& audiences) const = 0;
  /// The token's advice, in document order; empty when it has none.
  virtual void GetAdvice(std::vector<Advice>& advice) const = 0;
  /// The certificate whose key the holder must prove to have (SAML 2.0 profiles, section 3.1); null
  /// for a bearer token.
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

/// Reads one SAML 2.0 assertion strictly, judges its validity against the system clock, and
/// verifies its signature where a resolver is given. Never returns null. Safe from many threads.
///
/// `clockToleranceSec`, in seconds, widens the validity period on both ends; 600 where it is not
/// given, and a negative one narrows it. A null `resolver` means that the signature is NOT
/// verified, only its form and that it covers the token. `resolver` is used during the call only.
///
/// Throws
///  - `Tarnik::Xml::XMLParseException` for text that is not well-formed XML, or that the platform's
///    parser refuses;
///  - `ParseException` for a structure or validity fault;
///  - `InvalidSignatureException` for a signature that does not verify;
///  - `Tarnik::Base64FormatException` or `Tarnik::Crypto::CryptoException` for holder-of-key
///    material that is no certificate;
///  - whatever else `resolver` throws.
SSOCLIENT_EXPORT std::shared_ptr<const SamlToken> CreateSamlToken(const std::string& xml);
SSOCLIENT_EXPORT std::shared_ptr<const SamlToken> CreateSamlToken(const std::string& xml,
                                                                  long clockToleranceSec);
SSOCLIENT_EXPORT std::shared_ptr<const SamlToken> CreateSamlToken(
    const std::string& xml, const Tarnik::Xml::Security::KeyInfoResolver* resolver);
SSOCLIENT_EXPORT std::shared_ptr<const SamlToken> CreateSamlToken(
    const std::string& xml, const Tarnik::Xml::Security::KeyInfoResolver* resolver,
    long clockToleranceSec);
/// As above, but verifies with the resolver that `resolverFor` returns for the token that was read
/// and judged with a tolerance of 600 seconds. The pointer that it is given is valid during its
/// call only. A null resolver is refused with `InvalidSignatureException`, an empty `resolverFor`
/// with `Tarnik::InvalidArgumentException`; what `resolverFor` throws passes through.
SSOCLIENT_EXPORT std::shared_ptr<const SamlToken> CreateSamlToken(
    const std::string& xml, const KeyInfoResolverSource& resolverFor);

/// As above, for an element that stands alone or inside any document; null is refused with
/// `ParseException`. The token keeps the element's tree alive, which nobody may change from then
/// on. Also throws `Tarnik::Xml::Security::XmlSecurityException` when the element has no canonical
/// form (a relative namespace URI in scope).
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
