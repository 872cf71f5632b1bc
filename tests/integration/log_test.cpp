#include <mutex>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include <tarnik/service/log.h>

#include "integration/sts_fixture.h"
#include "integration/text_edits.h"

namespace SsoClient::Testing {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;

struct Line {
  int level;
  std::string text;
  bool operator==(const Line& other) const { return level == other.level && text == other.text; }
};

class LogTest : public StsTest {
 protected:
  LogTest() {
    Tarnik::Service::SetLogSink([this](const Tarnik::Service::LogRecord& record) {
      const std::lock_guard guard(mutex_);
      if (record.logger == "SsoClient") {
        lines_.push_back({record.level, std::string(record.text)});
      }
    });
  }
  ~LogTest() override {
    Tarnik::Service::SetLogSink({});
    Tarnik::Service::SetLogLevel("SsoClient", 4);
  }

  std::mutex mutex_;
  std::vector<Line> lines_;
};

constexpr char kRequestLine[] =
    "Requested token for subject `alice@EXAMPLE.COM', spec `TokenSpec [tokenLifetimeSec=600, "
    "delegable=false, delegateTo=<unset>, renewable=false, "
    "confirmationType=0,audienceRestriction=, advice=[]'";

TEST_F(LogTest, SuccessWritesItsLinesInOrder) {
  Tarnik::Service::SetLogLevel("SsoClient", 9);
  const auto token = Acquire();
  EXPECT_THAT(
      lines_,
      ElementsAre(Line{7, "START operation SecurityTokenServiceImpl::AcquireToken"},
                  Line{7, kRequestLine},
                  Line{7, "SecurityTokenServiceImpl::AcquireToken sending request"},
                  Line{7, "SecurityTokenServiceImpl::AcquireToken processing response"},
                  Line{5, "Successfully acquired token: " + CreateSamlTokenDescription(*token)},
                  Line{7, "END operation SecurityTokenServiceImpl::AcquireToken"}));
}

TEST_F(LogTest, FailureStillWritesTheEndLine) {
  Tarnik::Service::SetLogLevel("SsoClient", 7);
  EXPECT_THROW(Service()->AcquireToken(kUser, "wrong-secret", TenMinutes()),
               InvalidCredentialsException);
  ASSERT_FALSE(lines_.empty());
  EXPECT_EQ(lines_.front(), (Line{7, "START operation SecurityTokenServiceImpl::AcquireToken"}));
  EXPECT_EQ(lines_.back(), (Line{7, "END operation SecurityTokenServiceImpl::AcquireToken"}));
}

TEST_F(LogTest, LevelFiveShowsOnlyTheToken) {
  Tarnik::Service::SetLogLevel("SsoClient", 5);
  Acquire();
  ASSERT_EQ(lines_.size(), 1U);
  EXPECT_EQ(lines_[0].level, 5);
  EXPECT_THAT(lines_[0].text, HasSubstr("Successfully acquired token: SamlToken [subject="));
}

TEST_F(LogTest, ByDefaultSuccessIsSilent) {
  Acquire();
  EXPECT_TRUE(lines_.empty());
}

TEST_F(LogTest, NoPasswordOrTokenTextInAnyLine) {
  Tarnik::Service::SetLogLevel("SsoClient", 9);
  const auto token = Acquire();
  EXPECT_THROW(Service()->AcquireToken(kUser, "wrong-secret", TenMinutes()), SsoException);
  Sts().ClearRequests();
  DevSts::Misbehavior cut;
  cut.cutOff = DevSts::CutOff{2000, DevSts::CutStyle::Reset};
  Sts().MisbehaveNext(cut);
  EXPECT_THROW(Acquire(), CommunicationException);
  for (const Line& line : lines_) {
    EXPECT_THAT(line.text, Not(HasSubstr("secret")));
    EXPECT_THAT(line.text, Not(HasSubstr(token->Id())));
    EXPECT_THAT(line.text, Not(HasSubstr("SignatureValue")));
  }
}

TEST_F(LogTest, NoTokenTextInTheFailureOrTheLinesOfARefusedAnswer) {
  using Edit = void (*)(std::string&);
  const Edit kEdits[] = {
      [](std::string& envelope) { envelope.resize(envelope.size() / 2); },
      [](std::string& envelope) { Replace(envelope, "</saml2:Subject>", "</saml2:Broken>"); },
      [](std::string& envelope) { Replace(envelope, ":Conditions", "&:Conditions"); },
      [](std::string& envelope) { Replace(envelope, "<saml2:Conditions", "<saml2:Other"); },
      [](std::string& envelope) { Replace(envelope, "alice@", "malice@"); },
      [](std::string& envelope) { Replace(envelope, "RequestedSecurityToken>", "Nothing>"); },
      [](std::string& envelope) { Replace(envelope, "SignatureValue>", "SignatureValue><a/>"); },
  };
  Tarnik::Service::SetLogLevel("SsoClient", 9);
  for (const Edit& edit : kEdits) {
    std::string signature;
    DevSts::Misbehavior misbehavior;
    misbehavior.editEnvelope = [&signature, edit](std::string& envelope) {
      signature = Between(envelope, "SignatureValue>", "<");
      edit(envelope);
    };
    Sts().SetMisbehavior(misbehavior);
    std::string message;
    try {
      Acquire();
      ADD_FAILURE() << "the answer was accepted after edit " << (&edit - kEdits);
    } catch (const Tarnik::Exception& error) {
      message = error.Message();
    }
    Sts().ClearMisbehavior();
    ASSERT_GT(signature.size(), 40U);
    lines_.push_back({0, message});
    for (const Line& line : lines_) {
      EXPECT_THAT(line.text, Not(HasSubstr(signature.substr(0, 20))));
      EXPECT_THAT(line.text, Not(HasSubstr("secret")));
      EXPECT_THAT(line.text, Not(HasSubstr("<saml2")));
    }
    lines_.clear();
  }
}

}  // namespace
}  // namespace SsoClient::Testing
