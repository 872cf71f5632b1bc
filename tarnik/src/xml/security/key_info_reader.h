#ifndef TARNIK_XML_SECURITY_KEY_INFO_READER_H
#define TARNIK_XML_SECURITY_KEY_INFO_READER_H

#include <tarnik/xml/security/key_info.h>

namespace Tarnik::Xml::Security {

/// Reads a ds:KeyInfo element. What says nothing about X.509 certificates (KeyValue and extensions
/// of others) is passed over. Throws `SignatureSyntaxException`, also for what would have to be
/// fetched: RetrievalMethod and KeyInfoReference.
KeyInfo ReadKeyInfo(const ElementNode* element);

}  // namespace Tarnik::Xml::Security

#endif
