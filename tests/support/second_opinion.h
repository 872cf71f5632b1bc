#ifndef SSOCLIENT_TESTS_SUPPORT_SECOND_OPINION_H
#define SSOCLIENT_TESTS_SUPPORT_SECOND_OPINION_H

#include <string>

namespace SsoClient::Testing {

/// The error of an independent verifier of XML signatures for the text's first signature with the
/// trusted credential's key; "" if it is valid.
///
/// XML does not restrict namespace URIs, but the other parser refuses every text with a malformed
/// one. Such a URI is replaced by a valid one before another attempt. That attempt fails, as it
/// should, if the signature or a name depends on the URI.
std::string SecondOpinionOf(std::string xml);
/// The same with the key of another certificate, in PEM.
std::string SecondOpinionOf(std::string xml, const std::string& certificatePem);

}  // namespace SsoClient::Testing

#endif
