// What is accepted as a URL has parts that can stand in a request.
#include <tarnik/core/exception.h>
#include <tarnik/http/http_url.h>

#include <algorithm>

#include "input.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  bool isHttps = false;
  std::string host;
  std::string path;
  int port = 0;
  try {
    Tarnik::Http::ParseHttpURL(Fuzz::TextOf(data, size), isHttps, host, port, path);
  } catch (const Tarnik::InvalidArgumentException&) {
    return 0;
  }
  const auto isVisible = [](char c) { return c > 0x20 && c < 0x7F; };
  Fuzz::Require(!host.empty() && std::all_of(host.begin(), host.end(), isVisible));
  Fuzz::Require(!path.empty() && path.front() == '/' &&
                std::all_of(path.begin(), path.end(), isVisible));
  Fuzz::Require(port >= 1 && port <= 65535);
  return 0;
}
