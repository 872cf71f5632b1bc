#include "http/cookie_date.h"

#include <gtest/gtest.h>

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Http;

struct CookieDateCase {
  const char* text;
  const char* expected;  // empty if rejected
};

class CookieDateTest : public testing::TestWithParam<CookieDateCase> {};

TEST_P(CookieDateTest, ParsesOrRefuses) {
  const auto date = ParseCookieDate(GetParam().text);
  EXPECT_EQ(date ? date->ToString() : "", GetParam().expected) << GetParam().text;
}

INSTANTIATE_TEST_SUITE_P(
    Texts, CookieDateTest,
    testing::Values(
        CookieDateCase{"Sun, 06 Nov 1994 08:49:37 GMT", "1994-11-06T08:49:37.000Z"},
        CookieDateCase{"Sunday, 06-Nov-94 08:49:37 GMT", "1994-11-06T08:49:37.000Z"},
        CookieDateCase{"Sun Nov  6 08:49:37 1994", "1994-11-06T08:49:37.000Z"},
        CookieDateCase{"1 jan 00 0:0:0", "2000-01-01T00:00:00.000Z"},
        CookieDateCase{"31 DECEMBER 69 23:59:59", "2069-12-31T23:59:59.000Z"},
        CookieDateCase{"1 Jan 70 00:00:00", "1970-01-01T00:00:00.000Z"},
        CookieDateCase{"29 Feb 2028 12:00:00", "2028-02-29T12:00:00.000Z"},
        CookieDateCase{"1 Jan 1601 00:00:00", "1601-01-01T00:00:00.000Z"},
        CookieDateCase{"1 Jan 9999 00:00:00", "9999-01-01T00:00:00.000Z"},
        CookieDateCase{"1 Jan 1600 00:00:00", ""}, CookieDateCase{"29 Feb 2027 12:00:00", ""},
        CookieDateCase{"31 Apr 2027 12:00:00", ""}, CookieDateCase{"0 Jan 2027 12:00:00", ""},
        CookieDateCase{"1 Jan 2027 24:00:00", ""}, CookieDateCase{"1 Jan 2027 23:60:00", ""},
        CookieDateCase{"1 Jan 2027 23:59:60", ""}, CookieDateCase{"1 Jan 20271 00:00:00", ""},
        CookieDateCase{"1 Jan 2027 0:0", ""}, CookieDateCase{"1 Jan 2027", ""},
        CookieDateCase{"1 Foo 2027 00:00:00", ""}, CookieDateCase{"Jan 2027 00:00:00", ""},
        CookieDateCase{"", ""}, CookieDateCase{",;- /", ""}, CookieDateCase{"::", ""},
        CookieDateCase{"99999999999999999999", ""}));

}  // namespace
}  // namespace Tarnik::Testing
