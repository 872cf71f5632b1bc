#ifndef SSOCLIENT_TESTS_SUPPORT_ASSERTION_TEXT_H
#define SSOCLIENT_TESTS_SUPPORT_ASSERTION_TEXT_H

#include <string>
#include <string_view>

#include <devsts/certificates.h>
#include <devsts/xml_security.h>
#include <tarnik/core/ref.h>
#include <tarnik/system/date_time.h>
#include <tarnik/xml/security/key_info_resolver.h>

namespace SsoClient::Testing {

/// Declarations of the prefixes saml2, ds, rsa, del, xs and xsi.
std::string NamespaceDeclarations();

/// `text` with the only occurrence of `from` replaced. Throws `std::logic_error` unless there is
/// exactly one, since a test with an edit that changes nothing would prove nothing.
std::string Replaced(std::string text, std::string_view from, std::string_view to);
/// `text` with `addition` after the only occurrence of `anchor`.
std::string InsertedAfter(std::string text, std::string_view anchor, std::string_view addition);

/// The time `seconds` after `now` in the form that assertions use.
std::string TimeText(const Tarnik::System::DateTime& now, long seconds);

/// A well-formed ds:Signature with made-up values.
std::string MadeUpSignature(std::string_view referenceUri);

/// The parts of a bearer assertion, which a test may change before they are joined. The assertion
/// is valid from one minute before `now` to one hour after it.
struct AssertionText {
  explicit AssertionText(const Tarnik::System::DateTime& now = Tarnik::System::GetUtcDateTime());

  std::string attributes;  ///< of the root, without the namespace declarations
  std::string issuer;
  std::string signature;
  std::string subject;
  std::string conditions;
  std::string advice;
  std::string authnStatement;
  std::string attributeStatement;
  std::string tail;  ///< what follows the last statement; empty by default

  /// Adds the restrictions and the delegate id of a token that was delegated to
  /// first@example.com and then to second@example.com.
  AssertionText& Delegate();
  /// Changes it to a holder-of-key assertion for the key of this certificate.
  AssertionText& ConfirmByKey(const std::string& certificatePem);

  std::string ToXml() const;
  /// The same without the made-up signature, signed with `credential`'s EC key as `options` say,
  /// except that the algorithm is always ECDSA-SHA256.
  std::string ToSignedXml(const DevSts::Credential& credential,
                          DevSts::SignOptions options = {}) const;
};

/// The Base64 body of a PEM certificate, in one line.
std::string CertificateBody(const std::string& certificatePem);

/// The credential that the tests trust, another one of the same name that they do not trust, and a
/// resolver that trusts only the certificate of the first.
const DevSts::Credential& TrustedCredential();
const DevSts::Credential& StrangerCredential();
Tarnik::Ref<const Tarnik::Xml::Security::KeyInfoResolver> TrustedResolver();

}  // namespace SsoClient::Testing

#endif
