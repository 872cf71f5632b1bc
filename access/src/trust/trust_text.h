#ifndef SSOCLIENT_ACCESS_TRUST_TRUST_TEXT_H
#define SSOCLIENT_ACCESS_TRUST_TRUST_TEXT_H

#include <string>

namespace SsoClient::Access {

/// "'https://sts.example'" in a form for people; "any issuer" if `issuer` is empty.
std::string IssuerText(const std::string& issuer);

}  // namespace SsoClient::Access

#endif
