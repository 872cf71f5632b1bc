#include "attempts/exchange_observer.h"

#include <algorithm>
#include <string>
#include <string_view>
#include <utility>

#include <tarnik/core/checked_cast.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/text/string_util.h>
#include <tarnik/xml/character_nodes.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/xml_parser.h>

namespace SsoClient::Access {

namespace {

using Tarnik::Ref;
using Tarnik::Http::ClientResponse;
using Tarnik::Http::PendingRequestItem;
using Tarnik::Xml::ElementNode;

WallTime ReadWallClock() {
  return std::chrono::floor<std::chrono::milliseconds>(std::chrono::system_clock::now());
}

const ElementNode* FindFault(const ElementNode& envelope) {
  const ElementNode* body = envelope.FirstChildElement("Body");
  return body == nullptr ? nullptr : body->FirstChildElement("Fault");
}

// The local name of the fault's code; empty without one. White space around a QName does not count
// (XML Schema Part 2, section 4.3.6).
std::string_view FaultCodeOf(const ElementNode& fault) {
  constexpr std::string_view kWhiteSpace = "\t\n\r ";
  const ElementNode* code = fault.FirstChildElement("faultcode");
  const auto* text = code == nullptr ? nullptr : code->FirstChild();
  if (text == nullptr || text->Kind() != Tarnik::Xml::NodeKind::kText) {
    return {};
  }
  std::string_view name = Tarnik::CheckedCast<const Tarnik::Xml::TextNode>(text)->Text();
  name = name.substr(0, name.find_last_not_of(kWhiteSpace) + 1);
  name.remove_prefix(std::min(name.find_first_not_of(kWhiteSpace), name.size()));
  return name.substr(name.find(':') + 1);
}

SeenFault Examine(const ElementNode& envelope) {
  const ElementNode* fault = FindFault(envelope);
  if (fault == nullptr) {
    return SeenFault::kNone;
  }
  const std::string_view code = FaultCodeOf(*fault);
  if (code == "FailedAuthentication") {
    return SeenFault::kFailedAuthentication;
  }
  if (code == "InvalidSecurityToken") {
    return SeenFault::kInvalidSecurityToken;
  }
  return code == "MessageExpired" || code == "InvalidSecurity" ? SeenFault::kRefusedTimestamp
                                                               : SeenFault::kOther;
}

SeenFault Examine(Tarnik::Reader* body) {
  try {
    const auto handler = Tarnik::Xml::CreateXMLDocumentHandler();
    const auto document = Tarnik::Xml::CreateXMLParser(body, handler.get())->Parse();
    return Examine(*Tarnik::CheckedCast<Tarnik::Xml::Document>(document.get())->RootElement());
  } catch (const Tarnik::Exception&) {
    return SeenFault::kNone;  // not an XML document
  }
}

// An answer may repeat the password, and contains a token. No copy of a part remains.
std::string ReadAll(Tarnik::Reader& body) {
  constexpr std::size_t kAtOnce = 4096;
  std::string text;
  std::string buffer(kAtOnce, '\0');
  while (const std::size_t size = body.Read(buffer.data(), buffer.size())) {
    if (text.size() + size > text.capacity()) {
      std::string larger;
      larger.reserve(2 * (text.size() + size));
      larger.append(text);
      text.swap(larger);
      Tarnik::StringUtil::Cleanse(larger);
    }
    text.append(buffer, 0, size);
  }
  Tarnik::StringUtil::Cleanse(buffer);
  return text;
}

/// An answer whose body was read, and can be read again.
class ReadResponse final : public ClientResponse, public Tarnik::ObjectImpl {
 public:
  ReadResponse(Ref<ClientResponse> inner, std::string body)
      : inner_(std::move(inner)), body_(Tarnik::CreateStringReader(std::move(body))) {}

  const Tarnik::Http::StatusLine& Status() const override { return inner_->Status(); }
  std::optional<std::string> Header(const std::string& name) const override {
    return inner_->Header(name);
  }
  Ref<Tarnik::Reader> Body() const override { return body_; }

 private:
  ~ReadResponse() override = default;

  const Ref<ClientResponse> inner_;
  const Ref<Tarnik::Reader> body_;
};

class ObservingUserAgent final : public Tarnik::Http::UserAgent, public Tarnik::ObjectImpl {
 public:
  ObservingUserAgent(Tarnik::Http::UserAgent* inner, Observation& seen)
      : inner_(inner), seen_(seen) {}

  Ref<PendingRequestItem> SendAsync(Tarnik::Http::ClientRequest* request, Completion completion,
                                    unsigned long timeoutMicroseconds) override {
    seen_.hasSent = true;
    seen_.failure = nullptr;
    sent_ = ReadWallClock();
    return inner_->SendAsync(request, std::move(completion), timeoutMicroseconds);
  }

  Ref<ClientResponse> Wait(PendingRequestItem* item, unsigned long timeoutMicroseconds) override {
    try {
      Ref<ClientResponse> response = inner_->Wait(item, timeoutMicroseconds);
      Note(*response);
      return NoteFault(std::move(response));
    } catch (const Tarnik::Exception& failure) {
      seen_.failure = failure.Clone();
      throw;
    }
  }

 private:
  ~ObservingUserAgent() override = default;

  void Note(const ClientResponse& response) {
    const WallTime received = ReadWallClock();
    seen_.httpStatus = response.Status().code;
    NoteClock(response, received);
    const auto retryAfter = response.Header("Retry-After");
    const WallTime serviceNow = seen_.clock ? received + seen_.clock->offset : received;
    seen_.retryAfter =
        retryAfter ? ParseRetryAfter(*retryAfter, serviceNow) : std::chrono::milliseconds(0);
  }

  // The client reads the body after this.
  Ref<ClientResponse> NoteFault(Ref<ClientResponse> response) {
    seen_.fault = SeenFault::kNone;
    std::string body = ReadAll(*response->Body());
    if (body.find("Fault") != std::string::npos) {
      // The copy is cleansed as the original.
      seen_.fault = Examine(Tarnik::CreateStringReader(body).get());
    }
    return Tarnik::MakeRef<ReadResponse>(std::move(response), std::move(body));
  }

  void NoteClock(const ClientResponse& response, WallTime received) {
    const auto header = response.Header("Date");
    const auto date = header ? ParseHttpDate(*header, received) : std::nullopt;
    if (date) {
      seen_.clock = ClockReading{*date, received, EstimateClockOffset(*date, sent_, received)};
    }
  }

  const Ref<Tarnik::Http::UserAgent> inner_;
  Observation& seen_;
  WallTime sent_;
};

}  // namespace

bool IsRefusal(SeenFault fault) noexcept {
  return fault == SeenFault::kFailedAuthentication || fault == SeenFault::kInvalidSecurityToken;
}

bool IsReadStatus(int httpStatus) noexcept {
  return httpStatus == 500 || (httpStatus >= 200 && httpStatus <= 299);
}

Tarnik::Ref<Tarnik::Http::UserAgent> CreateObservingUserAgent(Tarnik::Http::UserAgent* inner,
                                                              Observation& seen) {
  return Tarnik::MakeRef<ObservingUserAgent>(inner, seen);
}

}  // namespace SsoClient::Access
