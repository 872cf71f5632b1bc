#include <cstddef>
#include <new>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ssoclient/saml_token.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/ref.h>
#include <tarnik/xml/security/key_info_resolver.h>

#include "faults/fault_injection.h"
#include "support/assertion_text.h"
#include "support/forgeries.h"

// If a call fails while a token is read and verified, a forged token is never accepted, a valid one
// is accepted only if its signature was verified, and nothing leaks.
namespace SsoClient::Testing {
namespace {

using Tarnik::Xml::Security::KeyInfoResolver;

enum class Verdict { kAccepted, kRefused, kOutOfMemory };

Verdict VerdictOn(const std::string& xml, const KeyInfoResolver* resolver) {
  try {
    CreateSamlToken(xml, resolver);
    return Verdict::kAccepted;
  } catch (const std::bad_alloc&) {
    return Verdict::kOutOfMemory;
  } catch (const Tarnik::Exception&) {
    return Verdict::kRefused;
  }
}

struct Forgery {
  const char* name;
  std::string xml;
};

std::vector<Forgery> Forgeries() {
  const std::string original = OriginalAssertion();
  return {{"Tampered", Replaced(original, "alice@", "admin@")},
          {"Stranger", ForgedAssertion(ForgedId::kSame, ForgedSignature::kStranger, original)},
          {"MadeUp", ForgedAssertion(ForgedId::kSame, ForgedSignature::kMadeUp, original)}};
}

class TokenFaultsTest : public testing::Test {
 protected:
  // Set up once per process before the test, so that no call fails there.
  void SetUp() override { ASSERT_EQ(VerdictOn(original_, resolver_.get()), Verdict::kAccepted); }

  const std::string original_ = OriginalAssertion();
  const Tarnik::Ref<const KeyInfoResolver> resolver_ = TrustedResolver();
};

TEST_F(TokenFaultsTest, GoodTokenIsReadOrMemoryRunsOut) {
  std::size_t failures = 0;
  for (bool happened = true; happened;) {
    Verdict verdict;
    {
      const InjectedFault fault(FaultKind::kAllocation, failures);
      verdict = VerdictOn(original_, resolver_.get());
      happened = fault.HasHappened();
    }
    ASSERT_EQ(verdict, happened ? Verdict::kOutOfMemory : Verdict::kAccepted) << failures;
    ++failures;
  }
  EXPECT_GT(failures, 50U);
}

TEST_F(TokenFaultsTest, ForgedTokenIsNeverAcceptedWhenMemoryRunsOut) {
  for (const Forgery& forgery : Forgeries()) {
    std::size_t failures = 0;
    for (bool happened = true; happened; ++failures) {
      const InjectedFault fault(FaultKind::kAllocation, failures);
      const Verdict verdict = VerdictOn(forgery.xml, resolver_.get());
      happened = fault.HasHappened();
      ASSERT_EQ(verdict, happened ? Verdict::kOutOfMemory : Verdict::kRefused)
          << forgery.name << " " << failures;
    }
    EXPECT_GT(failures, 50U);
  }
}

class CryptoFaultsTest : public TokenFaultsTest, public testing::WithParamInterface<int> {};

TEST_P(CryptoFaultsTest, MakeVerificationFail) {
  std::size_t calls = 0;
  for (bool happened = true; happened; ++calls) {
    const InjectedFault fault(FaultKind::kCrypto, calls, GetParam());
    const Verdict verdict = VerdictOn(original_, resolver_.get());
    happened = fault.HasHappened();
    ASSERT_EQ(verdict, happened ? Verdict::kRefused : Verdict::kAccepted) << calls;
  }
  // Two digests with at least three calls each, and one verification.
  EXPECT_GE(calls, 8U);
}

TEST_P(CryptoFaultsTest, NeverMakeAForgeryValid) {
  for (const Forgery& forgery : Forgeries()) {
    std::size_t calls = 0;
    for (bool happened = true; happened; ++calls) {
      const InjectedFault fault(FaultKind::kCrypto, calls, GetParam());
      ASSERT_EQ(VerdictOn(forgery.xml, resolver_.get()), Verdict::kRefused)
          << forgery.name << " " << calls;
      happened = fault.HasHappened();
    }
  }
}

INSTANTIATE_TEST_SUITE_P(Results, CryptoFaultsTest, testing::Values(0, -1));

}  // namespace
}  // namespace SsoClient::Testing
