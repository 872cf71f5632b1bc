// The parts of an accepted URL can be used in a request, result in the same URL when they are put
// together again, and are the parts that libxml2 finds.
#include <algorithm>
#include <memory>

#include <libxml/uri.h>
#include <strings.h>

#include <tarnik/core/exception.h>
#include <tarnik/http/http_url.h>

#include "input.h"

namespace {

struct Url {
  bool isHttps = false;
  std::string host;
  int port = 0;
  std::string path;

  bool operator==(const Url&) const = default;
};

bool Read(const std::string& text, Url& url) {
  try {
    Tarnik::Http::ParseHttpURL(text, url.isHttps, url.host, url.port, url.path);
    return true;
  } catch (const Tarnik::InvalidArgumentException&) {
    return false;
  }
}

std::string HostText(const Url& url) {
  return url.host.find(':') == std::string::npos ? url.host : "[" + url.host + "]";
}

std::string TextOf(const Url& url) {
  return (url.isHttps ? "https://" : "http://") + HostText(url) + ":" + std::to_string(url.port) +
         url.path;
}

struct FreeUri {
  void operator()(xmlURI* uri) const { xmlFreeURI(uri); }
};

std::string Text(const char* text) {
  return text == nullptr ? "" : text;
}

// A port may be empty (RFC 3986, section 3.2.3), which libxml2 does not accept.
std::string WithoutEmptyPort(std::string text) {
  const std::size_t authority = text.find("://") + 3;
  const std::size_t end = std::min(text.find_first_of("/?", authority), text.size());
  if (end > authority && text[end - 1] == ':') {
    text.erase(end - 1, 1);
  }
  return text;
}

void CompareWithLibXml2(const std::string& text, const Url& url) {
  const std::unique_ptr<xmlURI, FreeUri> theirs(xmlParseURIRaw(WithoutEmptyPort(text).c_str(), 1));
  Fuzz::Require(theirs != nullptr);
  Fuzz::Require(strcasecmp(theirs->scheme, url.isHttps ? "https" : "http") == 0);
  Fuzz::Require(Text(theirs->server) == HostText(url));
  Fuzz::Require(theirs->user == nullptr && theirs->fragment == nullptr);
  Fuzz::Require(theirs->port <= 0 || theirs->port == url.port);
  const std::string target =
      Text(theirs->path) + (theirs->query_raw == nullptr ? "" : "?") + Text(theirs->query_raw);
  Fuzz::Require(url.path == (target.empty() || target.front() != '/' ? "/" + target : target));
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string text = Fuzz::TextOf(data, size);
  Url url;
  if (!Read(text, url)) {
    Fuzz::Require(url == Url());
    return 0;
  }
  const auto isVisible = [](char c) { return c > 0x20 && c < 0x7F; };
  Fuzz::Require(!url.host.empty() && std::all_of(url.host.begin(), url.host.end(), isVisible));
  Fuzz::Require(!url.path.empty() && url.path.front() == '/' &&
                std::all_of(url.path.begin(), url.path.end(), isVisible));
  Fuzz::Require(url.port >= 1 && url.port <= 65535);
  Url again;
  Fuzz::Require(Read(TextOf(url), again) && again == url);
  CompareWithLibXml2(text, url);
  return 0;
}
