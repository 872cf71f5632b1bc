#include "secret.h"

#include <set>

#include <gtest/gtest.h>

namespace SsoClient::Access {

namespace {

// The example of the paper on SipHash, appendix A: the key 00 01 ... 0f, the text 00 01 ... 0e.
TEST(SecretTest, TagsAreThoseOfTheStandard) {
  const SecretTagger tagger({0x0706050403020100U, 0x0f0e0d0c0b0a0908U});
  std::string text;
  for (char byte = 0; byte < 15; ++byte) {
    text += byte;
  }
  EXPECT_EQ(tagger.TagOf(text), 0xa129ca6149be45e5U);
}

TEST(SecretTest, TagsDifferBySecretAndBySource) {
  const SecretTagger tagger;
  const SecretTagger other;
  std::set<SecretTagger::Tag> tags;
  std::string text;
  for (int length = 0; length < 100; ++length) {
    EXPECT_EQ(tagger.TagOf(text), tagger.TagOf(std::string(text)));
    EXPECT_NE(tagger.TagOf(text), other.TagOf(text));
    EXPECT_TRUE(tags.insert(tagger.TagOf(text)).second) << length;
    text += 'a';
  }
}

TEST(SecretTest, TextIsCleansed) {
  alignas(Secret) unsigned char memory[sizeof(Secret)];
  auto* const secret = new (memory) Secret{std::string("geheim")};  // within the object itself
  ASSERT_EQ(secret->text, "geheim");
  secret->~Secret();
  const std::string left(reinterpret_cast<const char*>(memory), sizeof memory);
  EXPECT_EQ(left.find("eheim"), std::string::npos);
}

}  // namespace

}  // namespace SsoClient::Access
