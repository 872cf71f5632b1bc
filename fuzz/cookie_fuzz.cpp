// Whatever a peer sets, the header that goes back is one clean line.
#include <tarnik/http/cookie_store.h>

#include <algorithm>

#include "input.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const auto now = Tarnik::System::DateTime::Parse("2024-03-05T07:08:09Z");
  const auto store = Tarnik::Http::CreateCookieStore("");
  store->Store("sts.example.com", "/a/b", true, Fuzz::TextOf(data, size), now);
  const std::string header = store->HeaderFor("sts.example.com", "/a/b", true, now);
  Fuzz::Require(std::none_of(header.begin(), header.end(), [](char c) {
    return static_cast<unsigned char>(c) < 0x20 || c == 0x7F;
  }));
  Fuzz::Require(store->HeaderFor("elsewhere.example", "/a/b", true, now).empty());
  return 0;
}
