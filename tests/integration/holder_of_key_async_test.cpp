// The asynchronous variants of all operations.
#include <atomic>
#include <chrono>
#include <functional>
#include <future>
#include <iterator>
#include <map>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <thread>
#include <tuple>
#include <typeindex>
#include <typeinfo>
#include <utility>
#include <vector>

#include <gmock/gmock.h>

#include <tarnik/crypto/crypto_exception.h>

#include "integration/holder_of_key_fixture.h"
#include "integration/operation.h"
#include "integration/text_edits.h"

namespace SsoClient::Testing {
namespace {

using testing::StartsWith;

constexpr std::chrono::seconds kPatience{120};

/// The outcome; throws if none arrives in time.
Outcome Await(std::future<Outcome>& future) {
  if (future.wait_for(kPatience) != std::future_status::ready) {
    throw std::runtime_error("the callback was never called");
  }
  return future.get();
}

Outcome AwaitCall(Operation operation, const SecurityTokenService& service,
                  const Arguments& arguments) {
  auto future = CallAsync(operation, service, arguments);
  return Await(future);
}

class EveryOperationAsyncTest : public HolderOfKeyTest,
                                public testing::WithParamInterface<Operation> {
 protected:
  static Arguments WithToken() {
    Arguments arguments;
    arguments.token = AcquireBound();
    return arguments;
  }
  static void ExpectSuccess(const Outcome& outcome) {
    ASSERT_TRUE(outcome.IsSuccess()) << outcome.message;
    if (GetParam() == Operation::Validate) {
      EXPECT_EQ(outcome.verdict, true);
      EXPECT_EQ(outcome.token, nullptr);
      return;
    }
    EXPECT_EQ(outcome.verdict, std::nullopt);
    ASSERT_NE(outcome.token, nullptr);
    EXPECT_TRUE(IsBoundTo(*outcome.token, Holder()));
  }
};

TEST_P(EveryOperationAsyncTest, SuccessReachesTheCallback) {
  ExpectSuccess(AwaitCall(GetParam(), *HolderService(), WithToken()));
}

TEST_P(EveryOperationAsyncTest, ServiceMayBeReleasedBeforeTheCallEnds) {
  const Arguments arguments = WithToken();
  DevSts::Misbehavior slow;
  slow.delayBeforeAnswer = std::chrono::milliseconds(100);
  Sts().SetMisbehavior(slow);
  auto service = HolderService();
  auto future = CallAsync(GetParam(), *service, arguments);
  service.reset();
  ExpectSuccess(Await(future));
}

TEST_P(EveryOperationAsyncTest, SpecIsCopiedButNotTheToken) {
  const auto service = HolderService();
  Arguments arguments = WithToken();
  DevSts::Misbehavior slow;
  slow.delayBeforeAnswer = std::chrono::milliseconds(50);
  Sts().SetMisbehavior(slow);
  auto future = CallAsync(GetParam(), *service, arguments);
  arguments.userName = "nobody";
  arguments.password = "nothing";
  arguments.spec.tokenLifetimeSec = 0;
  arguments.token.reset();
  ExpectSuccess(Await(future));
}

TEST_P(EveryOperationAsyncTest, EmptyCallbackIsRefusedAtTheCall) {
  const Arguments arguments = WithToken();
  const auto service = HolderService();
  const SecurityTokenService::TokenCallback none;
  Sts().ClearRequests();
  const std::string message = MessageOf<Tarnik::InvalidArgumentException>([&] {
    switch (GetParam()) {
      case Operation::Password:
        return service->AcquireTokenAsync(kUser, kPassword, arguments.spec, none);
      case Operation::Certificate:
        return service->AcquireTokenByCertificateAsync(arguments.spec, none);
      case Operation::Token:
        return service->AcquireTokenByTokenAsync(*arguments.token, arguments.spec, none);
      case Operation::Renew:
        return service->RenewTokenAsync(*arguments.token, 60, none);
      case Operation::Validate:
        return service->ValidateSubjectAsync(*arguments.token, {});
    }
  });
  EXPECT_EQ(message, "The callback must not be empty.");
  EXPECT_TRUE(Sts().Requests().empty());
}

INSTANTIATE_TEST_SUITE_P(Operations, EveryOperationAsyncTest, testing::ValuesIn(kOperations),
                         [](const auto& tested) { return NameOf(tested.param); });

/// One way to fail.
struct FailureCase {
  const char* name;
  std::type_index errorClass;
  /// The start of the message; the rest is compared with that of the synchronous operation.
  const char* message;
  void (*prepare)(DevSts::Server& server, Arguments& arguments);
  /// Operations that it does not affect succeed.
  bool affectsValidation = true;
  bool affectsRenewal = true;
};

void AnswerFault(DevSts::Server& server, const char* code, const char* text) {
  DevSts::Misbehavior misbehavior;
  misbehavior.fault = DevSts::FaultAnswer{kTrust, code, text, false, 500};
  server.SetMisbehavior(misbehavior);
}

void EditTokens(DevSts::Server& server, std::function<void(std::string&)> edit) {
  DevSts::AssertionOptions options;
  options.afterSigning = std::move(edit);
  server.SetAssertionOptions(options);
}

/// Replaces the certificate that tokens are bound to with this text.
void EditHolderCertificate(DevSts::Server& server, const std::string& text) {
  EditTokens(server, [text](std::string& xml) {
    constexpr std::string_view kElement = "<ds:X509Certificate>";
    const auto from = xml.rfind(kElement) + kElement.size();
    xml.replace(from, xml.find('<', from) - from, text);
  });
}

class FailureAsyncTest : public HolderOfKeyTest,
                         public testing::WithParamInterface<std::tuple<Operation, FailureCase>> {};

TEST_P(FailureAsyncTest, EqualsThatOfTheSynchronousOperation) {
  const auto& [operation, failure] = GetParam();
  Arguments arguments;
  arguments.token = AcquireBound();
  failure.prepare(Sts(), arguments);
  const auto service = HolderService();
  const Outcome thrown = CallNow(operation, *service, arguments);
  const Outcome arrived = AwaitCall(operation, *service, arguments);

  EXPECT_EQ(arrived.errorClass, thrown.errorClass);
  EXPECT_EQ(arrived.message, thrown.message);
  const bool isAffected = operation == Operation::Validate ? failure.affectsValidation
                          : operation == Operation::Renew  ? failure.affectsRenewal
                                                           : true;
  if (!isAffected) {
    EXPECT_TRUE(arrived.IsSuccess()) << arrived.message;
    return;
  }
  EXPECT_EQ(arrived.errorClass, failure.errorClass) << arrived.errorClass.name();
  EXPECT_THAT(arrived.message, StartsWith(failure.message));
  EXPECT_EQ(arrived.token, nullptr);
  EXPECT_EQ(arrived.verdict, std::nullopt);
}

std::vector<FailureCase> FailureCases() {
  return {
      {"InvalidArgument", typeid(Tarnik::InvalidArgumentException),
       "Token lifetime must be positive",
       [](DevSts::Server&, Arguments& arguments) { arguments.spec.tokenLifetimeSec = 0; }, false},
      {"Unsendable", typeid(Tarnik::InvalidArgumentException),
       "The text of element 'wsa:Address' holds what XML cannot carry: a control character or "
       "bytes that are not UTF-8.",
       [](DevSts::Server&, Arguments& arguments) {
         arguments.spec.audienceRestriction = {std::string(1, '\1')};
       },
       false, false},
      {"Communication", typeid(CommunicationException),
       "Server returned error: 503 Service Unavailable",
       [](DevSts::Server& server, Arguments&) {
         DevSts::Misbehavior misbehavior;
         misbehavior.httpAnswer = DevSts::HttpAnswer{503, "Service Unavailable", {}, ""};
         server.SetMisbehavior(misbehavior);
       }},
      {"InvalidCredentials", typeid(InvalidCredentialsException), "Authentication failed: no",
       [](DevSts::Server& server, Arguments&) {
         AnswerFault(server, "FailedAuthentication", "no");
       }},
      {"PasswordExpired", typeid(PasswordExpiredException),
       "Authentication failed: Password of the user logging on is expired",
       [](DevSts::Server& server, Arguments&) {
         AnswerFault(server, "FailedAuthentication", "Password of the user logging on is expired");
       }},
      {"UnexpectedFault", typeid(SsoException),
       "Unexpected SOAP fault: wst:RequestFailed; request failed.",
       [](DevSts::Server& server, Arguments&) { AnswerFault(server, "RequestFailed", "hidden"); }},
      {"NoXml", typeid(SsoException), "Response is not well-formed XML: ",
       [](DevSts::Server& server, Arguments&) {
         DevSts::Misbehavior misbehavior;
         misbehavior.httpAnswer = DevSts::HttpAnswer{200, "OK", {}, "no XML"};
         server.SetMisbehavior(misbehavior);
       }},
      {"Parse", typeid(ParseException), "Invalid token version",
       [](DevSts::Server& server, Arguments&) {
         EditTokens(server, [](std::string& xml) { Replace(xml, "\"2.0\"", "\"2.1\""); });
       },
       false},
      {"InvalidSignature", typeid(InvalidSignatureException),
       "Failed to verify signature: token might have been tampered with.",
       [](DevSts::Server& server, Arguments&) {
         EditTokens(server, [](std::string& xml) { Replace(xml, "sts.example.com", "sts.evil"); });
       },
       false},
      {"Base64Format", typeid(Tarnik::Base64FormatException),
       "The text holds a character that is not Base64.",
       [](DevSts::Server& server, Arguments&) { EditHolderCertificate(server, "AAA!"); }, false},
      {"Crypto", typeid(Tarnik::Crypto::CryptoException), "The certificate cannot be decoded",
       [](DevSts::Server& server, Arguments&) { EditHolderCertificate(server, "AAAA"); }, false},
  };
}

INSTANTIATE_TEST_SUITE_P(EveryOperation, FailureAsyncTest,
                         testing::Combine(testing::ValuesIn(kOperations),
                                          testing::ValuesIn(FailureCases())),
                         [](const auto& tested) {
                           return std::string(NameOf(std::get<0>(tested.param))) +
                                  std::get<1>(tested.param).name;
                         });

class HolderOfKeyAsyncTest : public HolderOfKeyTest {};

TEST_F(HolderOfKeyAsyncTest, InvalidStateReachesTheCallback) {
  const auto expired =
      HolderService(HolderValidBetween(std::chrono::hours(-2), std::chrono::hours(-1)));
  Arguments arguments;
  arguments.token = AcquireBound();
  Sts().ClearRequests();
  for (const Operation operation :
       {Operation::Password, Operation::Certificate, Operation::Renew}) {
    const Outcome outcome = AwaitCall(operation, *expired, arguments);
    EXPECT_EQ(outcome.errorClass, typeid(Tarnik::InvalidStateException)) << operation;
    EXPECT_THAT(outcome.message,
                StartsWith("The holder-of-key certificate of `CN=holder' expired"));
  }
  const std::map<Operation, std::string> names = {
      {Operation::Certificate, "acquire token by certificate"},
      {Operation::Token, "acquire token by token"},
      {Operation::Renew, "renew token"}};
  for (const auto& [operation, name] : names) {
    const Outcome outcome = AwaitCall(operation, *Service(), arguments);
    EXPECT_EQ(outcome.errorClass, typeid(Tarnik::InvalidStateException));
    EXPECT_EQ(outcome.message, "No HolderOfKeyConfig provided. Unable to " + name);
  }
  EXPECT_TRUE(Sts().Requests().empty());
}

TEST_F(HolderOfKeyAsyncTest, VerdictThatATokenIsNotValidIsNotAnError) {
  Arguments arguments;
  arguments.token = AcquireBound();
  Sts().Revoke(arguments.token->Id());
  const Outcome outcome = AwaitCall(Operation::Validate, *HolderService(), arguments);
  EXPECT_TRUE(outcome.IsSuccess());
  EXPECT_EQ(outcome.verdict, false);
}

TEST_F(HolderOfKeyAsyncTest, ThousandMixedCallsInFlightAllComplete) {
  constexpr int kCalls = 1000;
  constexpr Operation kMix[] = {Operation::Password, Operation::Certificate, Operation::Validate,
                                Operation::Token,    Operation::Validate,    Operation::Renew,
                                Operation::Validate, Operation::Password,    Operation::Validate,
                                Operation::Validate};
  auto service = HolderService();
  Arguments arguments;
  arguments.token = AcquireBound();
  std::vector<std::future<Outcome>> futures;
  futures.reserve(kCalls);
  for (int i = 0; i < kCalls; ++i) {
    // Every twentieth call fails before it is sent, and every twentieth is refused by the service.
    Arguments changed = arguments;
    changed.password = i % 20 == 0 ? "wrong-secret" : kPassword;
    changed.spec.tokenLifetimeSec = i % 20 == 1 ? 0 : 600;
    futures.push_back(CallAsync(kMix[i % std::size(kMix)], *service, changed));
  }
  service.reset();
  std::map<std::pair<Operation, std::type_index>, int> counts;
  for (int i = 0; i < kCalls; ++i) {
    const Outcome outcome = Await(futures[i]);
    ++counts[{kMix[i % std::size(kMix)], outcome.errorClass}];
  }
  const std::map<std::pair<Operation, std::type_index>, int> expected = {
      {{Operation::Password, typeid(void)}, 150},
      {{Operation::Password, typeid(InvalidCredentialsException)}, 50},
      {{Operation::Certificate, typeid(void)}, 50},
      {{Operation::Certificate, typeid(Tarnik::InvalidArgumentException)}, 50},
      {{Operation::Token, typeid(void)}, 100},
      {{Operation::Renew, typeid(void)}, 100},
      {{Operation::Validate, typeid(void)}, 500}};
  EXPECT_TRUE(counts == expected);
}

TEST_F(HolderOfKeyAsyncTest, ThreadsShareOneServiceAndOneToken) {
  constexpr int kThreads = 8;
  constexpr int kRounds = 5;
  const auto service = HolderService();
  Arguments arguments;
  arguments.token = AcquireBound();
  std::atomic<int> successes{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t) {
    threads.emplace_back([&] {
      for (int round = 0; round < kRounds; ++round) {
        for (const Operation operation : kOperations) {
          successes += CallNow(operation, *service, arguments).IsSuccess() ? 1 : 0;
        }
      }
    });
  }
  for (auto& thread : threads) {
    thread.join();
  }
  EXPECT_EQ(successes, kThreads * kRounds * static_cast<int>(std::size(kOperations)));
}

}  // namespace
}  // namespace SsoClient::Testing
