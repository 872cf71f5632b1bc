#ifndef TARNIK_XML_SECURITY_KEY_INFO_H
#define TARNIK_XML_SECURITY_KEY_INFO_H

#include <string>
#include <vector>

#include <tarnik/core/ref.h>
#include <tarnik/xml/element_node.h>

namespace Tarnik::Xml::Security {

/// What a message says about the key that signed it (XML Signature 1.1, section 4.5). These are
/// untrusted hints for a `KeyInfoResolver`.
struct KeyInfo {
  /// A certificate, by its issuer and its number there (ds:X509IssuerSerial).
  struct IssuerSerial {
    std::string issuerName;    ///< distinguished name, as written
    std::string serialNumber;  ///< decimal, as written
  };

  std::vector<std::vector<unsigned char>> certificates;  ///< DER, in document order
  std::vector<IssuerSerial> issuerSerials;               ///< ds:X509IssuerSerial
  std::vector<std::string> subjectNames;                 ///< ds:X509SubjectName, as written
  std::vector<std::vector<unsigned char>> subjectKeyIdentifiers;  ///< ds:X509SKI, decoded
  std::vector<std::string> keyNames;                              ///< ds:KeyName, as written
  /// The KeyInfo element itself, or null when the signature has none.
  Ref<const ElementNode> element;
};

}  // namespace Tarnik::Xml::Security

#endif
