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
  std::string givenName;  ///< the given name
  std::string surname;    ///< the family name
};

/// An accepted SAML 2.0 assertion, read-only. Owned only by the `std::shared_ptr` that the
/// functions below return; any number of threads may read it at once. References that it returns
/// are valid as long as the token. The order of the operations is part of the binary interface.
class SamlToken {
 public:
  /// The assertion's ID attribute (SAML 2.0 core, section 2.3.3); begins with an underscore.
  virtual const std::string& Id() const = 0;
  /// The start of validity: NotBefore of the Conditions (SAML 2.0 core, section 2.5.1.2).
  virtual const Tarnik::System::DateTime& StartTime() const = 0;
  /// The end of validity: NotOnOrAfter of the Conditions, the first instant at which the token is
  /// no longer valid.
  virtual const Tarnik::System::DateTime& ExpirationTime() const = 0;
  /// The end of validity plus the clock tolerance that the token was created with, limited to the
  /// range of `DateTime`.
  virtual Tarnik::System::DateTime ExpirationTimeWithTolerance() const = 0;
  /// Whom the token is about: the Subject's NameID, a user principal name (SAML 2.0 core, section
  /// 2.4.1).
  virtual const PrincipalId& Subject() const = 0;
  /// True when the token has a renew restriction with a count other than zero.
  virtual bool IsRenewable() const = 0;
  /// True when the token has a proxy restriction with a count other than zero.
  virtual bool IsDelegable() const = 0;
  /// True when the subject is a solution user.
  virtual bool IsSolution() const = 0;
  /// How the subject is confirmed: the Method of its SubjectConfirmation.
  virtual TokenConfirmationType ConfirmationType() const = 0;
  /// The subject's names. This and the next four operations replace the content of their argument
  /// with copies. If the token has a name twice, the later one counts.
  virtual void GetSubjectNames(SubjectNames& names) const = 0;
  /// The subject's groups, in the order of the token; empty when it has none.
  virtual void GetGroups(std::vector<PrincipalId>& groups) const = 0;
  /// The delegates, in document order: the last one is the most recent. Empty for a token that was
  /// not delegated.
  virtual void GetDelegationChain(std::vector<Delegate>& chain) const = 0;
  /// The audiences that the token is restricted to (SAML 2.0 core, section 2.5.1.4); empty when it
  /// is not restricted. The caller must check that it is one of them.
  virtual void GetAudiences(std::set<std::string>& audiences) const = 0;
  /// The token's advice, in document order; empty when it has none.
  virtual void GetAdvice(std::vector<Advice>& advice) const = 0;
  /// The certificate of the key whose possession the presenter must prove (SAML 2.0 profiles,
  /// section 3.1); null for a bearer token.
  virtual Tarnik::Ref<const Tarnik::Crypto::Certificate> HolderOfKeyCertificate() const = 0;
  /// The name of the assertion's Issuer.
  virtual const std::string& Issuer() const = 0;
  /// The token's signature, for verification after creation.
  virtual Tarnik::Ref<Tarnik::Xml::Security::Signature> GetSignature() const = 0;
  /// The token's XML: the text that it was created from, or the canonical text (Canonical XML 1.0)
  /// of the element that it was created from. Keep it secret: it is all that a bearer needs.
  virtual const std::string& Xml() const = 0;

 protected:
  ~SamlToken() = default;
};

/// Chooses the key source for a parsed but not yet verified token, for instance by its issuer.
using KeyInfoResolverSource =
    std::function<Tarnik::Ref<const Tarnik::Xml::Security::KeyInfoResolver>(const SamlToken*)>;

/// Reads one SAML 2.0 assertion strictly, validates it against the system clock, and verifies its
/// signature if a resolver is given. Never returns null. Thread-safe.
///
/// `clockToleranceSec`, in seconds, widens the validity period at both ends; a negative value
/// narrows it. The default is 600. A null `resolver`, or a form without one, means that the
/// signature is NOT verified: only its form is checked, and that it covers the token. Anyone can
/// have written such a token. `resolver` is used only during the call.
///
/// Throws
///  - `Tarnik::Xml::XMLParseException` for text that is not well-formed XML, or that the parser
///    rejects (see `Tarnik::Xml::XMLParser::Parse`);
///  - `ParseException` for a structure or validity fault;
///  - `InvalidSignatureException` for a signature that does not verify, also when `resolver` throws
///    `Tarnik::Xml::Security::XmlSecurityException`;
///  - `Tarnik::Base64FormatException` or `Tarnik::Crypto::CryptoException` for a holder-of-key
///    certificate that cannot be decoded;
///  - any other exception of `resolver`;
///  - `std::bad_alloc`.
SSOCLIENT_EXPORT std::shared_ptr<const SamlToken> CreateSamlToken(const std::string& xml);
/// The same with a tolerance, and without verification.
SSOCLIENT_EXPORT std::shared_ptr<const SamlToken> CreateSamlToken(const std::string& xml,
                                                                  long clockToleranceSec);
/// The same with verification.
SSOCLIENT_EXPORT std::shared_ptr<const SamlToken> CreateSamlToken(
    const std::string& xml, const Tarnik::Xml::Security::KeyInfoResolver* resolver);
/// The same with verification and a tolerance.
SSOCLIENT_EXPORT std::shared_ptr<const SamlToken> CreateSamlToken(
    const std::string& xml, const Tarnik::Xml::Security::KeyInfoResolver* resolver,
    long clockToleranceSec);
/// As above, but first reads and validates the token with a tolerance of 600 seconds and then
/// verifies it with the resolver that `resolverFor` returns for it. The pointer that `resolverFor`
/// receives is valid only during its call. A null resolver causes `InvalidSignatureException`, an
/// empty `resolverFor` `Tarnik::InvalidArgumentException`; exceptions of `resolverFor` propagate.
SSOCLIENT_EXPORT std::shared_ptr<const SamlToken> CreateSamlToken(
    const std::string& xml, const KeyInfoResolverSource& resolverFor);

/// As above, for an element with or without a document around it; null causes `ParseException`. The
/// token keeps the element's tree alive, and nobody may change that tree from then on. Also throws
/// `Tarnik::Xml::Security::XmlSecurityException` when the element has no canonical form (a relative
/// namespace URI in scope).
SSOCLIENT_EXPORT std::shared_ptr<const SamlToken> CreateSamlTokenFromDom(
    Tarnik::Xml::ElementNode* assertion);
/// The same with a tolerance, and without verification.
SSOCLIENT_EXPORT std::shared_ptr<const SamlToken> CreateSamlTokenFromDom(
    Tarnik::Xml::ElementNode* assertion, long clockToleranceSec);
/// The same with verification.
SSOCLIENT_EXPORT std::shared_ptr<const SamlToken> CreateSamlTokenFromDom(
    Tarnik::Xml::ElementNode* assertion, const Tarnik::Xml::Security::KeyInfoResolver* resolver);
/// The same with verification and a tolerance.
SSOCLIENT_EXPORT std::shared_ptr<const SamlToken> CreateSamlTokenFromDom(
    Tarnik::Xml::ElementNode* assertion, const Tarnik::Xml::Security::KeyInfoResolver* resolver,
    long clockToleranceSec);

/// Describes the token in one line for logs; contains the subject and its groups, never the XML.
SSOCLIENT_EXPORT std::string CreateSamlTokenDescription(const SamlToken& token);

}  // namespace SsoClient

#endif
