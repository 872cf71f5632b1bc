#include "transport/transport.h"

#include <array>
#include <new>
#include <string>

#include <gtest/gtest.h>

#include "support/holds_text.h"

namespace SsoClient::Testing {
namespace {

TEST(SoapRequestTest, HoldsTheActionAndThenTheBody) {
  SoapRequest request;
  request.action = "the action";
  request.body = "the body";
  const auto& [first, second] = request;
  EXPECT_EQ(first, "the action");
  EXPECT_EQ(second, "the body");
}

TEST(SoapRequestTest, CleansesItsBodyWhenItIsDestroyed) {
  const std::string secret =
      "hunter2-secret";  // short enough to be stored in the string object itself
  alignas(SoapRequest) std::array<unsigned char, sizeof(SoapRequest)> storage{};
  auto* request = new (storage.data()) SoapRequest();
  request->body = secret;
  EXPECT_TRUE(HoldsText(storage, secret));
  request->~SoapRequest();
  EXPECT_FALSE(HoldsText(storage, secret));
}

}  // namespace
}  // namespace SsoClient::Testing
