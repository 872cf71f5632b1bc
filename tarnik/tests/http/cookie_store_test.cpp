#include <string>
#include <string_view>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include <tarnik/http/cookie_store.h>
#include <tarnik/system/date_time.h>

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Http;
using System::DateTime;

const DateTime kNow = DateTime::Parse("2030-01-01T00:00:00Z");
const DateTime kSecondLater = DateTime::Parse("2030-01-01T00:00:01Z");
const DateTime kYearLater = DateTime::Parse("2031-01-01T00:00:00Z");

class CookieStoreTest : public testing::Test {
 protected:
  void Store(const std::string& setCookie, std::string_view host = "sts.example",
             std::string_view path = "/sts/service", bool isSecure = true) {
    store_->Store(host, path, isSecure, setCookie, kNow);
  }

  std::string Header(std::string_view host = "sts.example", std::string_view path = "/sts/service",
                     bool isSecure = true, const DateTime& now = kNow) {
    return store_->HeaderFor(host, path, isSecure, now);
  }

  Ref<CookieStore> store_ = CreateCookieStore("");
};

TEST_F(CookieStoreTest, IsEmptyAtFirst) {
  EXPECT_EQ(Header(), "");
}

TEST_F(CookieStoreTest, NamesItselfInItsDescription) {
  EXPECT_EQ(CreateCookieStore("legs")->ToString(), "<CookieStore:legs>");
}

TEST_F(CookieStoreTest, SendsBackWhatItWasGiven) {
  Store("id=42");
  EXPECT_EQ(Header(), "id=42");
}

TEST_F(CookieStoreTest, KeepsEveryCharacterOfTheValue) {
  Store("  id = \"a b=c,d\" ; Path=/");
  EXPECT_EQ(Header(), "id=\"a b=c,d\"");
}

TEST_F(CookieStoreTest, TheFullStopOfTheRootMakesNoOtherHost) {
  Store("a=1", "sts.example.");
  Store("b=2; Domain=sts.example", "sts.example.");
  EXPECT_EQ(Header("sts.example."), "a=1; b=2");
  EXPECT_EQ(Header("sts.example"), "a=1; b=2");
  EXPECT_EQ(Header("other.example."), "");
}

TEST_F(CookieStoreTest, TrimsTabsAroundNameAndValue) {
  Store("\tid\t=\t42\t;\tPath\t=\t/");
  EXPECT_EQ(Header("sts.example", "/"), "id=42");
}

TEST_F(CookieStoreTest, KeepsAnEmptyValue) {
  Store("id=");
  EXPECT_EQ(Header(), "id=");
}

TEST_F(CookieStoreTest, ListsLongerPathsFirstAndThenOlderCookies) {
  Store("a=1; Path=/");
  Store("b=2; Path=/sts");
  Store("c=3; Path=/");
  Store("d=4; Path=/sts/service");
  EXPECT_EQ(Header(), "d=4; b=2; a=1; c=3");
}

TEST_F(CookieStoreTest, ReplacesACookieInPlace) {
  Store("a=1; Path=/");
  Store("b=2; Path=/");
  Store("a=3; Path=/");
  EXPECT_EQ(Header(), "a=3; b=2");
}

TEST_F(CookieStoreTest, DistinguishesNamesByCase) {
  Store("a=1");
  Store("A=2");
  EXPECT_EQ(Header(), "a=1; A=2");
}

struct IgnoredCookie {
  std::string setCookie;
};

class IgnoredCookieTest : public CookieStoreTest,
                          public testing::WithParamInterface<IgnoredCookie> {};

TEST_P(IgnoredCookieTest, IsNotStored) {
  Store(GetParam().setCookie);
  EXPECT_EQ(Header(), "");
  EXPECT_EQ(Header("other.example", "/"), "");
}

INSTANTIATE_TEST_SUITE_P(
    Cookies, IgnoredCookieTest,
    testing::Values(
        IgnoredCookie{""}, IgnoredCookie{"novalue"}, IgnoredCookie{"=value"},
        IgnoredCookie{" =value"}, IgnoredCookie{"; a=1"},
        IgnoredCookie{"a=1; Domain=other.example"}, IgnoredCookie{"a=1; Domain=example.evil"},
        IgnoredCookie{"a=1; Domain=example"}, IgnoredCookie{"a=1; Domain=.example"},
        IgnoredCookie{"a=1; Domain=ts.example"}, IgnoredCookie{"a=1; Domain=a.sts.example"},
        IgnoredCookie{"a=1; Max-Age=0"}, IgnoredCookie{"a=1; Max-Age=-1"},
        IgnoredCookie{"a=1; Max-Age=-99999999999999999999"},
        IgnoredCookie{"a=1; Expires=Tue, 01 Jan 2030 00:00:00 GMT"},
        IgnoredCookie{"a=1; Expires=Wed, 01 Jan 2020 00:00:00 GMT"}, IgnoredCookie{"a=1\r\nX: y"},
        IgnoredCookie{std::string("a=1\0", 4)}, IgnoredCookie{"a=\x01"}, IgnoredCookie{"a=b\tc"},
        IgnoredCookie{"a\tb=c"}, IgnoredCookie{"a=1\x7F"}, IgnoredCookie{"a=1; Path=/\x01"},
        IgnoredCookie{"a=1; x\r\nX: y"}, IgnoredCookie{std::string("a=1; Secure\0", 12)},
        IgnoredCookie{"a=" + std::string(4095, 'x')}));

TEST_F(CookieStoreTest, AcceptsACookieOfTheLargestSize) {
  const std::string cookie = "a=" + std::string(4094, 'x');
  Store(cookie);
  EXPECT_EQ(Header(), cookie);
}

TEST_F(CookieStoreTest, SendsAHostOnlyCookieOnlyToItsHost) {
  Store("a=1");
  EXPECT_EQ(Header("STS.Example"), "a=1");
  EXPECT_EQ(Header("a.sts.example"), "");
  EXPECT_EQ(Header("example"), "");
  EXPECT_EQ(Header("xsts.example"), "");
}

TEST_F(CookieStoreTest, SendsADomainCookieToEveryHostOfTheDomain) {
  Store("a=1; Domain=.Corp.Example", "sts.corp.example");
  EXPECT_EQ(Header("sts.corp.example"), "a=1");
  EXPECT_EQ(Header("other.corp.example"), "a=1");
  EXPECT_EQ(Header("corp.example"), "a=1");
  EXPECT_EQ(Header("evilcorp.example"), "");
  EXPECT_EQ(Header("corp.example.evil"), "");
}

TEST_F(CookieStoreTest, DoesNotTreatAnAddressAsADomain) {
  Store("a=1; Domain=0.0.1", "10.0.0.1");
  EXPECT_EQ(Header("10.0.0.1"), "");
  Store("a=1; Domain=10.0.0.1", "10.0.0.1");
  EXPECT_EQ(Header("10.0.0.1"), "a=1");
  EXPECT_EQ(Header("1.10.0.0.1"), "");
}

TEST_F(CookieStoreTest, IgnoresAnEmptyDomain) {
  Store("a=1; Domain=.");
  Store("b=2; Domain=");
  EXPECT_EQ(Header(), "a=1; b=2");
  EXPECT_EQ(Header("a.sts.example"), "");
}

TEST_F(CookieStoreTest, AcceptsADomainOfOneLabelFromThatHostItself) {
  Store("a=1; Domain=localhost", "localhost");
  EXPECT_EQ(Header("localhost"), "a=1");
  EXPECT_EQ(Header("a.localhost"), "");
}

struct PathCase {
  const char* setCookie;
  const char* requestPath;
  bool isSent;
};

class CookiePathTest : public CookieStoreTest, public testing::WithParamInterface<PathCase> {};

TEST_P(CookiePathTest, DecidesWhetherTheCookieIsSent) {
  Store(GetParam().setCookie);
  EXPECT_EQ(Header("sts.example", GetParam().requestPath), GetParam().isSent ? "a=1" : "");
}

INSTANTIATE_TEST_SUITE_P(
    Paths, CookiePathTest,
    testing::Values(
        PathCase{"a=1", "/sts/other", true}, PathCase{"a=1", "/sts", true},
        PathCase{"a=1", "/", false}, PathCase{"a=1", "/stsx", false},
        PathCase{"a=1; Path=/sts", "/sts", true}, PathCase{"a=1; Path=/sts", "/sts?x=/y", true},
        PathCase{"a=1; Path=/sts", "/sts/a", true}, PathCase{"a=1; Path=/sts", "/stsa", false},
        PathCase{"a=1; Path=/sts/", "/sts/a", true}, PathCase{"a=1; Path=/sts/", "/sts", false},
        PathCase{"a=1; Path=/STS", "/sts", false}, PathCase{"a=1; Path=relative", "/sts/x", true},
        PathCase{"a=1; Path=relative", "/x", false}, PathCase{"a=1; Path=", "/sts/x", true},
        PathCase{"a=1; Path=/x; Path=/", "/any", true}));

TEST_F(CookieStoreTest, DerivesTheDefaultPathWithoutTheQuery) {
  Store("a=1", "sts.example", "/sts?return=/deep/path");
  EXPECT_EQ(Header("sts.example", "/"), "a=1");
}

TEST_F(CookieStoreTest, ExpiresByMaxAge) {
  Store("a=1; Max-Age=1");
  EXPECT_EQ(Header(), "a=1");
  EXPECT_EQ(Header("sts.example", "/sts/service", true, kSecondLater), "");
}

TEST_F(CookieStoreTest, ExpiresByDate) {
  Store("a=1; Expires=Tue, 01 Jan 2030 00:00:01 GMT");
  EXPECT_EQ(Header(), "a=1");
  EXPECT_EQ(Header("sts.example", "/sts/service", true, kSecondLater), "");
}

TEST_F(CookieStoreTest, PrefersMaxAgeToExpires) {
  Store("a=1; Max-Age=31536001; Expires=Tue, 01 Jan 2030 00:00:01 GMT");
  Store("b=2; Expires=Tue, 01 Jan 2030 00:00:01 GMT; Max-Age=31536001");
  EXPECT_EQ(Header("sts.example", "/sts/service", true, kYearLater), "a=1; b=2");
}

TEST_F(CookieStoreTest, TreatsAHugeMaxAgeAsTheEndOfTime) {
  Store("a=1; Max-Age=99999999999999999999999");
  EXPECT_EQ(Header("sts.example", "/sts/service", true, kYearLater), "a=1");
}

TEST_F(CookieStoreTest, KeepsACookieWithAMalformedExpiry) {
  Store("a=1; Max-Age=soon; Expires=someday");
  EXPECT_EQ(Header("sts.example", "/sts/service", true, kYearLater), "a=1");
}

TEST_F(CookieStoreTest, DropsACookieThatIsSetAgainAsExpired) {
  Store("a=1");
  Store("a=; Max-Age=0");
  EXPECT_EQ(Header(), "");
}

TEST_F(CookieStoreTest, DoesNotSendSecureCookiesOverPlainHttp) {
  Store("a=1; Secure");
  EXPECT_EQ(Header("sts.example", "/sts/service", false), "");
  EXPECT_EQ(Header(), "a=1");
}

TEST_F(CookieStoreTest, IgnoresSecureCookiesFromPlainHttp) {
  Store("a=1; secure", "sts.example", "/sts/service", false);
  EXPECT_EQ(Header(), "");
}

TEST_F(CookieStoreTest, PlainHttpCanNeitherReplaceNorDropASecureCookie) {
  Store("a=1; Secure");
  Store("a=evil", "sts.example", "/sts/service", false);
  EXPECT_EQ(Header(), "a=1");
  Store("a=; Max-Age=0", "sts.example", "/sts/service", false);
  EXPECT_EQ(Header(), "a=1");
}

TEST_F(CookieStoreTest, KeepsFiftyCookiesPerHostAndDropsTheOldest) {
  Store("other=1; Path=/", "other.example");
  for (int i = 0; i < 50; ++i) {
    Store("n" + std::to_string(i) + "=1; Path=/");
  }
  EXPECT_TRUE(Header().starts_with("n0=1; n1=1"));
  Store("last=1; Path=/");
  EXPECT_TRUE(Header().starts_with("n1=1; n2=1"));
  EXPECT_TRUE(Header().ends_with("n49=1; last=1"));
  EXPECT_EQ(Header("other.example"), "other=1");
}

TEST_F(CookieStoreTest, KeepsThreeHundredCookiesAndDropsTheOldest) {
  for (int i = 0; i < 300; ++i) {
    Store("a=1", "h" + std::to_string(i) + ".example");
  }
  EXPECT_EQ(Header("h0.example"), "a=1");
  Store("a=1", "last.example");
  EXPECT_EQ(Header("h0.example"), "");
  EXPECT_EQ(Header("h1.example"), "a=1");
  EXPECT_EQ(Header("last.example"), "a=1");
}

TEST_F(CookieStoreTest, MakesRoomByDroppingExpiredCookiesFirst) {
  Store("keep=1; Path=/");
  for (int i = 0; i < 49; ++i) {
    Store("n" + std::to_string(i) + "=1; Max-Age=1");
  }
  store_->Store("sts.example", "/", true, "new=1; Path=/", kSecondLater);
  EXPECT_EQ(Header("sts.example", "/", true, kSecondLater), "keep=1; new=1");
}

TEST(CookieStoreConcurrencyTest, ServesManyThreads) {
  const auto store = CreateCookieStore("shared");
  std::vector<std::thread> threads;
  for (int t = 0; t < 4; ++t) {
    threads.emplace_back([&store, t] {
      for (int i = 0; i < 200; ++i) {
        store->Store("sts.example", "/", true, "t" + std::to_string(t) + "=1", kNow);
        store->HeaderFor("sts.example", "/", true, kNow);
      }
    });
  }
  for (std::thread& thread : threads) {
    thread.join();
  }
  EXPECT_EQ(store->HeaderFor("sts.example", "/", true, kNow).size(), 4 * 4U + 3 * 2U);
}

}  // namespace
}  // namespace Tarnik::Testing
