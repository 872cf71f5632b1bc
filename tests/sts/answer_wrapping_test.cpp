#include <cstddef>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include <ssoclient/saml_token.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/reader.h>
#include <tarnik/xml/security/key_info_resolver.h>

#include "sts/answers.h"
#include "sts/response_handler.h"
#include "support/assertion_text.h"
#include "support/forgeries.h"

// The client never accepts a forged assertion as a token, wherever it is in an answer of the
// service.
namespace SsoClient::Testing {
namespace {

std::string Issued(const std::string& content) {
  return Envelope(Collection(Rstr(Requested(content))));
}

std::string WithHeader(const std::string& answer, const std::string& header) {
  return Replaced(answer, "<S:Header/>", "<S:Header>" + header + "</S:Header>");
}

std::vector<std::string> InOneAnswer(const std::string& first, const std::string& second) {
  const std::string token = Requested(first);
  return {
      Issued(first + second),
      Issued("<x>" + first + "</x>" + second),
      Envelope(Collection(Rstr(token + Requested(second)))),
      Envelope(Collection(Rstr(token) + Rstr(Requested(second)))),
      Envelope(Collection(Rstr(token)) + Collection(Rstr(Requested(second)))),
      Envelope(Collection(Rstr("<RequestedSecurityToken xmlns=\"urn:x\">" + first +
                               "</RequestedSecurityToken>" + Requested(second)))),
      Replaced(Issued(second), "<S:Body ",
               "<S:Body xmlns:wst=\"urn:x\">" + Collection(Rstr(token)) + "</S:Body><S:Body "),
      WithHeader(Issued(second), first),
      WithHeader(Issued(second),
                 "<S:Body xmlns:wst=\"urn:x\">" + Collection(Rstr(token)) + "</S:Body>"),
  };
}

std::vector<std::string> Answers(const std::string& forged, const std::string& original) {
  std::vector<std::string> answers = InOneAnswer(forged, original);
  for (std::string& answer : InOneAnswer(original, forged)) {
    answers.push_back(std::move(answer));
  }
  for (const Place place : AllPlaces()) {
    const std::string arranged = Arranged(place, forged, original);
    if (!arranged.empty()) {
      answers.push_back(Issued(arranged));
    }
  }
  return answers;
}

// The name of the accepted subject; "" if refused.
std::string AcceptedSubject(const std::string& answer,
                            const Tarnik::Xml::Security::KeyInfoResolver* resolver) {
  const auto reader = Tarnik::CreateStringReader(answer);
  try {
    std::string assertion;
    ResponseHandlerImpl().ParseIssueResponse(reader.get(), assertion);
    return CreateSamlToken(assertion, resolver)->Subject().name;
  } catch (const Tarnik::Exception&) {
    return "";
  }
}

class AnswerWrappingTest : public testing::TestWithParam<std::tuple<ForgedId, ForgedSignature>> {};

TEST_P(AnswerWrappingTest, NeverReturnsTheForgedAssertion) {
  const auto& [id, signature] = GetParam();
  const std::string original = OriginalAssertion();
  const std::string forged = ForgedAssertion(id, signature, original);
  const auto resolver = TrustedResolver();
  EXPECT_EQ(AcceptedSubject(Issued(forged), resolver.get()), "");
  for (const std::string& answer : Answers(forged, original)) {
    const std::string accepted = AcceptedSubject(answer, resolver.get());
    EXPECT_TRUE(accepted.empty() || accepted == "alice") << accepted << " of " << answer;
  }
}

INSTANTIATE_TEST_SUITE_P(Arrangements, AnswerWrappingTest,
                         testing::Combine(testing::ValuesIn(AllForgedIds()),
                                          testing::ValuesIn(AllForgedSignatures())));

// Without verification, the same answers return the forged assertion. So in the tests above the
// forgeries are refused because of the signature.
TEST(AnswerWrappingControlTest, ReadsForgeriesWhenNothingIsVerified) {
  const std::string original = OriginalAssertion();
  const std::string forged = ForgedAssertion(ForgedId::kNew, ForgedSignature::kStranger, original);
  EXPECT_EQ(AcceptedSubject(Issued(original), TrustedResolver().get()), "alice");
  EXPECT_EQ(AcceptedSubject(Issued(original), nullptr), "alice");
  EXPECT_EQ(AcceptedSubject(Issued(forged), nullptr), "admin");
  std::size_t forgedOnes = 0;
  for (const std::string& answer : Answers(forged, original)) {
    forgedOnes += AcceptedSubject(answer, nullptr) == "admin" ? 1 : 0;
  }
  EXPECT_GE(forgedOnes, 5U);
}

}  // namespace
}  // namespace SsoClient::Testing
