#ifndef SSOCLIENT_TESTS_SUPPORT_SECOND_OPINION_H
#define SSOCLIENT_TESTS_SUPPORT_SECOND_OPINION_H

#include <string>

namespace SsoClient::Testing {

/// What an independent reader of XML signatures says against the text's first signature under the
/// trusted credential's key; "" when it finds nothing wrong.
///
/// XML leaves the URIs of namespaces free, while the other parser refuses a text in which one is
/// malformed, whatever it is for. Such a URI is replaced by a good one and the opinion asked again:
/// where the signature or a name depends on the URI, the opinion is then bad as it should be.
std::string SecondOpinionOf(std::string xml);

}  // namespace SsoClient::Testing

#endif
