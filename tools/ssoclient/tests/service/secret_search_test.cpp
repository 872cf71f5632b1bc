#include "service/secret_search.h"

#include <cstddef>
#include <ctime>
#include <string>

#include <gtest/gtest.h>

namespace SsoClient::Tool {
namespace {

TEST(SecretSearchTest, FindsTheSecretHoweverItIsEscaped) {
  const std::string secret = "p<ss & \"w\xC3\xB6rd\"";
  for (const std::string text :
       {"no p<ss & \"w\xC3\xB6rd\" here", "p&lt;ss &amp; &quot;w&#246;rd&quot;",
        "p&#x3c;ss &#38; &#34;w&#xF6;rd&#34;", "p&amp;lt;ss &amp;amp; &amp;quot;w\xC3\xB6rd\"",
        "p<ss\n&\t\"w\xC3\xB6rd\"", "p<ss?&?\"w\xC3\xB6rd\"", "it is p<ss...", "it is p&lt;ss"}) {
    EXPECT_TRUE(ContainsSecret(text, secret)) << text;
  }
}

TEST(SecretSearchTest, OtherTextsDoNotContainIt) {
  EXPECT_FALSE(ContainsSecret("Invalid credentials", "secret"));
  EXPECT_FALSE(ContainsSecret("it is sec", "secret"));
  EXPECT_FALSE(ContainsSecret("sec ret?x", "secrets"));
  EXPECT_FALSE(ContainsSecret("& &; &#; &#xZ; &lt", "secret"));
  EXPECT_FALSE(ContainsSecret("anything", ""));
  EXPECT_FALSE(ContainsSecret("", "secret"));
}

TEST(SecretSearchTest, TheTimeGrowsWithTheLengthOnly) {
  // Searching to the end of the text for the semicolon of each ampersand would take minutes.
  const std::string text(std::size_t{4} * 1024 * 1024, '&');
  const std::clock_t begin = std::clock();
  EXPECT_FALSE(ContainsSecret(text, "secret"));
  EXPECT_LT(std::clock() - begin, 20 * CLOCKS_PER_SEC);
}

}  // namespace
}  // namespace SsoClient::Tool
