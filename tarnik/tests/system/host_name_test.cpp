#include "system/host_name.h"

#include <string>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>

#include "support/thrown_message.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::System;

TEST(HostNameTest, AcceptsNamesAndAddresses) {
  for (const char* host : {"localhost", "sts.example", "sts.example.", "xn--caf-dma.example",
                           "a_b.example", "127.0.0.1", "::1", "fe80::1%eth0"}) {
    EXPECT_NO_THROW(RequireHostName(host)) << host;
  }
  EXPECT_NO_THROW(RequireHostName(std::string(253, 'a')));
}

TEST(HostNameTest, DistinguishesAddressesFromNames) {
  for (const char* host : {"127.0.0.1", "::1", "2001:db8::2", "fe80::1%eth0"}) {
    EXPECT_TRUE(IsAddressLiteral(host)) << host;
  }
  for (const char* host : {"localhost", "1.2.3", "256.1.1.1", "127.0.0.1.example", "0x7f.0.0.1"}) {
    EXPECT_FALSE(IsAddressLiteral(host)) << host;
  }
}

TEST(HostNameTest, ANameMayEndWithTheFullStopOfTheRoot) {
  EXPECT_EQ(WithoutRootDot("sts.example."), "sts.example");
  EXPECT_EQ(WithoutRootDot("sts.example"), "sts.example");
  EXPECT_EQ(WithoutRootDot("."), ".");
  EXPECT_TRUE(IsDnsName("sts.example."));
  for (const char* host : {".", "..", "sts.example..", "127.0.0.1.", "sts.1."}) {
    EXPECT_FALSE(IsDnsName(host)) << host;
  }
  EXPECT_NO_THROW(RequireHostName(std::string(253, 'a') + "."));
  EXPECT_THROW(RequireHostName(std::string(254, 'a') + "."), InvalidArgumentException);
}

TEST(HostNameTest, DescribesEndpoints) {
  EXPECT_EQ(DescribeEndpoint("sts.example", 443), "sts.example:443");
  EXPECT_EQ(DescribeEndpoint("::1", 8443), "[::1]:8443");
}

TEST(HostNameTest, DoesNotRepeatWhatItRefuses) {
  EXPECT_EQ(ThrownMessage<InvalidArgumentException>([] { RequireHostName("secret\nhost"); }),
            "The host name holds a character that no host name may hold.");
}

}  // namespace
}  // namespace Tarnik::Testing
