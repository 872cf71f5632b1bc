#include <optional>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <tarnik/core/writer.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/element_node.h>

#include "support/libxml2_oracle.h"
#include "support/random_xml.h"
#include "support/xml_text.h"
#include "xml/security/c14n.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;
using namespace Tarnik::Xml::Security;

const Node* NextNode(const Node* node) {
  if (node->Kind() == NodeKind::kElement) {
    if (const Node* child = static_cast<const ElementNode*>(node)->FirstChild()) {
      return child;
    }
  }
  while (node != nullptr && node->NextSibling() == nullptr) {
    node = node->ParentElement();
  }
  return node == nullptr ? nullptr : node->NextSibling();
}

const ElementNode* ElementAt(const Document& document, int index) {
  for (const Node* node = document.RootElement(); node != nullptr; node = NextNode(node)) {
    if (node->Kind() == NodeKind::kElement && index-- == 0) {
      return static_cast<const ElementNode*>(node);
    }
  }
  return nullptr;
}

std::string Canonicalize(const Document& document, const OracleRequest& request) {
  const Node* apex =
      request.element ? static_cast<const Node*>(ElementAt(document, *request.element)) : &document;
  C14nOptions options;
  options.exclusive = request.exclusive;
  options.withComments = request.withComments;
  options.inclusivePrefixes = request.inclusivePrefixes;
  const Ref<StringWriter> writer = CreateStringWriter();
  WriteCanonical(apex, nullptr, options, *writer);
  return writer->TakeText();
}

std::string Describe(const OracleRequest& request, unsigned seed, const std::string& xml) {
  std::string text =
      "seed " + std::to_string(seed) + (request.exclusive ? " exclusive" : " inclusive");
  text += request.withComments ? " with comments" : "";
  text += request.element ? " element " + std::to_string(*request.element) : " document";
  for (const std::string& prefix : request.inclusivePrefixes) {
    text += " +" + prefix;
  }
  return text + "\n" + xml;
}

class C14nOracleTest : public testing::TestWithParam<unsigned> {};

TEST_P(C14nOracleTest, AgreesWithLibXml2OnGeneratedDocuments) {
  constexpr unsigned kDocuments = 60;
  static const std::vector<std::string> kPrefixes = {"#default", "a", "b", "c", "xml", "none", "_"};
  for (unsigned seed = GetParam() * kDocuments; seed < (GetParam() + 1) * kDocuments; ++seed) {
    RandomXml random(seed);
    const std::string xml = random.Document();
    const Ref<Document> document = ParseXml(xml);
    for (int variant = 0; variant < 12; ++variant) {
      OracleRequest request;
      request.exclusive = variant % 2 == 1;
      request.withComments = variant % 4 >= 2;
      if (variant >= 4) {
        request.element = random.Below(random.Elements());
      }
      for (int count = request.exclusive ? random.Below(4) : 0; count > 0; --count) {
        request.inclusivePrefixes.push_back(random.Pick(kPrefixes));
      }
      const std::optional<std::string> expected = CanonicalizeWithLibXml2(xml, request);
      ASSERT_TRUE(expected.has_value()) << Describe(request, seed, xml);
      ASSERT_EQ(Canonicalize(*document, request), *expected) << Describe(request, seed, xml);
    }
  }
}

INSTANTIATE_TEST_SUITE_P(Seeds, C14nOracleTest, testing::Range(0U, 10U));

}  // namespace
}  // namespace Tarnik::Testing
