#include <string>

#include <gtest/gtest.h>

#include <tarnik/xml/document.h>
#include <tarnik/xml/security/ids.h>

#include "support/xml_text.h"

namespace Tarnik::Testing {
namespace {

using Xml::Security::PossibleId;

// Of the last attribute of an element with these attributes.
std::string IdOf(const std::string& attributes) {
  const auto document = ParseXml("<a " + attributes + "/>");
  const Xml::ElementNode& element = *document->RootElement();
  const auto id = PossibleId(element.AttributeAt(element.AttributeCount() - 1));
  return id ? std::string(*id) : "none";
}

TEST(PossibleIdTest, IsTheValueOfAnIdInAnyLetterCase) {
  for (const char* name : {"id", "Id", "iD", "ID", "xml:id", "xmlns:p=\"urn:p\" p:Id",
                           "xmlns:p=\"urn:p\" p:iD", "AssertionID"}) {
    EXPECT_EQ(IdOf(std::string(name) + "=\"_1\""), "_1") << name;
  }
}

TEST(PossibleIdTest, HasNoWhiteSpaceAroundIt) {
  EXPECT_EQ(IdOf("ID=\" _1\""), "_1");
  EXPECT_EQ(IdOf("ID=\"&#9;&#10;&#13; _1 &#13;&#10;&#9;\""), "_1");
  EXPECT_EQ(IdOf("ID=\"_1 2\""), "_1 2");
  EXPECT_EQ(IdOf("ID=\" \""), "");
  EXPECT_EQ(IdOf("ID=\"\""), "");
}

TEST(PossibleIdTest, KeepsTheLetterCaseOfTheValue) {
  EXPECT_EQ(IdOf("ID=\"_aA\""), "_aA");
}

TEST(PossibleIdTest, IsNotInAttributesOfOtherNames) {
  for (const char* name : {"i", "d", "idd", "xid", "assertionid", "AssertionId", "_id", "xmlns",
                           "xmlns:id=\"urn:p\" id:x"}) {
    EXPECT_EQ(IdOf(std::string(name) + "=\"urn:1\""), "none") << name;
  }
}

}  // namespace
}  // namespace Tarnik::Testing
