#include "transport/https_session.h"

#include <utility>

#include "transport/exchange_outcome.h"

namespace SsoClient {

namespace {

using Tarnik::Http::ClientRequest;
using Tarnik::Http::ClientResponse;
using Tarnik::Http::PendingRequestItem;

constexpr unsigned long kNoLimit = 0;

ExchangeOutcome WaitForOutcome(Tarnik::Http::UserAgent& userAgent, PendingRequestItem* item,
                               unsigned long timeout) {
  Tarnik::Ref<ClientResponse> response;
  try {
    response = userAgent.Wait(item, timeout);
  } catch (const Tarnik::Exception& error) {
    return InterpretFailure(error);
  }
  return InterpretResponse(*response);
}

void Report(const TransportSession::Completion& completion, const Tarnik::Exception* error,
            const ClientResponse* response) {
  const auto outcome = error != nullptr ? InterpretFailure(*error) : InterpretResponse(*response);
  if (outcome.failure) {
    completion(&*outcome.failure, nullptr);
    return;
  }
  completion(nullptr, outcome.body.get());
}

}  // namespace

HttpsSession::HttpsSession(Tarnik::Ref<Tarnik::Http::UserAgent> userAgent, std::string path,
                           unsigned long timeout)
    : userAgent_(std::move(userAgent)), path_(std::move(path)), timeout_(timeout) {}

void HttpsSession::SendRequest(const SoapRequest& request,
                               Tarnik::Ref<Tarnik::Reader>& reader) const {
  const auto ignore = [](Tarnik::Exception*, ClientResponse*, PendingRequestItem*) {};
  const auto item = Post(request, ignore, kNoLimit);
  auto outcome = WaitForOutcome(*userAgent_, item.get(), timeout_);
  if (outcome.failure) {
    outcome.failure->Throw();
  }
  reader = std::move(outcome.body);
}

void HttpsSession::SendRequestAsync(const SoapRequest& request, const Completion& completion,
                                    Tarnik::Ref<PendingRequestItem>& handle) const {
  const auto report = [completion](Tarnik::Exception* error, ClientResponse* response,
                                   PendingRequestItem*) { Report(completion, error, response); };
  handle = Post(request, report, timeout_);
}

Tarnik::Ref<PendingRequestItem> HttpsSession::Post(const SoapRequest& request,
                                                   Tarnik::Http::UserAgent::Completion completion,
                                                   unsigned long timeout) const {
  Tarnik::Ref<ClientRequest> httpRequest;
  Tarnik::Http::CreateHttpRequest(Tarnik::Http::Method::POST, path_, httpRequest);
  httpRequest->SetHeader("Content-Type", "text/xml");
  httpRequest->SetHeader("SOAPAction", "\"" + request.action + "\"");
  httpRequest->BodyWriter()->Write(request.body);
  return userAgent_->SendAsync(httpRequest.get(), std::move(completion), timeout);
}

}  // namespace SsoClient
