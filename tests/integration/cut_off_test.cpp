#include <cstddef>
#include <memory>

#include <gtest/gtest.h>

#include "integration/sts_fixture.h"

namespace SsoClient::Testing {
namespace {

class CutOffTest : public StsTest {
 protected:
  static std::shared_ptr<SecurityTokenService> PlainService() {
    return MakeService(Sts(), Sts().HttpUrl());
  }

  // Every truncated answer must fail the exchange, however much of it arrived.
  static void ExpectRefusedAt(const SecurityTokenService& service, std::size_t offset,
                              DevSts::CutStyle style) {
    DevSts::Misbehavior cut;
    cut.cutOff = DevSts::CutOff{offset, style};
    Sts().MisbehaveNext(cut);
    EXPECT_THROW(service.AcquireToken(kUser, kPassword, TenMinutes()), CommunicationException)
        << "cut after " << offset << " bytes";
  }

  // A lower bound of the length of the answer, which includes the token's text.
  static std::size_t AnswerLength() { return Acquire()->Xml().size(); }
};

TEST_F(CutOffTest, AnswerEndedEarlyOverTcpIsRefused) {
  const std::size_t length = AnswerLength();
  const auto service = PlainService();
  for (std::size_t offset = 0; offset < length; offset += offset < 300 ? 1 : 37) {
    ExpectRefusedAt(*service, offset, DevSts::CutStyle::Orderly);
  }
}

TEST_F(CutOffTest, AnswerResetOverTcpIsRefused) {
  const std::size_t length = AnswerLength();
  const auto service = PlainService();
  for (std::size_t offset = 0; offset < length; offset += 53) {
    ExpectRefusedAt(*service, offset, DevSts::CutStyle::Reset);
  }
}

TEST_F(CutOffTest, AnswerEndedEarlyOverTlsIsRefused) {
  const std::size_t length = AnswerLength();
  const auto service = Service();
  for (const auto style :
       {DevSts::CutStyle::Orderly, DevSts::CutStyle::WithoutNotice, DevSts::CutStyle::Reset}) {
    for (std::size_t offset = 0; offset < length; offset += 97) {
      ExpectRefusedAt(*service, offset, style);
    }
  }
}

TEST_F(CutOffTest, AnswerWithoutLengthCutWithoutNoticeIsRefused) {
  DevSts::Misbehavior cut;
  cut.rawAnswer =
      "HTTP/1.1 200 OK\r\nContent-Type: text/xml\r\nConnection: close\r\n\r\n<soapenv:Envelope";
  cut.cutOff = DevSts::CutOff{90, DevSts::CutStyle::WithoutNotice};
  Sts().MisbehaveNext(cut);
  EXPECT_THROW(Acquire(), CommunicationException);
}

TEST_F(CutOffTest, ServiceWorksAfterwards) {
  const auto service = Service();
  ExpectRefusedAt(*service, 100, DevSts::CutStyle::Reset);
  EXPECT_NE(service->AcquireToken(kUser, kPassword, TenMinutes()), nullptr);
}

}  // namespace
}  // namespace SsoClient::Testing
