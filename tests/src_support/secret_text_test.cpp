#include "support/secret_text.h"

#include <array>
#include <new>
#include <string>

#include <gtest/gtest.h>

#include "support/holds_text.h"

namespace SsoClient::Testing {
namespace {

TEST(SecretTextTest, CleansesItsTextWhenItIsDestroyed) {
  const std::string secret =
      "hunter2-secret";  // short enough to be stored in the string object itself
  alignas(SecretText) std::array<unsigned char, sizeof(SecretText)> storage{};
  auto* text = new (storage.data()) SecretText(secret);
  EXPECT_EQ(text->text, secret);
  EXPECT_TRUE(HoldsText(storage, secret));
  text->~SecretText();
  EXPECT_FALSE(HoldsText(storage, secret));
}

}  // namespace
}  // namespace SsoClient::Testing
