#include "token/name_id_reader.h"

#include <ssoclient/exceptions.h>

#include "support/thrown_message.h"

namespace SsoClient {
namespace {

using TestSupport::ThrownMessage;

constexpr char kUpn[] = "http://schemas.xmlsoap.org/claims/UPN";

TEST(PrincipalFromNameId, SplitsAtTheLastAtSign) {
  const PrincipalId plain = PrincipalFromNameId(kUpn, "alice@example.com");
  EXPECT_EQ(plain.name, "alice");
  EXPECT_EQ(plain.domain, "example.com");
  const PrincipalId twice = PrincipalFromNameId(kUpn, "alice@home@example.com");
  EXPECT_EQ(twice.name, "alice@home");
  EXPECT_EQ(twice.domain, "example.com");
}

TEST(PrincipalFromNameId, RejectsMissingPart) {
  for (const std::string value : {"alice", "@example.com", "alice@", "@", "", "a@b@"}) {
    EXPECT_EQ(ThrownMessage<ParseException>([&] { PrincipalFromNameId(kUpn, value); }),
              "Failed to parse the UPN NameID: `" + value + "'; name or domain part is missing.");
  }
}

TEST(PrincipalFromNameId, RejectsOtherFormat) {
  EXPECT_EQ(ThrownMessage<ParseException>([] { PrincipalFromNameId("urn:other", "a@b"); }),
            "Invalid or unsupported NameId format 'urn:other");
  EXPECT_EQ(ThrownMessage<ParseException>([] { PrincipalFromNameId("", "a@b"); }),
            "Invalid or unsupported NameId format '");
  EXPECT_EQ(ThrownMessage<ParseException>(
                [] { PrincipalFromNameId("http://schemas.xmlsoap.org/claims/upn", "a@b"); }),
            "Invalid or unsupported NameId format 'http://schemas.xmlsoap.org/claims/upn");
}

TEST(PrincipalFromNameId, JudgesTheFormatBeforeTheValue) {
  EXPECT_EQ(ThrownMessage<ParseException>([] { PrincipalFromNameId("urn:other", "alice"); }),
            "Invalid or unsupported NameId format 'urn:other");
}

TEST(PrincipalFromGroupIdentity, SplitsAtTheFirstBackslash) {
  const PrincipalId plain = PrincipalFromGroupIdentity("EXAMPLE\\staff");
  EXPECT_EQ(plain.name, "staff");
  EXPECT_EQ(plain.domain, "EXAMPLE");
  const PrincipalId twice = PrincipalFromGroupIdentity("EXAMPLE\\staff\\night");
  EXPECT_EQ(twice.name, "staff\\night");
  EXPECT_EQ(twice.domain, "EXAMPLE");
}

TEST(PrincipalFromGroupIdentity, RejectsMissingPart) {
  for (const std::string value : {"staff", "\\staff", "EXAMPLE\\", "\\", "", "EXAMPLE/staff"}) {
    EXPECT_EQ(ThrownMessage<ParseException>([&] { PrincipalFromGroupIdentity(value); }),
              "Failed to parse Group Identity value: `" + value + "'; domain or group missing");
  }
}

}  // namespace
}  // namespace SsoClient
