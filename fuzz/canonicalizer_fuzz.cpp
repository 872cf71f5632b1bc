// libxml2 accepts every text that the parser accepts, and returns the same canonical forms of the
// document and of its first elements. The output of the writer is the same document.
#include <optional>

#include <tarnik/core/writer.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/security/canonicalizer.h>
#include <tarnik/xml/security/xml_security_exception.h>
#include <tarnik/xml/xml_writer.h>

#include "input.h"
#include "support/libxml2_oracle.h"
#include "xml_input.h"
#include "xml_mutator.h"

namespace {

using namespace Tarnik;
using Tarnik::Testing::OracleRequest;

constexpr int kElements = 3;
const std::vector<std::string> kPrefixes{"#default", "a", "b", "ds"};

std::string AlgorithmOf(const OracleRequest& request) {
  const std::string base = request.exclusive ? "http://www.w3.org/2001/10/xml-exc-c14n#"
                                             : "http://www.w3.org/TR/2001/REC-xml-c14n-20010315#";
  return base + (request.withComments ? "WithComments" : "");
}

std::optional<std::string> Ours(const Xml::Node& node, const OracleRequest& request) {
  const auto writer = CreateStringWriter();
  try {
    Xml::Security::CreateCanonicalizer(AlgorithmOf(request), request.inclusivePrefixes)
        ->Canonicalize(&node, writer.get());
  } catch (const Xml::Security::XmlSecurityException&) {
    return std::nullopt;
  }
  return writer->TakeText();
}

// Elements in document order.
void Collect(const Xml::ElementNode& element, std::vector<const Xml::ElementNode*>& elements) {
  elements.push_back(&element);
  for (const Xml::Node* node = element.FirstChild(); node != nullptr && elements.size() < kElements;
       node = node->NextSibling()) {
    if (node->Kind() == Xml::NodeKind::kElement) {
      Collect(static_cast<const Xml::ElementNode&>(*node), elements);
    }
  }
}

void Compare(const std::string& text, const Xml::Document& document) {
  std::vector<const Xml::ElementNode*> elements;
  Collect(*document.RootElement(), elements);
  for (int variant = 0; variant < 6; ++variant) {
    OracleRequest request;
    request.exclusive = variant % 2 == 1;
    request.withComments = variant % 3 != 0;
    if (variant >= 4) {
      request.inclusivePrefixes = request.exclusive ? kPrefixes : std::vector<std::string>();
    }
    const Xml::Node* node = &document;
    if (variant >= 2) {
      const std::size_t index = static_cast<std::size_t>(variant) % elements.size();
      request.element = static_cast<int>(index);
      node = elements[index];
    }
    const auto ours = Ours(*node, request);
    const auto theirs = Tarnik::Testing::CanonicalizeWithLibXml2(text, request);
    Fuzz::Require(ours && ours == theirs);
  }
}

void RequireSameWhenWritten(const Xml::Document& document) {
  const auto writer = CreateStringWriter();
  Xml::WriteXml(&document, writer.get());
  const auto again = Fuzz::ParseXml(writer->Text());
  Fuzz::Require(again != nullptr);
  const auto second = CreateStringWriter();
  Xml::WriteXml(again.get(), second.get());
  Fuzz::Require(second->Text() == writer->Text());
  OracleRequest request;
  request.withComments = true;
  Fuzz::Require(Ours(document, request) == Ours(*again, request));
}

}  // namespace

extern "C" std::size_t LLVMFuzzerCustomMutator(std::uint8_t* data, std::size_t size,
                                               std::size_t maxSize, unsigned seed) {
  return Fuzz::MutateXml(data, size, maxSize, seed);
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string text = Fuzz::TextOf(data, size);
  const auto document = Fuzz::ParseXml(text);
  if (document == nullptr) {
    return 0;
  }
  RequireSameWhenWritten(*document);
  if (Fuzz::HasOddNamespace(*document)) {
    return 0;
  }
  Fuzz::Require(Tarnik::Testing::IsWellFormedForLibXml2(text));
  if (Fuzz::HasRelativeNamespace(*document)) {
    Fuzz::Require(!Ours(*document, {}));
    return 0;
  }
  Compare(text, *document);
  return 0;
}
