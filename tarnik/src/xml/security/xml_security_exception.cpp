#include <utility>

#include <tarnik/xml/security/xml_security_exception.h>

namespace Tarnik::Xml::Security {

XmlSecurityException::XmlSecurityException(std::string message, const boost::source_location& where)
    : Exception(std::move(message), where) {}

XmlSecurityException::~XmlSecurityException() = default;

std::unique_ptr<Throwable> XmlSecurityException::Clone() const {
  return std::make_unique<XmlSecurityException>(*this);
}

void XmlSecurityException::Throw() const {
  throw *this;
}

SignatureSyntaxException::SignatureSyntaxException(std::string message,
                                                   const boost::source_location& where)
    : XmlSecurityException(std::move(message), where) {}

SignatureSyntaxException::~SignatureSyntaxException() = default;

std::unique_ptr<Throwable> SignatureSyntaxException::Clone() const {
  return std::make_unique<SignatureSyntaxException>(*this);
}

void SignatureSyntaxException::Throw() const {
  throw *this;
}

}  // namespace Tarnik::Xml::Security
