// Holder-of-key operations over a user agent and connections of the caller.
#include <chrono>
#include <cstdint>
#include <future>
#include <iterator>
#include <memory>
#include <set>
#include <string>
#include <typeinfo>
#include <utility>
#include <vector>

#include <gmock/gmock.h>

#include <tarnik/http/connection_specs.h>
#include <tarnik/http/http_user_agent.h>

#include "integration/holder_of_key_fixture.h"
#include "integration/operation.h"
#include "support/holder_of_key.h"

namespace SsoClient::Testing {
namespace {

using testing::SizeIs;

class UserAgentTest : public HolderOfKeyTest {
 protected:
  static std::shared_ptr<SecurityTokenService> ServiceOver(Tarnik::Http::ConnectionPool* pool) {
    const auto spec = Tarnik::Http::CreateTLSConnectionSpec("127.0.0.1", Sts().HttpsPort(),
                                                            TrustCa(Sts()).get(), "");
    SecurityTokenServiceConfigEx config;
    config.url = "/sts";
    config.userAgent = Tarnik::Http::CreateHttpUserAgent(spec.get(), nullptr, pool);
    config.tokenFactory = CreateSamlTokenFactory(TrustSigner(Sts().SigningCertificatePem()).get());
    config.holderOfKeyConfig = ConfigOf(Holder());
    return CreateSecurityTokenService(config);
  }
};

TEST_F(UserAgentTest, EveryOperationWorksOverOneConnection) {
  const auto pool = Tarnik::Http::CreateConnectionPool();
  const auto service = ServiceOver(pool.get());
  Arguments arguments;
  arguments.token = AcquireBound();
  Sts().ClearRequests();
  for (int round = 0; round < 2; ++round) {
    for (const Operation operation : kOperations) {
      const Outcome outcome = CallNow(operation, *service, arguments);
      EXPECT_TRUE(outcome.IsSuccess()) << operation << ": " << outcome.message;
    }
  }
  const auto requests = Sts().Requests();
  ASSERT_THAT(requests, SizeIs(10));
  std::set<std::uint64_t> connections;
  for (const auto& request : requests) {
    EXPECT_TRUE(request.overTls);
    connections.insert(request.connectionId);
  }
  EXPECT_THAT(connections, SizeIs(1));
}

TEST_F(UserAgentTest, FaultLeavesTheConnectionUsable) {
  const auto pool = Tarnik::Http::CreateConnectionPool();
  const auto service = ServiceOver(pool.get());
  Arguments arguments;
  arguments.token = AcquireBound();
  arguments.password = "wrong-secret";
  EXPECT_EQ(CallNow(Operation::Password, *service, arguments).errorClass,
            typeid(InvalidCredentialsException));
  EXPECT_TRUE(CallNow(Operation::Renew, *service, arguments).IsSuccess());
  EXPECT_EQ(Sts().LastRequest().ordinalOnConnection, 2U);
}

TEST_F(UserAgentTest, AsyncCallsInFlightShareTheUserAgent) {
  const auto pool = Tarnik::Http::CreateConnectionPool();
  auto service = ServiceOver(pool.get());
  Arguments arguments;
  arguments.token = AcquireBound();
  std::vector<std::future<Outcome>> futures;
  for (int i = 0; i < 100; ++i) {
    futures.push_back(CallAsync(kOperations[i % std::size(kOperations)], *service, arguments));
  }
  service.reset();
  for (auto& future : futures) {
    ASSERT_EQ(future.wait_for(std::chrono::seconds(120)), std::future_status::ready);
    const Outcome outcome = future.get();
    EXPECT_TRUE(outcome.IsSuccess()) << outcome.message;
  }
}

}  // namespace
}  // namespace SsoClient::Testing
