#ifndef DEVSTS_SIGNING_SIGNED_INFO_H
#define DEVSTS_SIGNING_SIGNED_INFO_H

#include <libxml/tree.h>

#include <string>
#include <string_view>

namespace DevSts {

// The only child element of this name in the signature namespace. Throws XmlError.
xmlNode* SignatureChild(const xmlNode* parent, const char* localName);

// The URI in SignedInfo's SignatureMethod.
std::string SignatureMethodOf(const xmlNode* signature);
void SetSignatureMethod(xmlNode* signature, const char* uri);

// SignedInfo in the canonical form that it names.
std::string CanonicalSignedInfo(xmlNode* signature);

// xmlsec1 1.2 knows no RSA-PSS: these two make and check that signature value with OpenSSL
// (RFC 8017, section 8.1; salt as long as the digest, as RFC 6931 section 2.3.10 has it).
void WritePssSignatureValue(xmlNode* signature, std::string_view keyPem);
bool PssSignatureValueIsRight(xmlNode* signature, std::string_view certificatePem);

}  // namespace DevSts

#endif
