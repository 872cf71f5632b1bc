// Whatever a peer sets, the Cookie header returned to it is one clean line of bounded size that
// contains only what the peer set, and no other host receives it. The lines of the input are
// Set-Cookie headers of several answers.
#include <algorithm>
#include <sstream>

#include <tarnik/http/cookie_store.h>

#include "input.h"

namespace {

using Tarnik::System::DateTime;

constexpr std::size_t kMaxHeaderBytes = 50 * 4100;

bool IsControl(char c) {
  return static_cast<unsigned char>(c) < 0x20 || c == 0x7F;
}

void RequireClean(const std::string& header, const std::string& input) {
  Fuzz::Require(std::none_of(header.begin(), header.end(), IsControl));
  Fuzz::Require(header.size() <= kMaxHeaderBytes);
  std::size_t begin = 0;
  while (begin < header.size()) {
    const std::size_t end = std::min(header.find("; ", begin), header.size());
    const std::string pair = header.substr(begin, end - begin);
    const std::size_t equals = pair.find('=');
    Fuzz::Require(equals != std::string::npos && equals > 0);
    Fuzz::Require(input.find(pair.substr(0, equals)) != std::string::npos);
    Fuzz::Require(input.find(pair.substr(equals + 1)) != std::string::npos);
    begin = end + 2;
  }
}

// The parent domain receives only cookies that were set for it, which the host receives too.
void RequireSomeOf(const std::string& header, const std::string& all) {
  for (std::size_t begin = 0; begin < header.size();) {
    const std::size_t end = std::min(header.find("; ", begin), header.size());
    const std::string pair = header.substr(begin, end - begin);
    Fuzz::Require(("; " + all + "; ").find("; " + pair + "; ") != std::string::npos);
    begin = end + 2;
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  static const DateTime now = DateTime::Parse("2024-03-05T07:08:09Z");
  static const DateTime muchLater = DateTime::Parse("9999-12-31T23:59:59Z");
  const std::string input = Fuzz::TextOf(data, size);
  const auto store = Tarnik::Http::CreateCookieStore("");
  const auto address = Tarnik::Http::CreateCookieStore("");
  const auto plain = Tarnik::Http::CreateCookieStore("");
  std::istringstream lines(input);
  for (std::string line; std::getline(lines, line);) {
    store->Store("sts.example.com", "/a/b", true, line, now);
    address->Store("127.0.0.1", "/a/b", true, line, now);
    plain->Store("sts.example.com", "/a/b", false, line, now);
  }
  const std::string own = store->HeaderFor("sts.example.com", "/a/b", true, now);
  RequireClean(own, input);
  Fuzz::Require(own == store->HeaderFor("STS.Example.COM", "/a/b?query", true, now));
  RequireClean(plain->HeaderFor("sts.example.com", "/a/b", true, now), input);
  for (const char* stranger : {"elsewhere.example", "com", "xsts.example.com.evil.example",
                               "badexample.com", "sts.example.com.evil.example", "127.0.0.1", ""}) {
    Fuzz::Require(store->HeaderFor(stranger, "/a/b", true, now).empty());
  }
  for (const char* stranger : {"1.127.0.0.1", "0.0.1", "127.0.0.2", "sts.example.com"}) {
    Fuzz::Require(address->HeaderFor(stranger, "/a/b", true, now).empty());
  }
  RequireSomeOf(store->HeaderFor("example.com", "/a/b", true, now), own);
  const std::string inTheClear = store->HeaderFor("sts.example.com", "/a/b", false, now);
  const std::string laterOn = store->HeaderFor("sts.example.com", "/a/b", true, muchLater);
  Fuzz::Require(inTheClear.size() <= own.size() && laterOn.size() <= own.size());
  return 0;
}
