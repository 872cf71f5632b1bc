#include "system/host_name.h"

#include <gtest/gtest.h>
#include <tarnik/core/exception.h>

namespace Tarnik::System {
namespace {

TEST(HostName, AcceptsNamesAndAddresses) {
  for (const char* host : {"localhost", "sts.example", "sts.example.", "xn--caf-dma.example",
                           "a_b.example", "127.0.0.1", "::1", "fe80::1%eth0"}) {
    EXPECT_NO_THROW(RequireHostName(host)) << host;
  }
  EXPECT_NO_THROW(RequireHostName(std::string(253, 'a')));
}

TEST(HostName, TellsAddressesFromNames) {
  for (const char* host : {"127.0.0.1", "::1", "2001:db8::2", "fe80::1%eth0"}) {
    EXPECT_TRUE(IsAddressLiteral(host)) << host;
  }
  for (const char* host : {"localhost", "1.2.3", "256.1.1.1", "127.0.0.1.example", "0x7f.0.0.1"}) {
    EXPECT_FALSE(IsAddressLiteral(host)) << host;
  }
}

TEST(HostName, DescribesEndpoints) {
  EXPECT_EQ(DescribeEndpoint("sts.example", 443), "sts.example:443");
  EXPECT_EQ(DescribeEndpoint("::1", 8443), "[::1]:8443");
}

TEST(HostName, DoesNotRepeatWhatItRefuses) {
  try {
    RequireHostName("secret\nhost");
    FAIL();
  } catch (const InvalidArgumentException& e) {
    EXPECT_EQ(e.Message(), "The host name holds a character that no host name may hold.");
  }
}

}  // namespace
}  // namespace Tarnik::System
