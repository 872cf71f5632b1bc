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
  record.signers = 7;
  record.revoked = 3;
  record.uncovered = 4;
  listener->OnTrustReplaced(record);
  record.failure = "No.";
  listener->OnTrustKept(record);
  EXPECT_EQ(lines,
            (std::vector<std::string>{
                "4 Store 'orders': the trust is that of the files: 7 signers, 2 added, 1 removed, "
                "3 revoked, 4 without a revocation list",
                "2 Store 'orders': the trust stays as it was, 7 signers: No."}));
}

TEST_F(TrustLogListenerTest, OneSignerIsSingular) {
  const auto listener = CreateTrustLogListener();
  TrustRecord record;
  record.signers = 1;
  listener->OnTrustReplaced(record);
  listener->OnTrustKept(record);
  EXPECT_EQ(lines,
            (std::vector<std::string>{"4 Store '': the trust is that of the files: 1 signer, 0 "
                                      "added, 0 removed, 0 revoked, 0 without a revocation list",
                                      "2 Store '': the trust stays as it was, 1 signer: "}));
}

TEST_F(TrustLogListenerTest, IssuersWithoutSignersAreNamed) {
  TrustRecord record;
  record.issuersWithoutSigners = {"https://b\n", ""};
  CreateTrustLogListener()->OnTrustReplaced(record);
  EXPECT_EQ(lines, std::vector<std::string>{
                       "4 Store '': the trust is that of the files: 0 signers, 0 added, 0 removed, "
                       "0 revoked, 0 without a revocation list; without signers: 'https://b?', any "
                       "issuer"});
}

TEST_F(TrustLogListenerTest, ListenerDoesNothingByDefault) {
  TrustListener none;
  none.OnTrustReplaced({});
  none.OnTrustKept({});
  EXPECT_TRUE(lines.empty());
}

}  // namespace

}  // namespace SsoClient::Access
