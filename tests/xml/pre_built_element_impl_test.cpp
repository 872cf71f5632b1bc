#include "xml/builders.h"

#include <gmock/gmock.h>

#include "xml/built_xml.h"

namespace SsoClient {
namespace {

TEST(PreBuiltElementImplTest, EveryBuildHandsOutTheOneElement) {
  Tarnik::Ref<Tarnik::Xml::ElementNode> element;
  Tarnik::Xml::CreateElementNode("a", "E", element);
  const PreBuiltElementImpl builder(element);
  EXPECT_EQ(Testing::Built(builder), element);
  EXPECT_EQ(Testing::Built(builder), element);
}

TEST(PreBuiltElementImplTest, KeepsTheElementAlive) {
  Tarnik::Ref<Tarnik::Xml::ElementNode> element;
  Tarnik::Xml::CreateElementNode("a", "E", element);
  const PreBuiltElementImpl builder(element);
  element = nullptr;
  EXPECT_EQ(Testing::Built(builder)->QualifiedNameText(), "a:E");
}

}  // namespace
}  // namespace SsoClient
