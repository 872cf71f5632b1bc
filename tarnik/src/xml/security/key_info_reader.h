#ifndef TARNIK_XML_SECURITY_KEY_INFO_READER_H
#define TARNIK_XML_SECURITY_KEY_INFO_READER_H

#include <tarnik/xml/security/key_info.h>

namespace Tarnik::Xml::Security {

/// Reads a ds:KeyInfo element. Content without information on X.509 certificates (KeyValue and
/// extensions) is skipped. Throws `SignatureSyntaxException`, also for content that refers to a key
/// elsewhere: RetrievalMethod and KeyInfoReference.
KeyInfo ReadKeyInfo(const ElementNode* element);

}  // namespace Tarnik::Xml::Security

#endif
