#include "doctor/dns_probe.h"

#include <cerrno>
#include <chrono>
#include <future>

#include <gtest/gtest.h>
#include <netdb.h>

namespace SsoClient::Tool::Doctor {
namespace {

std::string FindingOf(int error) {
  Resolution resolution;
  resolution.error = error;
  resolution.errorText = "text";
  const Finding finding = FindingOfResolution("sts.example", resolution);
  EXPECT_EQ(finding.outcome, StepOutcome::kFailed);
  EXPECT_NE(finding.remedy, "");
  EXPECT_NE(finding.message.find("sts.example"), std::string::npos);
  return finding.name;
}

TEST(DnsProbeTest, EachErrorOfTheResolverHasItsFinding) {
  EXPECT_EQ(FindingOf(EAI_NONAME), "unknown-host");
  EXPECT_EQ(FindingOf(EAI_AGAIN), "no-name-server");
  EXPECT_EQ(FindingOf(EAI_FAIL), "no-name-server");
  EXPECT_EQ(FindingOf(EAI_SYSTEM), "local-failure");
  EXPECT_EQ(FindingOf(EAI_MEMORY), "local-failure");
  EXPECT_EQ(FindingOf(0), "unknown-host");  // no error and no address
}

TEST(DnsProbeTest, AddressesAreResolvedWithoutAServer) {
  const Resolution four = ResolveBySystem("127.0.0.1", 443);
  ASSERT_EQ(four.addresses.size(), 1U);
  EXPECT_EQ(four.addresses.front().text, "127.0.0.1");
  EXPECT_FALSE(four.addresses.front().IsIpv6());
  const Resolution six = ResolveBySystem("::1", 443);
  ASSERT_EQ(six.addresses.size(), 1U);
  EXPECT_TRUE(six.addresses.front().IsIpv6());
  EXPECT_EQ(FindingOfResolution("::1", six).message, "0 IPv4 addresses and 1 IPv6 address");
}

TEST(DnsProbeTest, AResolverThatDoesNotAnswerIsLeftToItself) {
  std::promise<void> release;
  std::promise<void> ended;
  const Resolver hanging = [&](const std::string&, int) {
    release.get_future().wait();
    ended.set_value_at_thread_exit();
    return Resolution{};
  };
  const Resolution resolution = ResolveUntil(
      hanging, "sts.example", 443, TimeLimit::Clock::now() + std::chrono::milliseconds(20));
  EXPECT_TRUE(resolution.isTimedOut);
  EXPECT_EQ(FindingOfResolution("sts.example", resolution).name, "dns-timed-out");
  release.set_value();
  ended.get_future().wait();
}

}  // namespace
}  // namespace SsoClient::Tool::Doctor
