#include "service/exchange_notes.h"

#include <ctime>
#include <string>
#include <utility>

#include <time.h>

#include <tarnik/core/object_impl.h>

namespace SsoClient::Tool {
namespace {

using Tarnik::Ref;
using Tarnik::Http::ClientResponse;
using Tarnik::Http::PendingRequestItem;

// Only the form that servers must send (RFC 9110, section 5.6.7). The program uses the locale "C".
std::optional<std::time_t> ParseDate(const std::string& text) {
  std::tm fields{};
  const char* const end = strptime(text.c_str(), "%a, %d %b %Y %H:%M:%S GMT", &fields);
  return end != nullptr && *end == '\0' ? std::optional(timegm(&fields)) : std::nullopt;
}

class NotingUserAgent final : public Tarnik::Http::UserAgent, public Tarnik::ObjectImpl {
 public:
  NotingUserAgent(Tarnik::Http::UserAgent* inner, std::shared_ptr<ExchangeNotes> notes)
      : inner_(inner), notes_(std::move(notes)) {}

  Ref<PendingRequestItem> SendAsync(Tarnik::Http::ClientRequest* request, Completion completion,
                                    unsigned long timeoutMicroseconds) override {
    notes_->hasSent = true;
    return inner_->SendAsync(request, std::move(completion), timeoutMicroseconds);
  }

  Ref<ClientResponse> Wait(PendingRequestItem* item, unsigned long timeoutMicroseconds) override {
    try {
      Ref<ClientResponse> response = inner_->Wait(item, timeoutMicroseconds);
      Note(*response);
      return response;
    } catch (const Tarnik::Exception& failure) {
      notes_->failure = failure.Clone();
      throw;
    }
  }

 private:
  ~NotingUserAgent() override = default;

  void Note(const ClientResponse& response) const {
    notes_->failure = nullptr;
    notes_->httpStatus = response.Status().code;
    const auto header = response.Header("Date");
    if (const auto date = header ? ParseDate(*header) : std::nullopt) {
      notes_->clockOffsetSec = *date - std::time(nullptr);
    }
  }

  Ref<Tarnik::Http::UserAgent> inner_;
  std::shared_ptr<ExchangeNotes> notes_;
};

}  // namespace

Ref<Tarnik::Http::UserAgent> CreateNotingUserAgent(Tarnik::Http::UserAgent* inner,
                                                   std::shared_ptr<ExchangeNotes> notes) {
  return Tarnik::MakeRef<NotingUserAgent>(inner, std::move(notes));
}

}  // namespace SsoClient::Tool
