#include "token/saml_token_impl.h"

#include <cstddef>
#include <cstring>
#include <limits>
#include <memory>
#include <set>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ssoclient/principal_id.h>
#include <ssoclient/saml_token.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/system/date_time.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/security/signature.h>

#include "support/assertion_text.h"
#include "support/local_zone.h"
#include "support/parse_xml.h"
#include "support/vtable_slot.h"
#include "token/assertion_reader.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::Ref;
using Tarnik::System::DateTime;

const DateTime kNow = DateTime::Parse("2024-03-05T07:01:00Z");

std::shared_ptr<const SamlTokenImpl> MakeToken(const AssertionText& text, long tolerance = 600) {
  const std::string xml = text.ToXml();
  return std::make_shared<const SamlTokenImpl>(ReadAssertion(ParseXml(xml)->RootElement()), xml,
                                               tolerance);
}

AssertionText FullText() {
  return AssertionText(kNow).Delegate().ConfirmByKey(TrustedCredential().certificatePem);
}

TEST(SamlTokenImplTest, ReturnsEveryValue) {
  const AssertionText text = FullText();
  const auto token = MakeToken(text);
  EXPECT_EQ(token->Id(), "_a1");
  EXPECT_EQ(token->Issuer(), "https://sts.example.com/STS");
  EXPECT_EQ(token->Xml(), text.ToXml());
  EXPECT_EQ(token->StartTime().ToString(), "2024-03-05T07:00:00.000Z");
  EXPECT_EQ(token->ExpirationTime().ToString(), "2024-03-05T08:01:00.000Z");
  EXPECT_EQ(token->Subject().name, "alice");
  EXPECT_EQ(token->Subject().domain, "example.com");
  EXPECT_TRUE(token->IsRenewable());
  EXPECT_TRUE(token->IsDelegable());
  EXPECT_FALSE(token->IsSolution());
  EXPECT_EQ(token->ConfirmationType(), HOLDER_OF_KEY);
  const auto certificate = token->HolderOfKeyCertificate();
  ASSERT_NE(certificate, nullptr);
  const auto expected =
      Tarnik::Crypto::CreateCertificatesFromPem(TrustedCredential().certificatePem).front();
  ASSERT_EQ(certificate->DerLength(), expected->DerLength());
  EXPECT_EQ(std::memcmp(certificate->DerBytes(), expected->DerBytes(), expected->DerLength()), 0);
  ASSERT_NE(token->GetSignature(), nullptr);
  EXPECT_EQ(token->GetSignature()->References().front().uri, "#_a1");
}

TEST(SamlTokenImplTest, ReplacesWhatItsArgumentsHeld) {
  const auto token = MakeToken(FullText());
  SubjectNames names{"old", "old"};
  token->GetSubjectNames(names);
  EXPECT_EQ(names.givenName, "Alice");
  EXPECT_EQ(names.surname, "Archer");
  std::vector<PrincipalId> groups{{"old", "old"}, {"old", "old"}, {"old", "old"}};
  token->GetGroups(groups);
  ASSERT_EQ(groups.size(), 2U);
  EXPECT_EQ(groups[0].name, "staff");
  EXPECT_EQ(groups[0].domain, "EXAMPLE");
  EXPECT_EQ(groups[1].name, "admins");
  EXPECT_EQ(groups[1].domain, "EXAMPLE");
  std::vector<Delegate> chain(5);
  token->GetDelegationChain(chain);
  ASSERT_EQ(chain.size(), 2U);
  EXPECT_EQ(chain[0].delegate.name, "first");
  EXPECT_EQ(chain[0].delegate.domain, "example.com");
  EXPECT_EQ(chain[0].delegationInstant.ToString(), "2024-03-05T07:08:09.010Z");
  EXPECT_EQ(chain[1].delegate.name, "second");
  EXPECT_EQ(chain[1].delegate.domain, "example.com");
  EXPECT_EQ(chain[1].delegationInstant.ToString(), "2024-03-05T07:08:10.000Z");
  std::set<std::string> audiences{"old"};
  token->GetAudiences(audiences);
  EXPECT_EQ(audiences, (std::set<std::string>{"https://a.example", "https://b.example"}));
  std::vector<Advice> advice(3);
  token->GetAdvice(advice);
  ASSERT_EQ(advice.size(), 1U);
  EXPECT_EQ(advice[0].source, "urn:source");
  ASSERT_EQ(advice[0].attributes.size(), 1U);
  EXPECT_EQ(advice[0].attributes[0].name, "urn:hint");
  EXPECT_EQ(advice[0].attributes[0].values, (std::vector<std::string>{"one", "two"}));
}

TEST(SamlTokenImplTest, IsEmptyWithoutTheOptionalParts) {
  AssertionText text(kNow);
  text.advice.clear();
  text.authnStatement.clear();
  text.attributeStatement.clear();
  text.conditions = text.conditions.substr(0, text.conditions.find('>')) + "/>";
  const auto token = MakeToken(text);
  EXPECT_FALSE(token->IsRenewable());
  EXPECT_FALSE(token->IsDelegable());
  EXPECT_FALSE(token->IsSolution());
  EXPECT_EQ(token->ConfirmationType(), BEARER);
  EXPECT_EQ(token->HolderOfKeyCertificate(), nullptr);
  SubjectNames names{"old", "old"};
  token->GetSubjectNames(names);
  EXPECT_EQ(names.givenName + names.surname, "");
  std::vector<PrincipalId> groups(1);
  token->GetGroups(groups);
  EXPECT_TRUE(groups.empty());
  std::vector<Delegate> chain(1);
  token->GetDelegationChain(chain);
  EXPECT_TRUE(chain.empty());
  std::set<std::string> audiences{"old"};
  token->GetAudiences(audiences);
  EXPECT_TRUE(audiences.empty());
  std::vector<Advice> advice(1);
  token->GetAdvice(advice);
  EXPECT_TRUE(advice.empty());
}

TEST(SamlTokenImplTest, IsRenewableAndDelegableByCountsOtherThanZero) {
  for (const char* count : {"0", "-0", "+0", "000"}) {
    AssertionText text(kNow);
    text.conditions =
        Replaced(text.conditions, "Count=\"5\"", std::string("Count=\"") + count + "\"");
    EXPECT_FALSE(MakeToken(text)->IsRenewable());
    EXPECT_TRUE(MakeToken(text)->IsDelegable());
    text = AssertionText(kNow);
    text.conditions =
        Replaced(text.conditions, "Count=\"10\"", std::string("Count=\"") + count + "\"");
    EXPECT_TRUE(MakeToken(text)->IsRenewable());
    EXPECT_FALSE(MakeToken(text)->IsDelegable());
  }
}

TEST(SamlTokenImplTest, IsRenewableAndDelegableByACountOfOne) {
  AssertionText text(kNow);
  text.conditions = Replaced(text.conditions, "Count=\"5\"", "Count=\"01\"");
  text.conditions = Replaced(text.conditions, "Count=\"10\"", "Count=\"1\"");
  EXPECT_TRUE(MakeToken(text)->IsRenewable());
  EXPECT_TRUE(MakeToken(text)->IsDelegable());
}

TEST(SamlTokenImplTest, IsDelegableWithoutADelegationChain) {
  AssertionText text(kNow);
  const auto chainLength = [](const SamlToken& token) {
    std::vector<Delegate> chain(1);
    token.GetDelegationChain(chain);
    return chain.size();
  };
  EXPECT_TRUE(MakeToken(text)->IsDelegable());
  EXPECT_EQ(chainLength(*MakeToken(text)), 0U);
  text.conditions = Replaced(text.conditions, "<saml2:ProxyRestriction Count=\"10\"/>", "");
  EXPECT_FALSE(MakeToken(text)->IsDelegable());
  EXPECT_EQ(chainLength(*MakeToken(text)), 0U);
  EXPECT_FALSE(MakeToken(text.Delegate())->IsDelegable());
  EXPECT_EQ(chainLength(*MakeToken(text)), 2U);
}

TEST(SamlTokenImplTest, IsASolutionWhenItsAttributeSaysSo) {
  AssertionText text(kNow);
  text.attributeStatement = Replaced(text.attributeStatement, ">false<", ">True<");
  EXPECT_TRUE(MakeToken(text)->IsSolution());
}

TEST(SamlTokenImplTest, AddsItsToleranceToTheExpirationTime) {
  const AssertionText text(kNow);
  EXPECT_EQ(MakeToken(text, 0)->ExpirationTimeWithTolerance(), MakeToken(text)->ExpirationTime());
  EXPECT_EQ(MakeToken(text)->ExpirationTimeWithTolerance().ToString(), "2024-03-05T08:11:00.000Z");
  EXPECT_EQ(MakeToken(text, -60)->ExpirationTimeWithTolerance().ToString(),
            "2024-03-05T08:00:00.000Z");
}

TEST(SamlTokenImplTest, ReturnsItsTimesInUtcInEveryZone) {
  const LocalZone zone;
  const auto token = MakeToken(AssertionText(kNow));
  EXPECT_EQ(token->StartTime().ToString(), "2024-03-05T07:00:00.000Z");
  EXPECT_EQ(token->ExpirationTime().ToString(), "2024-03-05T08:01:00.000Z");
  EXPECT_EQ(token->ExpirationTimeWithTolerance().ToString(), "2024-03-05T08:11:00.000Z");
}

TEST(SamlTokenImplTest, StopsAtTheEndsOfTimeWithExtremeTolerances) {
  const AssertionText text(kNow);
  EXPECT_EQ(
      MakeToken(text, std::numeric_limits<long>::max())->ExpirationTimeWithTolerance().ToString(),
      "9999-12-31T23:59:59.999999Z");
  EXPECT_EQ(
      MakeToken(text, std::numeric_limits<long>::min())->ExpirationTimeWithTolerance().ToString(),
      "0001-01-01T00:00:00.000Z");
}

TEST(SamlTokenImplTest, KeepsItsSignaturesTreeAlive) {
  const auto token = MakeToken(AssertionText(kNow));
  const Tarnik::Xml::ElementNode* signature = token->GetSignature()->Element();
  ASSERT_NE(signature, nullptr);
  ASSERT_NE(signature->ParentElement(), nullptr);
  EXPECT_EQ(signature->ParentElement()->FindAttribute("ID"), "_a1");
}

// Calls slot `index` of the token's virtual table.
template <class Result, class... Arguments>
Result CallSlot(const SamlToken* token, std::size_t index, Arguments... arguments) {
  return VtableSlot<Result(const SamlToken*, Arguments...)>(token, index)(token, arguments...);
}

TEST(SamlTokenTest, KeepsTheSlotOrderOfItsValues) {
  AssertionText text = FullText();
  text.conditions = Replaced(text.conditions, "Count=\"10\"", "Count=\"0\"");
  const auto implementation = MakeToken(text);
  const SamlToken* token = implementation.get();
  EXPECT_EQ(&CallSlot<const std::string&>(token, 0), &token->Id());
  EXPECT_EQ(&CallSlot<const DateTime&>(token, 1), &token->StartTime());
  EXPECT_EQ(&CallSlot<const DateTime&>(token, 2), &token->ExpirationTime());
  EXPECT_EQ(CallSlot<DateTime>(token, 3), token->ExpirationTimeWithTolerance());
  EXPECT_EQ(&CallSlot<const PrincipalId&>(token, 4), &token->Subject());
  EXPECT_EQ(CallSlot<TokenConfirmationType>(token, 8), HOLDER_OF_KEY);
  EXPECT_EQ(&CallSlot<const std::string&>(token, 15), &token->Issuer());
  EXPECT_EQ(&CallSlot<const std::string&>(token, 17), &token->Xml());
  const auto certificate = CallSlot<Ref<const Tarnik::Crypto::Certificate>>(token, 14);
  EXPECT_EQ(certificate, token->HolderOfKeyCertificate());
  const auto signature = CallSlot<Ref<Tarnik::Xml::Security::Signature>>(token, 16);
  EXPECT_EQ(signature, token->GetSignature());
}

TEST(SamlTokenTest, KeepsTheSlotOrderOfItsFlags) {
  for (int flags = 0; flags < 8; ++flags) {
    AssertionText text(kNow);
    text.conditions =
        Replaced(text.conditions, "Count=\"5\"", (flags & 1) ? "Count=\"5\"" : "Count=\"0\"");
    text.conditions =
        Replaced(text.conditions, "Count=\"10\"", (flags & 2) ? "Count=\"10\"" : "Count=\"0\"");
    text.attributeStatement =
        Replaced(text.attributeStatement, ">false<", (flags & 4) ? ">true<" : ">false<");
    const auto implementation = MakeToken(text);
    const SamlToken* token = implementation.get();
    EXPECT_EQ(CallSlot<bool>(token, 5), (flags & 1) != 0);
    EXPECT_EQ(CallSlot<bool>(token, 6), (flags & 2) != 0);
    EXPECT_EQ(CallSlot<bool>(token, 7), (flags & 4) != 0);
  }
}

TEST(SamlTokenTest, KeepsTheSlotOrderOfItsCollections) {
  const auto implementation = MakeToken(FullText());
  const SamlToken* token = implementation.get();
  SubjectNames names;
  CallSlot<void, SubjectNames&>(token, 9, names);
  EXPECT_EQ(names.givenName, "Alice");
  EXPECT_EQ(names.surname, "Archer");
  std::vector<PrincipalId> groups;
  CallSlot<void, std::vector<PrincipalId>&>(token, 10, groups);
  EXPECT_EQ(groups.size(), 2U);
  std::vector<Delegate> chain;
  CallSlot<void, std::vector<Delegate>&>(token, 11, chain);
  ASSERT_EQ(chain.size(), 2U);
  EXPECT_EQ(chain[1].delegate.name, "second");
  std::set<std::string> audiences;
  CallSlot<void, std::set<std::string>&>(token, 12, audiences);
  EXPECT_EQ(audiences.size(), 2U);
  std::vector<Advice> advice;
  CallSlot<void, std::vector<Advice>&>(token, 13, advice);
  ASSERT_EQ(advice.size(), 1U);
  EXPECT_EQ(advice[0].source, "urn:source");
}

}  // namespace
}  // namespace SsoClient::Testing
