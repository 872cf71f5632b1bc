#include "service/exchange_notes.h"

#include <ctime>
#include <utility>

#include <tarnik/core/object_impl.h>

#include "service/http_date.h"

namespace SsoClient::Tool {
namespace {

using Tarnik::Ref;
using Tarnik::Http::ClientResponse;
using Tarnik::Http::PendingRequestItem;

class NotingUserAgent final : public Tarnik::Http::UserAgent, public Tarnik::ObjectImpl {
 public:
  NotingUserAgent(Tarnik::Http::UserAgent* inner, std::shared_ptr<ExchangeNotes> notes)
      : inner_(inner), notes_(std::move(notes)) {}

  Ref<PendingRequestItem> SendAsync(Tarnik::Http::ClientRequest* request, Completion completion,
                                    unsigned long timeoutMicroseconds) override {
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
    if (const auto date = header ? ParseHttpDate(*header) : std::nullopt) {
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
