#include <tarnik/core/exception.h>
#include <tarnik/http/http_url.h>

#include "doctor/steps.h"

namespace SsoClient::Tool::Doctor {
namespace {

constexpr int kHttpPort = 80;
constexpr int kHttpsPort = 443;

Finding FindingOfUrl(const Plan& plan, const Target& target) {
  if (!target.isHttps && target.port == kHttpsPort) {
    return Warning(ExitStatus::kUsage, "http-with-https-port",
                   "the URL begins with http, but 443 is the port of https",
                   "write https:// in the URL");
  }
  if (target.isHttps && target.port == kHttpPort) {
    return Warning(ExitStatus::kUsage, "https-with-http-port",
                   "the URL begins with https, but 80 is the port of http",
                   "check the port of the URL");
  }
  if (!target.isHttps) {
    return Warning(ExitStatus::kUsage, "http-url",
                   "the URL begins with http: passwords and tokens are sent unencrypted",
                   "use https, except on the machine of the service");
  }
  return Fine(plan.peerName.empty()
                  ? "the URL is well-formed"
                  : "the URL is well-formed; the certificate must be for " + plan.peerName);
}

}  // namespace

Step ExamineOptions(Examination& examination) {
  Step step;
  Target& target = examination.target;
  try {
    Tarnik::Http::ParseHttpURL(examination.plan.url, target.isHttps, target.host, target.port,
                               target.path);
  } catch (const Tarnik::InvalidArgumentException& malformed) {
    step.finding = Failure(ExitStatus::kUsage, "bad-url", malformed.what(),
                           "write the URL as https://HOST[:PORT]/PATH");
    return step;
  }
  step.finding = FindingOfUrl(examination.plan, target);
  step.details = {{"scheme", target.isHttps ? "https" : "http"},
                  {"host", target.host},
                  {"port", target.port},
                  {"path", target.path}};
  return step;
}

}  // namespace SsoClient::Tool::Doctor
