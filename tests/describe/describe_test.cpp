#include "describe/describe.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <set>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ssoclient/principal_id.h>
#include <ssoclient/saml_token.h>
#include <ssoclient/token_spec.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/system/date_time.h>
#include <tarnik/xml/security/signature.h>

namespace SsoClient::Testing {
namespace {

using Tarnik::System::DateTime;

// A token with settable values that records which functions are called.
class FakeToken final : public SamlToken {
 public:
  const std::string& Id() const override { return text_; }
  const DateTime& StartTime() const override { return Record("StartTime"), start; }
  const DateTime& ExpirationTime() const override { return Record("ExpirationTime"), end; }
  DateTime ExpirationTimeWithTolerance() const override { return end; }
  const PrincipalId& Subject() const override { return Record("Subject"), subject; }
  bool IsRenewable() const override { return Record("IsRenewable"), renewable; }
  bool IsDelegable() const override { return Record("IsDelegable"), delegable; }
  bool IsSolution() const override { return Record("IsSolution"), solution; }
  TokenConfirmationType ConfirmationType() const override {
    return Record("ConfirmationType"), confirmation;
  }
  void GetSubjectNames(SubjectNames&) const override {}
  void GetGroups(std::vector<PrincipalId>& out) const override {
    Record("GetGroups");
    out = groups;
  }
  void GetDelegationChain(std::vector<Delegate>& out) const override {
    Record("GetDelegationChain");
    out = chain;
  }
  void GetAudiences(std::set<std::string>&) const override {}
  void GetAdvice(std::vector<Advice>&) const override {}
  Tarnik::Ref<const Tarnik::Crypto::Certificate> HolderOfKeyCertificate() const override {
    return nullptr;
  }
  const std::string& Issuer() const override { return text_; }
  Tarnik::Ref<Tarnik::Xml::Security::Signature> GetSignature() const override { return nullptr; }
  const std::string& Xml() const override { return text_; }

  DateTime start = DateTime::Parse("2024-03-05T07:08:09.010Z");
  DateTime end = DateTime::Parse("2024-03-05T08:08:09Z");
  PrincipalId subject{"alice", "CORP"};
  bool renewable = false;
  bool delegable = false;
  bool solution = false;
  TokenConfirmationType confirmation = BEARER;
  std::vector<PrincipalId> groups;
  std::vector<Delegate> chain;

  mutable std::vector<std::string> asked;

 private:
  void Record(const char* operation) const { asked.emplace_back(operation); }

  std::string text_ = "SECRET";
};

TEST(DescribeTest, WritesPrincipalWithItsAsymmetricSpacing) {
  EXPECT_EQ(Describe(PrincipalId{"alice", "CORP"}), "{Name: alice; Domain:CORP}");
  EXPECT_EQ(Describe(PrincipalId{"alice", ""}), "{Name: alice; Domain:}");
  EXPECT_EQ(Describe(PrincipalId{"", ""}), "{Name: ; Domain:}");
}

TEST(DescribeTest, DoesNotExpandPlaceholdersInValues) {
  EXPECT_EQ(Describe(PrincipalId{"%2", "%1"}), "{Name: %2; Domain:%1}");
}

TEST(DescribeTest, WritesMissingPrincipalAsNull) {
  const PrincipalId* none = nullptr;
  EXPECT_EQ(Describe(none), "(null)");
  const PrincipalId principal{"alice", "CORP"};
  EXPECT_EQ(Describe(&principal), "{Name: alice; Domain:CORP}");
}

TEST(DescribeTest, WritesDelegateWithItsInstant) {
  const DateTime instant = DateTime::Parse("2024-03-05T07:08:09.010Z");
  EXPECT_EQ(Describe(Delegate{{"bob", "CORP"}, instant}),
            "{Name: bob; Domain:CORP} at 2024-03-05T07:08:09.010Z");
  EXPECT_EQ(Describe(Delegate{{"bob", "CORP"}, DateTime::Parse("2024-03-05T09:08:09+02:00")}),
            "{Name: bob; Domain:CORP} at 2024-03-05T09:08:09.000+02:00");
}

TEST(DescribeTest, JoinsAttributeValuesByPosition) {
  EXPECT_EQ(Describe(AdviceAttribute{"N", {}}), "[source=N, attributes=[]]");
  EXPECT_EQ(Describe(AdviceAttribute{"N", {"a"}}), "[source=N, attributes=[a]]");
  EXPECT_EQ(Describe(AdviceAttribute{"N", {"x", ""}}), "[source=N, attributes=[x, ]]");
  EXPECT_EQ(Describe(AdviceAttribute{"N", {"", "x"}}), "[source=N, attributes=[, x]]");
  EXPECT_EQ(Describe(AdviceAttribute{"N", {"", ""}}), "[source=N, attributes=[, ]]");
}

TEST(DescribeTest, WritesAdviceWithItsAttributes) {
  EXPECT_EQ(Describe(Advice{"S", {{"N", {"a", "b"}}}}),
            "Advice [source=S, attributes=[[source=N, attributes=[a, b]]]]");
  EXPECT_EQ(Describe(Advice{"S", {}}), "Advice [source=S, attributes=[]]");
  EXPECT_EQ(Describe(Advice{"S", {{"N", {}}, {"M", {"c"}}}}),
            "Advice [source=S, attributes=[[source=N, attributes=[]], [source=M, "
            "attributes=[c]]]]");
}

TEST(DescribeTest, WritesSpecWithoutOptionalParts) {
  EXPECT_EQ(Describe(TokenSpec{}),
            "TokenSpec [tokenLifetimeSec=0, delegable=false, delegateTo=<unset>, renewable=false, "
            "confirmationType=0,audienceRestriction=, advice=[]");
}

TEST(DescribeTest, WritesSpecWithAllParts) {
  TokenSpec spec;
  spec.tokenLifetimeSec = INT64_MIN;
  spec.audienceRestriction = {"urn:b", "urn:a"};
  spec.advice = {{"S", {}}, {"T", {}}};
  spec.delegable = true;
  spec.delegateTo = std::string("bob@CORP");
  spec.renewable = true;
  spec.confirmation = CONFIRMATION_BEARER;
  EXPECT_EQ(Describe(spec),
            "TokenSpec [tokenLifetimeSec=-9223372036854775808, delegable=true, "
            "delegateTo=bob@CORP, renewable=true, confirmationType=1,audienceRestriction=urn:a, "
            "urn:b, advice=[Advice [source=S, attributes=[]], Advice [source=T, attributes=[]]]");
}

TEST(DescribeTest, WritesTheConfirmationTypeAsItsNumber) {
  TokenSpec spec;
  spec.confirmation = static_cast<ConfirmationType>(-12);
  EXPECT_EQ(Describe(spec),
            "TokenSpec [tokenLifetimeSec=0, delegable=false, delegateTo=<unset>, renewable=false, "
            "confirmationType=-12,audienceRestriction=, advice=[]");
}

TEST(DescribeTest, DistinguishesAnEmptyDelegateFromNone) {
  TokenSpec spec;
  spec.delegateTo = std::string();
  EXPECT_EQ(Describe(spec),
            "TokenSpec [tokenLifetimeSec=0, delegable=false, delegateTo=, renewable=false, "
            "confirmationType=0,audienceRestriction=, advice=[]");
}

TEST(DescribeTest, KeepsTheSeparatorOfAnEmptyAudience) {
  TokenSpec spec;
  spec.audienceRestriction = {"", "urn:a"};
  EXPECT_EQ(Describe(spec),
            "TokenSpec [tokenLifetimeSec=0, delegable=false, delegateTo=<unset>, renewable=false, "
            "confirmationType=0,audienceRestriction=, urn:a, advice=[]");
}

TEST(CreateSamlTokenDescriptionTest, WritesTokenWithoutGroupsAndDelegates) {
  EXPECT_EQ(CreateSamlTokenDescription(FakeToken()),
            "SamlToken [subject={Name: alice; Domain:CORP}, groups=[], delegationChain=[], "
            "startTime=2024-03-05 07:08:09.010 UTC, expirationTime=2024-03-05 08:08:09.000 UTC, "
            "renewable=false, delegable=false, isSolution=false,confirmationType=0]");
}

TEST(CreateSamlTokenDescriptionTest, WritesTokenWithAllParts) {
  FakeToken token;
  token.renewable = true;
  token.delegable = true;
  token.solution = true;
  token.confirmation = HOLDER_OF_KEY;
  token.groups = {{"staff", "CORP"}, {"admins", "CORP"}};
  token.chain = {{{"first", "CORP"}, DateTime::Parse("2024-03-05T07:00:00Z")},
                 {{"second", "CORP"}, DateTime::Parse("2024-03-05T07:00:01.000002Z")}};
  EXPECT_EQ(CreateSamlTokenDescription(token),
            "SamlToken [subject={Name: alice; Domain:CORP}, groups=[{Name: staff; Domain:CORP}, "
            "{Name: admins; Domain:CORP}], delegationChain=[{Name: first; Domain:CORP} at "
            "2024-03-05T07:00:00.000Z, {Name: second; Domain:CORP} at "
            "2024-03-05T07:00:01.000002Z], startTime=2024-03-05 07:08:09.010 UTC, "
            "expirationTime=2024-03-05 08:08:09.000 UTC, renewable=true, delegable=true, "
            "isSolution=true,confirmationType=1]");
}

TEST(CreateSamlTokenDescriptionTest, ReadsEachValueOnceInOrder) {
  const FakeToken token;
  CreateSamlTokenDescription(token);
  EXPECT_EQ(token.asked,
            (std::vector<std::string>{"GetGroups", "GetDelegationChain", "StartTime",
                                      "ExpirationTime", "Subject", "IsRenewable", "IsDelegable",
                                      "IsSolution", "ConfirmationType"}));
}

// A token that returns a null address for its subject, as a token of another compiler can. C++ has
// no null references, so the function is put into a copy of the virtual table (Itanium C++ ABI,
// section 2.5), after the two entries before the functions.
class TokenWithoutSubject {
 public:
  TokenWithoutSubject() {
    constexpr std::size_t kSubjectSlot = 4;
    void* const* table = nullptr;
    std::memcpy(&table, static_cast<const void*>(&token_), sizeof table);
    std::memcpy(table_.data(), table - kEntriesBefore, sizeof table_);
    table_[kEntriesBefore + kSubjectSlot] = reinterpret_cast<void*>(&NoSubject);
    table = table_.data() + kEntriesBefore;
    std::memcpy(static_cast<void*>(&token_), &table, sizeof table);
  }
  const SamlToken& Get() const { return token_; }

 private:
  static constexpr std::size_t kEntriesBefore = 2;
  static constexpr std::size_t kSlots = 18;

  static const PrincipalId* NoSubject(const SamlToken*) { return nullptr; }

  FakeToken token_;
  std::array<void*, kEntriesBefore + kSlots> table_{};
};

TEST(CreateSamlTokenDescriptionTest, WritesAMissingSubjectAsNull) {
  const TokenWithoutSubject token;
  EXPECT_EQ(CreateSamlTokenDescription(token.Get()),
            "SamlToken [subject=(null), groups=[], delegationChain=[], "
            "startTime=2024-03-05 07:08:09.010 UTC, expirationTime=2024-03-05 08:08:09.000 UTC, "
            "renewable=false, delegable=false, isSolution=false,confirmationType=0]");
}

TEST(CreateSamlTokenDescriptionTest, NeverContainsTheXml) {
  EXPECT_EQ(CreateSamlTokenDescription(FakeToken()).find("SECRET"), std::string::npos);
}

}  // namespace
}  // namespace SsoClient::Testing
