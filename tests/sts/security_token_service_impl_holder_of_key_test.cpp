#include <array>
#include <atomic>
#include <cstdint>
#include <functional>
#include <future>
#include <memory>
#include <set>
#include <string>
#include <thread>
#include <typeinfo>
#include <vector>

#include <boost/optional.hpp>
#include <gmock/gmock.h>

#include <ssoclient/exceptions.h>
#include <ssoclient/saml_token.h>
#include <ssoclient/security_token_service.h>
#include <ssoclient/token_spec.h>
#include <tarnik/core/exception.h>

#include "describe/describe.h"
#include "sts/answers.h"
#include "sts/fake_sts.h"
#include "sts/log_capture.h"
#include "sts/token_specs.h"
#include "support/async_call.h"
#include "support/fake_saml_token.h"
#include "support/holder_of_key.h"
#include "support/vtable_slot.h"

namespace SsoClient::Testing {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

std::string StatusAnswer(const std::string& code) {
  return Envelope(
      Rstr("<wst:Status><wst:Code>http://docs.oasis-open.org/ws-sx/ws-trust/200512/status/" + code +
           "</wst:Code></wst:Status>"));
}

FakeSamlToken Presented() {
  FakeSamlToken token("<Presented ID=\"_1\"/>");
  token.id = "_1";
  token.confirmationType = HOLDER_OF_KEY;
  return token;
}

FakeSts StsWithKey(const std::string& answer) {
  return FakeSts({answer}, ConfigOf(KeyCredential()));
}

std::string Start(const std::string& name) {
  return "7 START operation SecurityTokenServiceImpl::" + name;
}

std::string End(const std::string& name) {
  return "7 END operation SecurityTokenServiceImpl::" + name;
}

std::string Success(const SamlToken& token) {
  return "5 Successfully acquired token: " + CreateSamlTokenDescription(token);
}

TEST(HolderOfKeyOperationsTest, ByCertificateIsTraced) {
  const FakeSts sts = StsWithKey(IssueAnswer());
  const LogCapture log(7);
  const auto token = sts.Service()->AcquireTokenByCertificate(OneHour());
  ASSERT_NE(token, nullptr);
  EXPECT_EQ(token->Xml(), kCanonicalAssertion);
  EXPECT_THAT(sts.factory->tolerances, ElementsAre(600));
  EXPECT_THAT(log.Lines(), ElementsAre(Start("AcquireTokenByCertificate"),
                                       "7 Requested token with spec `" + Describe(OneHour()) + "'",
                                       Success(*token), End("AcquireTokenByCertificate")));
}

TEST(HolderOfKeyOperationsTest, ByTokenIsTraced) {
  const FakeSts sts = StsWithKey(IssueAnswer());
  const LogCapture log(7);
  const auto presented = Presented();
  const auto token = sts.Service()->AcquireTokenByToken(presented, OneHour());
  ASSERT_NE(token, nullptr);
  EXPECT_THAT(sts.factory->tolerances, ElementsAre(600));
  EXPECT_THAT(sts.transport->bodies.front(), HasSubstr("<Presented ID=\"_1\"/>"));
  EXPECT_THAT(log.Lines(),
              ElementsAre(Start("AcquireTokenByToken"),
                          "7 Requested token for " + CreateSamlTokenDescription(presented) +
                              " with spec `" + Describe(OneHour()) + "'",
                          Success(*token), End("AcquireTokenByToken")));
}

TEST(HolderOfKeyOperationsTest, RenewalIsTraced) {
  const FakeSts sts = StsWithKey(RenewAnswer());
  const LogCapture log(7);
  const auto presented = Presented();
  const auto token = sts.Service()->RenewToken(presented, 90);
  ASSERT_NE(token, nullptr);
  EXPECT_THAT(sts.factory->tolerances, ElementsAre(600));
  EXPECT_THAT(log.Lines(), ElementsAre(Start("RenewToken"),
                                       "7 Renewing token " + CreateSamlTokenDescription(presented) +
                                           " for 90 more seconds",
                                       Success(*token), End("RenewToken")));
}

TEST(HolderOfKeyOperationsTest, ValidationIsTracedAndGivesTheVerdict) {
  for (const bool isValid : {true, false}) {
    const FakeSts sts = StsWithKey(StatusAnswer(isValid ? "valid" : "invalid"));
    const LogCapture log(7);
    const auto presented = Presented();
    EXPECT_EQ(sts.Service()->ValidateSubject(presented), isValid);
    EXPECT_THAT(sts.factory->texts, IsEmpty());
    EXPECT_THAT(
        log.Lines(),
        ElementsAre(Start("ValidateSubject"),
                    "7 Validating subject of token " + CreateSamlTokenDescription(presented),
                    isValid ? "7 Result: true" : "7 Result: false", End("ValidateSubject")));
  }
}

TEST(HolderOfKeyOperationsTest, TheEndIsLoggedWhenAnOperationFails) {
  FakeSts sts = StsWithKey(IssueAnswer());
  sts.transport->failure.emplace("broken");
  const auto service = sts.Service();
  const auto presented = Presented();
  const auto lastLine = [](const std::function<void()>& operation) {
    const LogCapture log(7);
    EXPECT_THROW(operation(), CommunicationException);
    return log.Lines().back();
  };
  EXPECT_EQ(lastLine([&] { service->AcquireTokenByCertificate(OneHour()); }),
            End("AcquireTokenByCertificate"));
  EXPECT_EQ(lastLine([&] { service->AcquireTokenByToken(presented, OneHour()); }),
            End("AcquireTokenByToken"));
  EXPECT_EQ(lastLine([&] { service->RenewToken(presented, 60); }), End("RenewToken"));
  EXPECT_EQ(lastLine([&] { service->ValidateSubject(presented); }), End("ValidateSubject"));
}

TEST(HolderOfKeyOperationsTest, ArgumentErrorsComeBeforeAnythingIsSent) {
  const FakeSts sts = StsWithKey(IssueAnswer());
  const auto service = sts.Service();
  auto bearer = Presented();
  bearer.confirmationType = BEARER;
  EXPECT_THROW(service->AcquireTokenByCertificate(TokenSpec()), Tarnik::InvalidArgumentException);
  EXPECT_THROW(service->AcquireTokenByToken(bearer, TokenSpec()), Tarnik::InvalidArgumentException);
  EXPECT_THROW(service->RenewToken(bearer, 60), Tarnik::InvalidArgumentException);
  EXPECT_EQ(sts.transport->sessions, 0);
}

TEST(HolderOfKeyOperationsAsyncTest, TokensReachTheCallback) {
  const FakeSts issuing = StsWithKey(IssueAnswer());
  const FakeSts renewing = StsWithKey(RenewAnswer());
  const auto presented = Presented();
  AsyncCall byCertificate;
  AsyncCall byToken;
  AsyncCall renewal;
  // The services are released immediately.
  issuing.Service()->AcquireTokenByCertificateAsync(OneHour(), byCertificate.Callback());
  issuing.Service()->AcquireTokenByTokenAsync(presented, OneHour(), byToken.Callback());
  renewing.Service()->RenewTokenAsync(presented, 60, renewal.Callback());
  for (auto* call : {&byCertificate, &byToken, &renewal}) {
    const auto report = call->Wait();
    EXPECT_EQ(report.errorType, "");
    EXPECT_NE(report.token, nullptr);
  }
}

TEST(HolderOfKeyOperationsAsyncTest, RequestsEqualTheSynchronousOnes) {
  const FakeSts sts = StsWithKey(IssueAnswer());
  const auto service = sts.Service();
  const auto presented = Presented();
  auto spec = OneHour();
  spec.audienceRestriction = {"urn:audience"};
  const auto requestLine = [](const auto& start) {
    const LogCapture log(7);
    AsyncCall call;
    start(call.Callback());
    call.Wait();
    return log.Lines().at(1);
  };
  EXPECT_EQ(requestLine([&](auto done) { service->AcquireTokenAsync("bob", "pw", spec, done); }),
            "7 Requested token for subject `bob', spec `" + Describe(spec) + "'");
  EXPECT_EQ(requestLine([&](auto done) { service->AcquireTokenByCertificateAsync(spec, done); }),
            "7 Requested token with spec `" + Describe(spec) + "'");
  EXPECT_EQ(
      requestLine([&](auto done) { service->AcquireTokenByTokenAsync(presented, spec, done); }),
      "7 Requested token for " + CreateSamlTokenDescription(presented) + " with spec `" +
          Describe(spec) + "'");
  EXPECT_EQ(requestLine([&](auto done) { service->RenewTokenAsync(presented, 77, done); }),
            "7 Renewing token " + CreateSamlTokenDescription(presented) + " for 77 more seconds");
}

TEST(HolderOfKeyOperationsAsyncTest, ThreadsMaySignWithOneServiceThatIsReleasedAtTheSameTime) {
  constexpr int kThreads = 4;
  constexpr int kRounds = 8;
  const FakeSts sts = StsWithKey(IssueAnswer());
  auto service = sts.Service();
  const auto presented = Presented();
  std::array<std::array<AsyncCall, kRounds>, kThreads> calls;
  std::atomic<int> tokens{0};
  std::vector<std::thread> threads;
  for (auto& callsOfThread : calls) {
    threads.emplace_back([&tokens, &presented, &callsOfThread, shared = service]() mutable {
      for (auto& call : callsOfThread) {
        shared->AcquireTokenByTokenAsync(presented, OneHour(), call.Callback());
        tokens += shared->AcquireTokenByCertificate(OneHour()) != nullptr ? 1 : 0;
      }
      shared = nullptr;
    });
  }
  service = nullptr;
  for (auto& thread : threads) {
    thread.join();
  }
  for (auto& callsOfThread : calls) {
    for (auto& call : callsOfThread) {
      tokens += call.Wait().token != nullptr ? 1 : 0;
    }
  }
  EXPECT_EQ(tokens, 2 * kThreads * kRounds);
  const std::set<std::string> different(sts.transport->bodies.begin(), sts.transport->bodies.end());
  EXPECT_EQ(different.size(), 2U * kThreads * kRounds);
}

TEST(HolderOfKeyOperationsAsyncTest, ErrorsReachTheCallbackWithTheirClass) {
  const FakeSts sts = StsWithKey(IssueAnswer());
  auto bearer = Presented();
  bearer.confirmationType = BEARER;
  AsyncCall renewal;
  sts.Service()->RenewTokenAsync(bearer, 60, renewal.Callback());
  const auto report = renewal.Wait();
  EXPECT_EQ(report.errorType, typeid(Tarnik::InvalidArgumentException).name());
  EXPECT_EQ(report.message, "Unable to renew token: the provided token must be Holder Of Key");
}

struct Verdict {
  boost::optional<bool> isValid;
  std::string error;
};

Verdict ValidateAsync(const FakeSts& sts) {
  const auto presented = Presented();
  auto promise = std::make_shared<std::promise<Verdict>>();
  sts.Service()->ValidateSubjectAsync(
      presented, [promise](const boost::optional<bool>& isValid, const Tarnik::Exception* error) {
        promise->set_value({isValid, error != nullptr ? typeid(*error).name() : ""});
      });
  return promise->get_future().get();
}

TEST(HolderOfKeyOperationsAsyncTest, ValidationReportsAVerdictOrNone) {
  for (const bool isValid : {true, false}) {
    const auto verdict = ValidateAsync(StsWithKey(StatusAnswer(isValid ? "valid" : "invalid")));
    EXPECT_TRUE(verdict.isValid == isValid);
    EXPECT_EQ(verdict.error, "");
  }
  const auto verdict = ValidateAsync(StsWithKey("no answer"));
  EXPECT_FALSE(verdict.isValid.has_value());
  EXPECT_EQ(verdict.error, typeid(SsoException).name());
}

TEST(HolderOfKeyOperationsAsyncTest, EmptyCallbacksAreRefusedAtTheCall) {
  const FakeSts sts = StsWithKey(IssueAnswer());
  const auto service = sts.Service();
  const auto presented = Presented();
  EXPECT_THROW(service->AcquireTokenByCertificateAsync(OneHour(), nullptr),
               Tarnik::InvalidArgumentException);
  EXPECT_THROW(service->AcquireTokenByTokenAsync(presented, OneHour(), nullptr),
               Tarnik::InvalidArgumentException);
  EXPECT_THROW(service->ValidateSubjectAsync(presented, nullptr), Tarnik::InvalidArgumentException);
  EXPECT_THROW(service->RenewTokenAsync(presented, 60, nullptr), Tarnik::InvalidArgumentException);
}

TEST(HolderOfKeyOperationsTest, OperationsKeepTheirSlotOrder) {
  using Token = std::shared_ptr<const SamlToken>;
  using Callback = SecurityTokenService::TokenCallback;
  const FakeSts sts = StsWithKey(IssueAnswer());
  const auto service = sts.Service();
  const SecurityTokenService* object = service.get();
  const auto presented = Presented();
  const LogCapture log(7);
  const auto lastOperation = [&] { return log.Lines().back(); };
  VtableSlot<Token(const void*, const TokenSpec&)>(object, 2)(object, OneHour());
  EXPECT_EQ(lastOperation(), End("AcquireTokenByCertificate"));
  VtableSlot<Token(const void*, const SamlToken&, const TokenSpec&)>(object, 3)(object, presented,
                                                                                OneHour());
  EXPECT_EQ(lastOperation(), End("AcquireTokenByToken"));
  EXPECT_THROW((VtableSlot<bool(const void*, const SamlToken&)>(object, 4)(object, presented)),
               SsoException);
  EXPECT_EQ(lastOperation(), End("ValidateSubject"));
  EXPECT_THROW((VtableSlot<Token(const void*, const SamlToken&, std::int64_t)>(object, 5)(
                   object, presented, 60)),
               SsoException);
  EXPECT_EQ(lastOperation(), End("RenewToken"));
  AsyncCall byCertificate;
  VtableSlot<void(const void*, const TokenSpec&, Callback)>(object, 8)(object, OneHour(),
                                                                       byCertificate.Callback());
  EXPECT_NE(byCertificate.Wait().token, nullptr);
  AsyncCall byToken;
  VtableSlot<void(const void*, const SamlToken&, const TokenSpec&, Callback)>(object, 9)(
      object, presented, OneHour(), byToken.Callback());
  EXPECT_NE(byToken.Wait().token, nullptr);
  std::promise<std::string> verdict;
  VtableSlot<void(const void*, const SamlToken&, SecurityTokenService::ValidateCallback)>(
      object, 10)(object, presented,
                  [&verdict](const boost::optional<bool>&, const Tarnik::Exception* error) {
                    verdict.set_value(typeid(*error).name());
                  });
  EXPECT_EQ(verdict.get_future().get(), typeid(SsoException).name());
  AsyncCall renewal;
  VtableSlot<void(const void*, const SamlToken&, std::int64_t, Callback)>(object, 11)(
      object, presented, 60, renewal.Callback());
  EXPECT_EQ(renewal.Wait().errorType, typeid(SsoException).name());
}

TEST(HolderOfKeyOperationsTest, NothingSecretIsLogged) {
  const FakeSts sts = StsWithKey(IssueAnswer());
  const LogCapture log(9);
  sts.Service()->AcquireTokenByToken(Presented(), OneHour());
  EXPECT_THAT(log.Lines(), testing::Each(Not(HasSubstr("<Presented"))));
}

}  // namespace
}  // namespace SsoClient::Testing
