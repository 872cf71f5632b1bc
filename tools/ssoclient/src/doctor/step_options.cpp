#include <tarnik/core/exception.h>

#include "doctor/steps.h"

namespace SsoClient::Tool::Doctor {
namespace {

constexpr int kHttpPort = 80;
constexpr int kHttpsPort = 443;

Finding FindingOfUrl(const Plan& plan, const ServiceAddress& service) {
  if (!service.isHttps && service.port == kHttpsPort) {
    return Warning(ExitStatus::kUsage, "http-with-https-port",
                   "the URL begins with http, but 443 is the port of https",
                   "write https:// in the URL");
  }
  if (service.isHttps && service.port == kHttpPort) {
    return Warning(ExitStatus::kUsage, "https-with-http-port",
                   "the URL begins with https, but 80 is the port of http",
                   "check the port of the URL");
  }
  if (!service.isHttps) {
    return Warning(ExitStatus::kUsage, "http-url",
                   "the URL begins with http: passwords and tokens are sent unencrypted",
                   "use https, unless the service runs on this machine");
  }
  return Fine(plan.peerName.empty()
                  ? "the URL is well-formed"
                  : "the URL is well-formed; the certificate must be for " + plan.peerName);
}

}  // namespace

Step ExamineOptions(Examination& examination) {
  Step step;
  ServiceAddress& service = examination.service;
  try {
    service = ParseServiceAddress(examination.plan.url);
  } catch (const Tarnik::InvalidArgumentException& malformed) {
    step.finding = Failure(ExitStatus::kUsage, "bad-url", malformed.what(),
                           "write the URL as https://HOST[:PORT]/PATH");
    return step;
  }
  step.finding = FindingOfUrl(examination.plan, service);
  step.details = {{"scheme", service.isHttps ? "https" : "http"},
                  {"host", service.host},
                  {"port", service.port},
                  {"path", service.target}};
  return step;
}

}  // namespace SsoClient::Tool::Doctor
