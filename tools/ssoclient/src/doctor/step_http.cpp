#include <chrono>

#include <tarnik/http/http_exception.h>
#include <tarnik/http/http_request.h>
#include <tarnik/http/http_user_agent.h>
#include <tarnik/ssl/ssl_exception.h>
#include <tarnik/system/date_time.h>
#include <tarnik/text/display_text.h>

#include "doctor/harmless_request.h"
#include "doctor/http_findings.h"
#include "doctor/library_connection.h"
#include "doctor/steps.h"

namespace SsoClient::Tool::Doctor {
namespace {

constexpr std::size_t kShownField = 300;

std::string Field(const Tarnik::Http::ClientResponse& response, const char* name) {
  return Tarnik::ToDisplayText(response.Header(name).value_or(""), kShownField);
}

std::string BodyOf(const Tarnik::Http::ClientResponse& response) {
  std::string body;
  char part[4096];
  const auto reader = response.Body();
  while (const std::size_t size = reader->Read(part, sizeof part)) {
    body.append(part, size);
  }
  return body;
}

HttpAnswer Exchange(const Examination& examination, TimeLimit::Clock::time_point end) {
  const auto spec = MakeConnectionSpec(examination);
  const auto agent = Tarnik::Http::CreateHttpUserAgent(spec.get(), nullptr, nullptr);
  Tarnik::Ref<Tarnik::Http::ClientRequest> request;
  Tarnik::Http::CreateHttpRequest(Tarnik::Http::Method::POST, examination.service.target, request);
  request->SetHeader("Content-Type", "text/xml");
  request->SetHeader("SOAPAction", std::string("\"") + kHarmlessAction + "\"");
  const auto sent = Tarnik::System::GetUtcDateTime();
  request->BodyWriter()->Write(HarmlessRequest(sent));

  constexpr unsigned long kMicrosecondsOfMillisecond = 1000;
  const auto limit =
      static_cast<unsigned long>(MillisecondsUntil(end)) * kMicrosecondsOfMillisecond;
  const auto item = agent->SendAsync(
      request.get(), [](Tarnik::Exception*, auto*, auto*) {}, limit + 1);
  const auto response = agent->Wait(item.get(), 0);
  HttpAnswer answer;
  answer.sentAt = sent.GetUtcTime();
  answer.receivedAt = Tarnik::System::GetUtcDateTime().GetUtcTime();
  answer.status = response->Status().code;
  answer.reason = Tarnik::ToDisplayText(response->Status().reason, kShownField);
  answer.contentType = Field(*response, "Content-Type");
  answer.location = Field(*response, "Location");
  answer.server = Field(*response, "Server");
  answer.date = response->Header("Date");
  answer.body = BodyOf(*response);
  return answer;
}

Finding Unanswered(FindingName name, const std::string& message, const char* remedy) {
  return Failure(ExitStatus::kUnreachable, name, message, remedy);
}

Finding CertificateRequired(const std::string& message) {
  return Unanswered("client-certificate-required",
                    "the service requires a TLS certificate of the client: " + message,
                    "use a port of the service that requires none");
}

Finding FindingOfTlsFailure(const Examination& examination, const std::string& message) {
  if (examination.tls.asksForCertificate) {
    return CertificateRequired(message);
  }
  return Unanswered("tls-broken", "TLS failed during the exchange: " + message,
                    "look into the log of the service; try again");
}

// Whether the service speaks TLS although the URL begins with http.
bool SpeaksTls(const Examination& examination) {
  return !examination.service.isHttps && TryTls(examination.reachable, examination.ExpectedName(),
                                                TlsOffer::kLibrary, examination.limit.ForStep())
                                             .isDone;
}

Finding FindingOfFailure(const Examination& examination, const Tarnik::Exception& failure) {
  const std::string message = failure.what();
  if (SpeaksTls(examination)) {
    return Unanswered("https-on-http-port",
                      "the port speaks TLS, but the URL begins with http: " + message,
                      "write https:// in the URL");
  }
  if (dynamic_cast<const Tarnik::TimeoutException*>(&failure) != nullptr) {
    return Unanswered("http-timed-out", "no answer in time: " + message,
                      "check whether the service hangs or is overloaded, or allow more time with "
                      "--timeout");
  }
  if (dynamic_cast<const Tarnik::Http::CutOffException*>(&failure) != nullptr) {
    return Unanswered("http-cut-off", "the connection ended before the answer: " + message,
                      "look into the log of the service, and of a load balancer in front of it");
  }
  if (dynamic_cast<const Tarnik::Http::HttpException*>(&failure) != nullptr) {
    return Unanswered("not-http", "the answer is not HTTP, or violates it: " + message,
                      "check the port of the URL: another service may answer there");
  }
  if (dynamic_cast<const Tarnik::Ssl::SSLException*>(&failure) != nullptr) {
    return FindingOfTlsFailure(examination, message);
  }
  // TLS 1.3 refuses a client after the handshake, and the alert may be lost with the connection.
  if (examination.tls.asksForCertificate) {
    return CertificateRequired(message);
  }
  return Unanswered("http-failed", "the exchange failed: " + message,
                    "look into the log of the service; try again");
}

}  // namespace

Step ExamineHttp(Examination& examination) {
  Step step;
  try {
    examination.answer = Exchange(examination, examination.limit.ForStep());
  } catch (const Tarnik::IOException& failure) {
    step.finding = FindingOfFailure(examination, failure);
    return step;
  }
  const HttpAnswer& answer = *examination.answer;
  step.finding = FindingOfHttp(answer, examination.service.target);
  step.details = {{"httpStatus", answer.status}, {"path", examination.service.target}};
  const std::pair<const char*, const std::string*> fields[] = {{"contentType", &answer.contentType},
                                                               {"location", &answer.location},
                                                               {"server", &answer.server}};
  for (const auto& [name, value] : fields) {
    if (!value->empty()) {
      step.details[name] = *value;
    }
  }
  if (!answer.server.empty()) {
    step.lines.push_back("Server: " + answer.server);
  }
  return step;
}

}  // namespace SsoClient::Tool::Doctor
