#include "crypto/attribute_types.h"

#include <string>

#include <gtest/gtest.h>

#include "crypto/object_identifier.h"

namespace Tarnik::Testing {
namespace {

using Crypto::AttributeTypeOf;
using Crypto::ObjectIdentifierOf;

TEST(AttributeTypesTest, KnowsTheNamesOfOtherPrograms) {
  const std::pair<const char*, const char*> types[] = {
      {"CN", "2.5.4.3"},
      {"cn", "2.5.4.3"},
      {"SN", "2.5.4.4"},
      {"SERIALNUMBER", "2.5.4.5"},
      {"serialNumber", "2.5.4.5"},
      {"C", "2.5.4.6"},
      {"L", "2.5.4.7"},
      {"ST", "2.5.4.8"},
      {"S", "2.5.4.8"},
      {"STREET", "2.5.4.9"},
      {"O", "2.5.4.10"},
      {"OU", "2.5.4.11"},
      {"T", "2.5.4.12"},
      {"PostalCode", "2.5.4.17"},
      {"G", "2.5.4.42"},
      {"I", "2.5.4.43"},
      {"GENERATION", "2.5.4.44"},
      {"DNQ", "2.5.4.46"},
      {"E", "1.2.840.113549.1.9.1"},
      {"EMAILADDRESS", "1.2.840.113549.1.9.1"},
      {"emailAddress", "1.2.840.113549.1.9.1"},
      {"DC", "0.9.2342.19200300.100.1.25"},
      {"UID", "0.9.2342.19200300.100.1.1"},
      {"jurisdictionC", "1.3.6.1.4.1.311.60.2.1.3"},
      {"unstructuredName", "1.2.840.113549.1.9.2"}};
  for (const auto& [name, identifier] : types) {
    EXPECT_EQ(AttributeTypeOf(name), ObjectIdentifierOf(identifier)) << name;
    EXPECT_EQ(AttributeTypeOf(identifier), ObjectIdentifierOf(identifier)) << identifier;
    EXPECT_EQ(AttributeTypeOf(std::string("oid.") + identifier), ObjectIdentifierOf(identifier));
  }
}

TEST(AttributeTypesTest, KnowsNoOthers) {
  for (const char* name : {"", "CNX", "C N", "UNDEF", "undefined", "OID.", "OID.CN",
                           "OID.OID.2.5.4.3", "2.5.4.", "OID"}) {
    EXPECT_EQ(AttributeTypeOf(name), "") << name;
  }
}

}  // namespace
}  // namespace Tarnik::Testing
