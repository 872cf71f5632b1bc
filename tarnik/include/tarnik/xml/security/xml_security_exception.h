#ifndef TARNIK_XML_SECURITY_XML_SECURITY_EXCEPTION_H
#define TARNIK_XML_SECURITY_XML_SECURITY_EXCEPTION_H

#include <memory>
#include <string>

#include <tarnik/core/exception.h>

namespace Tarnik::Xml::Security {

/// A signature, key or algorithm that cannot be processed.
class TARNIK_EXPORT XmlSecurityException : public Exception {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit XmlSecurityException(std::string message,
                                const boost::source_location& where = CurrentLocation());
  ~XmlSecurityException() override;
  std::unique_ptr<Throwable> Clone() const override;
  [[noreturn]] void Throw() const override;
};

/// A Signature element that violates the structure of XML Signature.
class TARNIK_EXPORT SignatureSyntaxException : public XmlSecurityException {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit SignatureSyntaxException(std::string message,
                                    const boost::source_location& where = CurrentLocation());
  ~SignatureSyntaxException() override;
  std::unique_ptr<Throwable> Clone() const override;
  [[noreturn]] void Throw() const override;
};

}  // namespace Tarnik::Xml::Security

#endif
