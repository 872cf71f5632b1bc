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

/// `text` with the one occurrence of `from` replaced. Throws `std::logic_error` unless there is
/// exactly one: an edit that does not take would make a test say nothing.
std::string Replaced(std::string text, std::string_view from, std::string_view to);
/// `text` with `addition` behind the one occurrence of `anchor`.
std::string InsertedBehind(std::string text, std::string_view anchor, std::string_view addition);

/// The time `seconds` after `now` as assertions write it.
std::string TimeText(const Tarnik::System::DateTime& now, long seconds);

/// A ds:Signature of good form whose values are made up.
std::string MadeUpSignature(std::string_view referenceUri);

/// A bearer assertion in parts that a test may change before it is put together. Valid from one
/// minute before `now` to one hour after it.
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
  std::string tail;  ///< what stands behind the last statement; empty

  /// Adds the restrictions and the delegate id of a token that was delegated to
  /// first@example.com and then to second@example.com.
  AssertionText& Delegate();
  /// Makes it a holder-of-key assertion for the key of this certificate.
  AssertionText& ConfirmByKey(const std::string& certificatePem);

  std::string ToXml() const;
  /// The same without the made-up signature, signed with `credential`'s EC key by `options`
  /// (ECDSA-SHA256 whatever they say of the algorithm).
  std::string ToSignedXml(const DevSts::Credential& credential,
                          DevSts::SignOptions options = {}) const;
};

/// The base64 body of a PEM certificate, in one line.
std::string CertificateBody(const std::string& certificatePem);

/// The credential that the tests trust, another of the same name that they do not, and the resolver
/// that trusts the first one's certificate alone.
const DevSts::Credential& TrustedCredential();
const DevSts::Credential& StrangerCredential();
Tarnik::Ref<const Tarnik::Xml::Security::KeyInfoResolver> TrustedResolver();

}  // namespace SsoClient::Testing

#endif
