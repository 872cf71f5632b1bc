// What each operation writes to the log, and what never appears there.
#include <cstddef>
#include <functional>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include <gmock/gmock.h>

#include "integration/holder_of_key_fixture.h"
#include "integration/operation.h"
#include "integration/text_edits.h"
#include "sts/log_capture.h"

namespace SsoClient::Testing {
namespace {

using testing::ElementsAre;
using testing::ElementsAreArray;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

constexpr char kSpecText[] =
    "TokenSpec [tokenLifetimeSec=600, delegable=false, delegateTo=<unset>, renewable=false, "
    "confirmationType=0,audienceRestriction=, advice=[]";

std::string Started(Operation operation) {
  return std::string("7 START operation SecurityTokenServiceImpl::") + NameOf(operation);
}

std::string Ended(Operation operation) {
  return std::string("7 END operation SecurityTokenServiceImpl::") + NameOf(operation);
}

std::string Acquired(const Outcome& outcome) {
  return "5 Successfully acquired token: " + CreateSamlTokenDescription(*outcome.token);
}

/// The line that describes the arguments.
std::string RequestLine(Operation operation, const Arguments& arguments) {
  const std::string presented = CreateSamlTokenDescription(*arguments.token);
  const std::string spec = std::string("`") + kSpecText + "'";
  switch (operation) {
    case Operation::Password:
      return "7 Requested token for subject `alice@EXAMPLE.COM', spec " + spec;
    case Operation::Certificate:
      return "7 Requested token with spec " + spec;
    case Operation::Token:
      return "7 Requested token for " + presented + " with spec " + spec;
    case Operation::Renew:
      return "7 Renewing token " + presented + " for 600 more seconds";
    case Operation::Validate:
      return "7 Validating subject of token " + presented;
  }
  return {};
}

class OperationLogTest : public HolderOfKeyTest, public testing::WithParamInterface<Operation> {
 protected:
  OperationLogTest() { arguments_.token = AcquireBound(); }

  Arguments arguments_;
};

TEST_P(OperationLogTest, SuccessWritesItsLinesInOrder) {
  const auto service = HolderService();
  for (const int level : {7, 9}) {
    const LogCapture log(level);
    const Outcome outcome = CallNow(GetParam(), *service, arguments_);
    ASSERT_TRUE(outcome.IsSuccess()) << outcome.message;
    std::vector<std::string> expected = {Started(GetParam()), RequestLine(GetParam(), arguments_)};
    if (GetParam() == Operation::Password) {
      expected.emplace_back("7 SecurityTokenServiceImpl::AcquireToken sending request");
      expected.emplace_back("7 SecurityTokenServiceImpl::AcquireToken processing response");
    }
    expected.push_back(GetParam() == Operation::Validate ? "7 Result: true" : Acquired(outcome));
    expected.push_back(Ended(GetParam()));
    EXPECT_THAT(log.Lines(), ElementsAreArray(expected));
  }
}

TEST_P(OperationLogTest, LevelsFiveAndSixLogOnlyAnAcquiredToken) {
  const auto service = HolderService();
  for (const int level : {5, 6}) {
    const LogCapture log(level);
    const Outcome outcome = CallNow(GetParam(), *service, arguments_);
    if (GetParam() == Operation::Validate) {
      EXPECT_THAT(log.Lines(), IsEmpty());
    } else {
      EXPECT_THAT(log.Lines(), ElementsAre(Acquired(outcome)));
    }
  }
}

TEST_P(OperationLogTest, FailureOfTheServiceStillWritesTheEndLine) {
  DevSts::Misbehavior misbehavior;
  misbehavior.fault = DevSts::FaultAnswer{kTrust, "RequestFailed", "no", false, 500};
  Sts().SetMisbehavior(misbehavior);
  const auto service = HolderService();
  const LogCapture log(9);
  EXPECT_FALSE(CallNow(GetParam(), *service, arguments_).IsSuccess());
  std::vector<std::string> expected = {Started(GetParam()), RequestLine(GetParam(), arguments_)};
  if (GetParam() == Operation::Password) {
    expected.emplace_back("7 SecurityTokenServiceImpl::AcquireToken sending request");
    expected.emplace_back("7 SecurityTokenServiceImpl::AcquireToken processing response");
  }
  expected.push_back(Ended(GetParam()));
  EXPECT_THAT(log.Lines(), ElementsAreArray(expected));
}

// Refused before anything is sent.
TEST_P(OperationLogTest, LocalFailureStillWritesTheEndLine) {
  if (GetParam() == Operation::Validate) {
    return;  // refuses nothing
  }
  arguments_.spec.tokenLifetimeSec = -1;
  const auto service = HolderService();
  const LogCapture log(9);
  EXPECT_FALSE(CallNow(GetParam(), *service, arguments_).IsSuccess());
  const auto lines = log.Lines();
  ASSERT_EQ(lines.size(), 3U);
  EXPECT_EQ(lines.front(), Started(GetParam()));
  EXPECT_THAT(lines[1], HasSubstr(GetParam() == Operation::Renew ? " for -1 more seconds"
                                                                 : "tokenLifetimeSec=-1"));
  EXPECT_EQ(lines.back(), Ended(GetParam()));
}

TEST_P(OperationLogTest, AsynchronousOperationWritesTheSameLines) {
  const auto service = HolderService();
  const LogCapture log(7);
  ASSERT_TRUE(CallAsync(GetParam(), *service, arguments_).get().IsSuccess());
  const auto lines = log.Lines();
  EXPECT_EQ(lines.front(), Started(GetParam()));
  EXPECT_EQ(lines[1], RequestLine(GetParam(), arguments_));
  EXPECT_EQ(lines.back(), Ended(GetParam()));
}

TEST_P(OperationLogTest, ByDefaultSuccessAndFailureAreSilent) {
  const auto service = HolderService();
  const LogCapture log(4);
  EXPECT_TRUE(CallNow(GetParam(), *service, arguments_).IsSuccess());
  arguments_.token = Acquire();
  arguments_.password = "wrong-secret";
  CallNow(GetParam(), *service, arguments_);
  EXPECT_THAT(log.Lines(), IsEmpty());
}

/// Parts of everything that must stay secret: the password, the private key and the text of every
/// token that was used.
std::vector<std::string> SecretsOf(const Arguments& arguments, const Outcome& outcome) {
  std::vector<std::string> secrets = {arguments.password, "PRIVATE KEY", "<saml2", "<wsse"};
  const std::string pem = Holder().privateKeyPem;
  for (std::size_t at = pem.find('\n') + 1; at + 64 < pem.size(); at += 65) {
    secrets.push_back(pem.substr(at, 24));
  }
  for (const auto& token : {arguments.token, outcome.token}) {
    if (token != nullptr) {
      secrets.push_back(token->Id());
      secrets.push_back(Between(token->Xml(), "<ds:SignatureValue>", "\n").substr(0, 24));
      secrets.push_back(Between(token->Xml(), "<ds:DigestValue>", "<"));
    }
  }
  return secrets;
}

/// How the operations end; `Either` if not all end in the same way.
enum class End { Success, Failure, Either };

/// What happens to a request or an answer in transit.
struct Mishap {
  const char* name;
  End end;
  void (*prepare)(DevSts::Server& server);
};

class SecretLogTest : public HolderOfKeyTest,
                      public testing::WithParamInterface<std::tuple<Operation, Mishap>> {};

TEST_P(SecretLogTest, NoSecretInAnyLineOrMessage) {
  const auto& [operation, mishap] = GetParam();
  Arguments arguments;
  arguments.userName = "careful@EXAMPLE.COM";
  arguments.password = "n0b0dy-must-read-this";
  DevSts::Users users = DevSts::DemoUsers();
  users[arguments.userName].password = arguments.password;
  Sts().SetUsers(users);
  Sts().RegisterCertificate(kMachine, Holder().certificatePem);
  arguments.token = AcquireBound();
  TokenSpec delegable = Bearer();
  delegable.delegable = true;
  if (operation == Operation::Token || operation == Operation::Certificate) {
    arguments.spec.actAsToken = Acquire(delegable);
  }
  const auto service = HolderService();
  mishap.prepare(Sts());

  const LogCapture log(9);
  const Outcome outcome = CallNow(operation, *service, arguments);
  if (mishap.end != End::Either) {
    EXPECT_EQ(outcome.IsSuccess(), mishap.end == End::Success) << outcome.message;
  }
  std::vector<std::string> lines = log.Lines();
  ASSERT_GE(lines.size(), 3U);
  lines.push_back(outcome.message);
  std::vector<std::string> secrets = SecretsOf(arguments, outcome);
  if (arguments.spec.actAsToken) {
    secrets.push_back((*arguments.spec.actAsToken)->Id());
  }
  const std::string request = Sts().LastRequest().body;
  EXPECT_EQ(request.find(arguments.password) != std::string::npos,
            operation == Operation::Password);
  if (request.find("<ds:SignatureValue>") != std::string::npos) {
    secrets.push_back(Between(request, "<ds:SignatureValue>", "<").substr(0, 24));
  }
  for (const std::string& line : lines) {
    for (const std::string& secret : secrets) {
      EXPECT_THAT(line, Not(HasSubstr(secret)));
    }
  }
}

void Edit(DevSts::Server& server, std::function<void(std::string&)> edit) {
  DevSts::Misbehavior misbehavior;
  misbehavior.editEnvelope = std::move(edit);
  server.SetMisbehavior(misbehavior);
}

void CutOff(DevSts::Server& server) {
  DevSts::Misbehavior misbehavior;
  misbehavior.cutOff = DevSts::CutOff{300, DevSts::CutStyle::Reset};
  server.SetMisbehavior(misbehavior);
}

void Halve(DevSts::Server& server) {
  Edit(server, [](std::string& envelope) { envelope.resize(envelope.size() / 2); });
}

void Rename(DevSts::Server& server) {
  Edit(server, [](std::string& envelope) {
    const auto at = envelope.find("<saml2:Conditions");
    if (at != std::string::npos) {
      envelope.replace(at, 17, "<saml2:Other");
    }
  });
}

void Falsify(DevSts::Server& server) {
  Edit(server, [](std::string& envelope) {
    const auto at = envelope.find("@EXAMPLE.COM");
    if (at != std::string::npos) {
      envelope.insert(at, "x");
    }
  });
}

void ForgetUsers(DevSts::Server& server) {
  server.SetUsers({});
}

INSTANTIATE_TEST_SUITE_P(Operations, OperationLogTest, testing::ValuesIn(kOperations),
                         [](const auto& tested) { return NameOf(tested.param); });

INSTANTIATE_TEST_SUITE_P(
    Operations, SecretLogTest,
    testing::Combine(testing::ValuesIn(kOperations),
                     testing::Values(Mishap{"Success", End::Success, [](DevSts::Server&) {}},
                                     Mishap{"CutOff", End::Failure, CutOff},
                                     Mishap{"Halved", End::Failure, Halve},
                                     Mishap{"Malformed", End::Either, Rename},
                                     Mishap{"Falsified", End::Either, Falsify},
                                     Mishap{"Refused", End::Either, ForgetUsers})),
    [](const auto& tested) {
      return std::string(NameOf(std::get<0>(tested.param))) + std::get<1>(tested.param).name;
    });

}  // namespace
}  // namespace SsoClient::Testing
