#include "support/secret_text.h"

#include <algorithm>
#include <array>
#include <new>
#include <string>

#include <gtest/gtest.h>

namespace SsoClient::Testing {
namespace {

TEST(SecretTextTest, CleansesItsTextWhenItIsDestroyed) {
  const std::string secret =
      "hunter2-secret";  // short enough to be stored in the string object itself
  alignas(SecretText) std::array<unsigned char, sizeof(SecretText)> storage{};
  auto* text = new (storage.data()) SecretText(secret);
  EXPECT_EQ(text->text, secret);
  const auto holdsSecret = [&] {
    return std::search(storage.begin(), storage.end(), secret.begin(), secret.end()) !=
           storage.end();
  };
  EXPECT_TRUE(holdsSecret());
  text->~SecretText();
  EXPECT_FALSE(holdsSecret());
}

}  // namespace
}  // namespace SsoClient::Testing
