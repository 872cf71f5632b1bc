#include "xml/request_bodies.h"

#include <gmock/gmock.h>

#include "xml/built_xml.h"

namespace SsoClient {
namespace {

TEST(AdviceBuildersTest, AnAttributeHoldsItsValuesInOrder) {
  EXPECT_EQ(Testing::BuiltXml(*BuildAdviceAttribute({"N", {"b", "", "a"}})),
            "<rsa-advice:Attribute Name=\"N\">"
            "<rsa-advice:AttributeValue xsi:type=\"xs:string\">b</rsa-advice:AttributeValue>"
            "<rsa-advice:AttributeValue xsi:type=\"xs:string\"></rsa-advice:AttributeValue>"
            "<rsa-advice:AttributeValue xsi:type=\"xs:string\">a</rsa-advice:AttributeValue>"
            "</rsa-advice:Attribute>");
}

TEST(AdviceBuildersTest, AnAttributeWithoutValuesIsEmpty) {
  EXPECT_EQ(Testing::BuiltXml(*BuildAdviceAttribute({"N", {}})),
            "<rsa-advice:Attribute Name=\"N\"/>");
}

TEST(AdviceBuildersTest, AnAdviceHoldsItsAttributesInOrder) {
  EXPECT_EQ(Testing::BuiltXml(*BuildAdvice({"S", {{"z", {}}, {"a", {}}}})),
            "<rsa-advice:Advice AdviceSource=\"S\"><rsa-advice:Attribute Name=\"z\"/>"
            "<rsa-advice:Attribute Name=\"a\"/></rsa-advice:Advice>");
}

}  // namespace
}  // namespace SsoClient
