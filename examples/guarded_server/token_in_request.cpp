#include "token_in_request.h"

#include <iterator>
#include <string_view>

#include <boost/beast/core/string.hpp>

#include <tarnik/core/checked_cast.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/reader.h>
#include <tarnik/core/writer.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/security/canonicalizer.h>
#include <tarnik/xml/xml_parser.h>

#include "base64.h"

namespace GuardedServer {
namespace {

namespace http = boost::beast::http;
using Tarnik::Xml::ElementNode;

constexpr std::string_view kSaml = "urn:oasis:names:tc:SAML:2.0:assertion";
constexpr std::string_view kSecurity =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-secext-1.0.xsd";
// Unlike the exclusive form, this one keeps the namespaces that the assertion inherits from the
// message, which its signature and the values of its attributes may use.
constexpr std::string_view kCanonicalXml = "http://www.w3.org/TR/2001/REC-xml-c14n-20010315";

bool IsSameWord(std::string_view a, std::string_view b) {
  return boost::beast::iequals({a.data(), a.size()}, {b.data(), b.size()});
}

/// The only child element with this name; null without one, and without a parent.
const ElementNode* OnlyChild(const ElementNode* parent, std::string_view uri,
                             std::string_view name) {
  const auto* const found = parent == nullptr ? nullptr : parent->FirstChildElement(uri, name);
  const Tarnik::Xml::Node* node = found;
  while (node != nullptr && (node = node->NextSibling()) != nullptr) {
    const auto* const element = dynamic_cast<const ElementNode*>(node);
    if (element != nullptr && element->LocalName() == name && element->NamespaceUri() == uri) {
      throw MalformedRequest("the message has several elements " + std::string(name));
    }
  }
  return found;
}

std::optional<std::string> TokenInMessage(const std::string& body) {
  const auto reader = Tarnik::CreateStringReader(body);
  const auto handler = Tarnik::Xml::CreateXMLDocumentHandler();
  const auto object = Tarnik::Xml::CreateXMLParser(reader.get(), handler.get())->Parse();
  const auto* const envelope =
      Tarnik::CheckedCast<Tarnik::Xml::Document>(object.get())->RootElement();
  const auto* const header = OnlyChild(envelope, envelope->NamespaceUri(), "Header");
  const auto* const security = OnlyChild(header, kSecurity, "Security");
  const auto* const assertion = OnlyChild(security, kSaml, "Assertion");
  if (assertion == nullptr) {
    return std::nullopt;
  }
  const auto writer = Tarnik::CreateStringWriter();
  Tarnik::Xml::Security::CreateCanonicalizer(kCanonicalXml)->Canonicalize(assertion, writer.get());
  return writer->TakeText();
}

std::optional<std::string> TokenInHeader(const Request& request) {
  const auto [begin, end] = request.equal_range(http::field::authorization);
  if (begin == end) {
    return std::nullopt;
  }
  constexpr std::string_view kScheme = "Bearer ";
  const std::string_view value(begin->value().data(), begin->value().size());
  if (std::next(begin) != end || !IsSameWord(value.substr(0, kScheme.size()), kScheme)) {
    throw MalformedRequest(
        "the request must have one Authorization header, with the scheme Bearer");
  }
  const auto text = DecodeBase64(value.substr(kScheme.size()));
  if (!text) {
    throw MalformedRequest("the bearer token is not Base64");
  }
  return text;
}

bool IsXml(const Request& request) {
  const auto field = request[http::field::content_type];
  const std::string_view value(field.data(), field.size());
  const std::string_view type = value.substr(0, value.find_first_of("; "));
  return IsSameWord(type, "text/xml") || IsSameWord(type, "application/soap+xml");
}

}  // namespace

std::optional<std::string> TokenIn(const Request& request) try {
  auto inHeader = TokenInHeader(request);
  auto inMessage = IsXml(request) ? TokenInMessage(request.body()) : std::nullopt;
  if (inHeader && inMessage) {
    throw MalformedRequest("the request has tokens in its header and in its body");
  }
  return inHeader ? inHeader : inMessage;
} catch (const Tarnik::Exception& e) {
  throw MalformedRequest(e.what());
}

}  // namespace GuardedServer
