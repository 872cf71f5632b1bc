#include "doctor/http_findings.h"

#include <algorithm>
#include <cctype>
#include <string_view>

#include <tarnik/text/display_text.h>

#include "service/exchange_notes.h"

namespace SsoClient::Tool::Doctor {
namespace {

constexpr std::size_t kBeginning = 1024;
constexpr std::size_t kShownTitle = 80;

std::string LowerCase(std::string_view text) {
  std::string lower(text);
  std::transform(lower.begin(), lower.end(), lower.begin(),
                 [](unsigned char each) { return static_cast<char>(std::tolower(each)); });
  return lower;
}

std::string BeginningOf(const HttpAnswer& answer) {
  return LowerCase(std::string_view(answer.body).substr(0, kBeginning));
}

Finding Unusable(FindingName name, const std::string& message, const std::string& remedy) {
  return Failure(ExitStatus::kUnreachable, name, message, remedy);
}

std::string Title(const HttpAnswer& answer) {
  const std::string page = BeginningOf(answer);
  const std::size_t begin = page.find("<title>");
  const std::size_t end = page.find("</title>");
  if (begin == std::string::npos || end == std::string::npos || end < begin) {
    return "";
  }
  constexpr std::size_t kTag = 7;
  const std::string title = answer.body.substr(begin + kTag, end - begin - kTag);
  return " titled '" + Tarnik::ToDisplayText(title, kShownTitle) + "'";
}

Finding Page(const HttpAnswer& answer, const std::string& status) {
  return Unusable(
      "html-page",
      "the answer is a page for people" + Title(answer) + " (" + status + "), not of an STS",
      "check the path of the URL; a proxy or the login page of a network may also have "
      "answered in place of the service");
}

Finding WrongPath(const std::string& status, const std::string& path) {
  return Unusable("wrong-path", "the service has nothing at the path " + path + " (" + status + ")",
                  path == "/" ? "the URL has no path; add that of the STS"
                              : "check the path of the URL; STSs of one product differ in it by "
                                "version and tenant");
}

Finding Redirected(const HttpAnswer& answer, const std::string& status) {
  const std::string where = answer.location.empty() ? "" : " to " + answer.location;
  return Unusable("redirect",
                  "the service redirects" + where + " (" + status + "); redirects are not followed",
                  answer.location.empty() ? "use the URL of the STS itself"
                                          : "if that is the STS, use it as the URL; it may also be "
                                            "the login page of a network");
}

Finding FindingOfStatus(const HttpAnswer& answer, const std::string& status,
                        const std::string& path) {
  switch (answer.status) {
    case 401:
      return Unusable("http-unauthorized", "HTTP itself asks for a login (" + status + ")",
                      "use a URL of the STS that asks for no login by HTTP");
    case 403:
      return Unusable("http-forbidden", "access to the URL is forbidden (" + status + ")",
                      "check the path, and whether the service admits this machine");
    case 404:
    case 405:
    case 410:
      return WrongPath(status, path);
    case 407:
      return Unusable("proxy-authentication", "a proxy asks for a login (" + status + ")",
                      "let the proxy pass connections to the service");
    case 511:
      return Page(answer, status);
    default:
      break;
  }
  if (answer.status >= 500) {
    return Unusable("http-server-error", "the service fails (" + status + ")",
                    "look into the log of the service, and of a load balancer in front of it");
  }
  return Unusable("http-status", "the service answers with " + status,
                  "check the path of the URL and the log of the service");
}

}  // namespace

bool LooksLikeSoap(const HttpAnswer& answer) {
  return BeginningOf(answer).find("envelope") != std::string::npos && !IsHtml(answer);
}

bool IsHtml(const HttpAnswer& answer) {
  const std::string beginning = BeginningOf(answer);
  return LowerCase(answer.contentType).find("html") != std::string::npos ||
         beginning.find("<!doctype html") != std::string::npos ||
         beginning.find("<html") != std::string::npos;
}

Finding FindingOfHttp(const HttpAnswer& answer, const std::string& path) {
  const std::string status = "HTTP status " + std::to_string(answer.status) +
                             (answer.reason.empty() ? "" : " " + answer.reason);
  const bool isRead = IsReadStatus(answer.status);
  if (isRead && LooksLikeSoap(answer)) {
    return Fine(status + " with a SOAP envelope");
  }
  if (answer.status >= 300 && answer.status < 400) {
    return Redirected(answer, status);
  }
  if (!isRead || answer.status == 500) {
    return FindingOfStatus(answer, status, path);
  }
  if (IsHtml(answer)) {
    return Page(answer, status);
  }
  return Fine(status + (answer.contentType.empty() ? "" : " with " + answer.contentType));
}

}  // namespace SsoClient::Tool::Doctor
