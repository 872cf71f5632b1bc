#ifndef SSOCLIENT_TESTS_SUPPORT_TOKEN_CASES_H
#define SSOCLIENT_TESTS_SUPPORT_TOKEN_CASES_H

#include <string>
#include <vector>

namespace SsoClient::Testing {

/// What becomes of a text where only the certificate of `TrustedCredential` is trusted.
enum class Fate {
  kAccepted,
  kNotXml,        ///< the parser refuses it
  kNotAToken,     ///< it does not have the structure of a token
  kNoTrustedKey,  ///< its signature names no trusted key, or it has another issuer
  kBadSignature,  ///< its signature does not verify
  kRefused,       ///< for one of these reasons
};

struct TokenCase {
  std::string name;
  std::string text;
  Fate fate;
};

/// Attacks of one kind, with texts that differ in one thing and are accepted. All tokens are about
/// alice@example.com.
struct TokenCases {
  const char* name;
  std::vector<TokenCase> (*make)();
};
const std::vector<TokenCases>& AllTokenCases();

/// Of what the signature of `AssertionText` covers and how.
std::vector<TokenCase> WrappingCases();
std::vector<TokenCase> SignaturePlaceCases();
std::vector<TokenCase> SignaturePartCases();
std::vector<TokenCase> IdCases();
std::vector<TokenCase> NamespaceCases();
std::vector<TokenCase> TransformCases();
std::vector<TokenCase> AlgorithmCases();
std::vector<TokenCase> SignatureValueCases();
std::vector<TokenCase> KeyInfoCases();
std::vector<TokenCase> UntrustedCases();

/// Of the text and its values.
std::vector<TokenCase> SplitValueCases();
std::vector<TokenCase> EditCases();
std::vector<TokenCase> DocumentTypeCases();
std::vector<TokenCase> EncodingCases();
std::vector<TokenCase> AttributeCases();
std::vector<TokenCase> SizeCases();
std::vector<TokenCase> NumberCases();
std::vector<TokenCase> DateCases();
std::vector<TokenCase> WhiteSpaceCases();

}  // namespace SsoClient::Testing

#endif
