#include "crypto/object_identifier.h"

#include <string>

#include <gtest/gtest.h>

namespace Tarnik::Testing {
namespace {

using Crypto::IsDottedIdentifier;
using Crypto::ObjectIdentifierOf;

TEST(ObjectIdentifierTest, IsEncoded) {
  EXPECT_EQ(ObjectIdentifierOf("2.5.4.3"), "\x55\x04\x03");
  EXPECT_EQ(ObjectIdentifierOf("1.2.840.10045.3.1.7"), "\x2A\x86\x48\xCE\x3D\x03\x01\x07");
  EXPECT_EQ(ObjectIdentifierOf("2.999.1"), "\x88\x37\x01");
}

TEST(ObjectIdentifierTest, HasNoOtherForm) {
  for (const char* text :
       {"", ".", "2.", ".5", "2..5", "2.05", "2 5", "2.5.4.3 ", "2.5.4.-3", "x"}) {
    EXPECT_FALSE(IsDottedIdentifier(text)) << text;
    EXPECT_EQ(ObjectIdentifierOf(text), "") << text;
  }
  for (const char* text : {"3.1.2", "1.40.1", "2"}) {
    EXPECT_TRUE(IsDottedIdentifier(text)) << text;
    EXPECT_EQ(ObjectIdentifierOf(text), "") << text;
  }
}

TEST(ObjectIdentifierTest, IsOfLimitedLength) {
  const std::string longest = "2.5." + std::string(124, '1');
  EXPECT_TRUE(IsDottedIdentifier(longest));
  EXPECT_NE(ObjectIdentifierOf(longest), "");
  EXPECT_FALSE(IsDottedIdentifier(longest + "1"));
}

}  // namespace
}  // namespace Tarnik::Testing
