#ifndef TARNIK_XML_SECURITY_SIGNER_DESCRIPTION_H
#define TARNIK_XML_SECURITY_SIGNER_DESCRIPTION_H

#include <string>

#include <tarnik/xml/security/key_info.h>

namespace Tarnik::Xml::Security {

/// What `keyInfo` says about the signer, for a message: a relative clause, for example "which names
/// no signer". Untrusted texts are bounded and cleaned. Only the kind of hint that the resolvers
/// prefer is described.
std::string DescribeSigner(const KeyInfo& keyInfo);

}  // namespace Tarnik::Xml::Security

#endif
