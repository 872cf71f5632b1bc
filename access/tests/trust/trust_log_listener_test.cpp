#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ssoclient/access/trust_store.h>
#include <tarnik/service/log.h>

namespace SsoClient::Access {

namespace {

class TrustLogListenerTest : public ::testing::Test {
 protected:
  TrustLogListenerTest() {
    Tarnik::Service::SetLogLevel("TrustStore", 9);
    Tarnik::Service::SetLogSink([this](const Tarnik::Service::LogRecord& record) {
      EXPECT_EQ(record.logger, "TrustStore");
      lines.push_back(std::to_string(record.level) + " " + std::string(record.text));
    });
  }
  ~TrustLogListenerTest() override {
    Tarnik::Service::SetLogSink({});
    Tarnik::Service::SetLogLevel("TrustStore", 4);
  }

  std::vector<std::string> lines;
};

TEST_F(TrustLogListenerTest, ReplacementsAreAtLevelFourAndFailuresAtLevelTwo) {
  const auto listener = CreateTrustLogListener();
  TrustRecord record;
  record.store = "orders";
  record.added = 2;
  record.removed = 1;
  record.signers = 3;
  listener->OnTrustReplaced(record);
  record.failure = "No.";
  listener->OnTrustKept(record);
  EXPECT_EQ(lines,
            (std::vector<std::string>{
                "4 Store 'orders': the trust is that of the files: 3 certificates, 2 added, 1 "
                "removed",
                "2 Store 'orders': the trust stays as it was, 3 certificates: No."}));
}

TEST_F(TrustLogListenerTest, ListenerDoesNothingByDefault) {
  TrustListener none;
  none.OnTrustReplaced({});
  none.OnTrustKept({});
  EXPECT_TRUE(lines.empty());
}

}  // namespace

}  // namespace SsoClient::Access
