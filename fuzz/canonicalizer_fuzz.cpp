// Whatever the parser accepts, libxml2 accepts; and both canonical forms are its octets.
#include <libxml/c14n.h>
#include <libxml/parser.h>
#include <tarnik/core/checked_cast.h>
#include <tarnik/core/reader.h>
#include <tarnik/core/writer.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/security/canonicalizer.h>
#include <tarnik/xml/security/xml_security_exception.h>
#include <tarnik/xml/xml_parse_exception.h>
#include <tarnik/xml/xml_parser.h>

#include <optional>

#include "input.h"

namespace {

using namespace Tarnik;

Ref<Xml::Document> ParseText(const std::string& text) {
  const auto reader = CreateStringReader(text);
  const auto handler = Xml::CreateXMLDocumentHandler();
  try {
    const auto parsed = Xml::CreateXMLParser(reader.get(), handler.get())->Parse();
    return Ref<Xml::Document>(CheckedCast<Xml::Document>(parsed.get()));
  } catch (const Xml::XMLParseException&) {
    return nullptr;
  }
}

std::optional<std::string> Ours(const Xml::Document& document, const char* algorithm) {
  const auto writer = CreateStringWriter();
  try {
    Xml::Security::CreateCanonicalizer(algorithm)->Canonicalize(&document, writer.get());
  } catch (const Xml::Security::XmlSecurityException&) {
    return std::nullopt;
  }
  return writer->Text();
}

std::optional<std::string> Theirs(xmlDocPtr document, xmlC14NMode mode) {
  xmlChar* text = nullptr;
  const int length = xmlC14NDocDumpMemory(document, nullptr, mode, nullptr, 1, &text);
  if (length < 0) {
    return std::nullopt;
  }
  std::string result(reinterpret_cast<const char*>(text), static_cast<std::size_t>(length));
  xmlFree(text);
  return result;
}

void IgnoreErrors(void*, const char*, ...) {}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  xmlSetGenericErrorFunc(nullptr, IgnoreErrors);
  const std::string text = Fuzz::TextOf(data, size);
  const auto document = ParseText(text);
  if (document == nullptr) {
    return 0;
  }
  xmlDocPtr oracle =
      xmlReadMemory(text.data(), static_cast<int>(text.size()), nullptr, nullptr,
                    XML_PARSE_NONET | XML_PARSE_NOERROR | XML_PARSE_NOWARNING | XML_PARSE_NOCDATA);
  Fuzz::Require(oracle != nullptr);
  const std::pair<const char*, xmlC14NMode> modes[] = {
      {"http://www.w3.org/TR/2001/REC-xml-c14n-20010315#WithComments", XML_C14N_1_0},
      {"http://www.w3.org/2001/10/xml-exc-c14n#WithComments", XML_C14N_EXCLUSIVE_1_0}};
  for (const auto& [algorithm, mode] : modes) {
    const auto ours = Ours(*document, algorithm);
    if (ours) {
      const auto theirs = Theirs(oracle, mode);
      Fuzz::Require(theirs && *ours == *theirs);
    }
  }
  xmlFreeDoc(oracle);
  return 0;
}
