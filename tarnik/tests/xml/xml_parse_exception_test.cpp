#include <memory>

#include <gtest/gtest.h>

#include <tarnik/xml/xml_parse_exception.h>

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;

TEST(XMLParseExceptionTest, ContainsTheFaultAndItsPosition) {
  const XMLParseException exception("mismatched tag", {12, 7});
  EXPECT_EQ(exception.Message(), "mismatched tag at line 12, column 7");
  EXPECT_STREQ(exception.what(), "mismatched tag at line 12, column 7");
  EXPECT_EQ(exception.Line(), 12U);
  EXPECT_EQ(exception.Column(), 7U);
}

TEST(XMLParseExceptionTest, KeepsItsClassWhenThrownFromAClone) {
  const std::unique_ptr<Throwable> clone = XMLParseException("fault", {3, 4}).Clone();
  try {
    clone->Throw();
  } catch (const XMLParseException& exception) {
    EXPECT_EQ(exception.Message(), "fault at line 3, column 4");
    EXPECT_EQ(exception.Line(), 3U);
  } catch (...) {
    ADD_FAILURE() << "another class";
  }
}

}  // namespace
}  // namespace Tarnik::Testing
