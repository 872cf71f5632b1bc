#include <memory>
#include <typeinfo>

#include <gtest/gtest.h>

#include <tarnik/xml/security/xml_security_exception.h>

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml::Security;

template <class T>
void ExpectCloneKeepsClass() {
  const std::unique_ptr<Throwable> clone = T("fault").Clone();
  try {
    clone->Throw();
  } catch (const XmlSecurityException& exception) {
    EXPECT_EQ(typeid(exception), typeid(T));
    EXPECT_EQ(exception.Message(), "fault");
  }
}

TEST(XmlSecurityExceptionTest, KeepsItsClassWhenThrownFromAClone) {
  ExpectCloneKeepsClass<XmlSecurityException>();
  ExpectCloneKeepsClass<SignatureSyntaxException>();
}

}  // namespace
}  // namespace Tarnik::Testing
