#include <set>
#include <string>

#include <gtest/gtest.h>

#include <ssoclient/access/failure_kind.h>
#include <ssoclient/exceptions.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/http/http_exception.h>
#include <tarnik/ssl/ssl_exception.h>
#include <tarnik/xml/security/xml_security_exception.h>
#include <tarnik/xml/xml_parse_exception.h>

namespace SsoClient::Access {

namespace {

constexpr int kLast = static_cast<int>(FailureKind::kLocal);

TEST(FailureKindTest, NamesAreDifferentAndKnown) {
  std::set<std::string> names;
  for (int kind = 0; kind <= kLast; ++kind) {
    const std::string name = NameOf(static_cast<FailureKind>(kind));
    EXPECT_NE(name, "unknown") << kind;
    EXPECT_TRUE(names.insert(name).second) << name;
  }
  EXPECT_STREQ(NameOf(FailureKind::kRefusedLogin), "refused-login");
  EXPECT_STREQ(NameOf(static_cast<FailureKind>(kLast + 1)), "unknown");
}

TEST(FailureKindTest, ClassesDetermineKinds) {
  EXPECT_EQ(Classify(CommunicationException("")), FailureKind::kUnreachable);
  EXPECT_EQ(Classify(InvalidCredentialsException("")), FailureKind::kRefusedLogin);
  EXPECT_EQ(Classify(PasswordExpiredException("")), FailureKind::kExpiredPassword);
  EXPECT_EQ(Classify(ParseException("")), FailureKind::kBadToken);
  EXPECT_EQ(Classify(InvalidSignatureException("")), FailureKind::kBadToken);
  EXPECT_EQ(Classify(SsoException("")), FailureKind::kFault);
  EXPECT_EQ(Classify(Tarnik::TimeoutException("")), FailureKind::kTimedOut);
  EXPECT_EQ(Classify(Tarnik::CancelledException("")), FailureKind::kAbandoned);
  EXPECT_EQ(Classify(Tarnik::Ssl::SSLException("")), FailureKind::kTls);
  EXPECT_EQ(Classify(Tarnik::Ssl::PeerTrustException("")), FailureKind::kTlsTrust);
  EXPECT_EQ(Classify(Tarnik::Ssl::PeerNameException("")), FailureKind::kTlsName);
  EXPECT_EQ(Classify(Tarnik::Ssl::TruncationException("")), FailureKind::kCutOff);
  EXPECT_EQ(Classify(Tarnik::Http::CutOffException("")), FailureKind::kCutOff);
  EXPECT_EQ(Classify(Tarnik::Http::HttpException("")), FailureKind::kBadAnswer);
  EXPECT_EQ(Classify(Tarnik::IOException("")), FailureKind::kUnreachable);
  EXPECT_EQ(Classify(Tarnik::Base64FormatException("")), FailureKind::kBadToken);
  EXPECT_EQ(Classify(Tarnik::Crypto::CryptoException("")), FailureKind::kBadToken);
  EXPECT_EQ(Classify(Tarnik::Xml::Security::XmlSecurityException("")), FailureKind::kBadToken);
  EXPECT_EQ(Classify(Tarnik::InvalidArgumentException("")), FailureKind::kLocal);
  EXPECT_EQ(Classify(Tarnik::InvalidStateException("")), FailureKind::kLocal);
  EXPECT_EQ(Classify(Tarnik::ResourceException("")), FailureKind::kLocal);
}

TEST(FailureKindTest, OnlyWhatNoServiceHasDecidedAllowsFailover) {
  const std::set<FailureKind> allowed = {
      FailureKind::kUnreachable, FailureKind::kTlsTrust, FailureKind::kTlsName,   FailureKind::kTls,
      FailureKind::kTimedOut,    FailureKind::kCutOff,   FailureKind::kHttpStatus};
  for (int kind = 0; kind <= kLast; ++kind) {
    const auto value = static_cast<FailureKind>(kind);
    EXPECT_EQ(AllowsFailover(value), allowed.count(value) != 0) << NameOf(value);
  }
}

}  // namespace

}  // namespace SsoClient::Access
