#include <algorithm>
#include <array>

#include <tarnik/core/exception.h>

#include "http/field_syntax.h"
#include "http/http_request_impl.h"
#include "support/ascii.h"

namespace Tarnik::Http {

class RequestBody final : public Writer, public ObjectImpl {
 public:
  void Write(std::string_view text) override { text_.Append(text); }
  SensitiveText& Text() noexcept { return text_; }

 private:
  ~RequestBody() override = default;

  SensitiveText text_;
};

namespace {

bool IsOwnedByAgent(std::string_view name) {
  constexpr std::array<std::string_view, 5> kOwned = {"Host", "Content-Length", "Transfer-Encoding",
                                                      "Connection", "Cookie"};
  return std::any_of(kOwned.begin(), kOwned.end(),
                     [&](std::string_view owned) { return EqualsIgnoringCase(owned, name); });
}

void AppendField(SensitiveText& wire, std::string_view name, std::string_view value) {
  wire.Append(name);
  wire.Append(": ");
  wire.Append(value);
  wire.Append("\r\n");
}

bool IsTargetCharacter(char c) {
  return IsAscii(c) && !IsControl(c) && c != ' ';
}

}  // namespace

ClientRequestImpl::ClientRequestImpl(Method method, std::string target)
    : method_(method), target_(std::move(target)), body_(MakeRef<RequestBody>()) {}

ClientRequestImpl::~ClientRequestImpl() = default;

void ClientRequestImpl::SetHeader(const std::string& name, const std::string& value) {
  if (!IsToken(name)) {
    throw InvalidArgumentException("The name of an HTTP header is not a token.");
  }
  if (IsOwnedByAgent(name)) {
    throw InvalidArgumentException("The HTTP header " + name + " is set only by the user agent.");
  }
  if (std::any_of(value.begin(), value.end(), IsControl)) {
    throw InvalidArgumentException("The value of the HTTP header " + name +
                                   " holds a control character.");
  }
  const auto old = std::find_if(headers_.begin(), headers_.end(), [&](const auto& header) {
    return EqualsIgnoringCase(header.first, name);
  });
  if (old != headers_.end()) {
    *old = {name, value};
    return;
  }
  headers_.emplace_back(name, value);
}

Ref<Writer> ClientRequestImpl::BodyWriter() {
  return body_;
}

void ClientRequestImpl::MarkSent() {
  if (isSent_.exchange(true)) {
    throw InvalidStateException("The HTTP request has been sent before.");
  }
}

void ClientRequestImpl::MoveTo(const RequestRoute& route, SensitiveText& wire) {
  constexpr std::size_t kTypicalHeadBytes = 512;
  SensitiveText& body = body_->Text();
  wire.Reserve(kTypicalHeadBytes + body.Size());
  wire.Append(method_ == Method::POST ? "POST " : "GET ");
  wire.Append(target_.front() == '/' ? route.targetPrefix : std::string());
  wire.Append(target_);
  wire.Append(" HTTP/1.1\r\n");
  AppendField(wire, "Host", route.hostField);
  // RFC 9110, section 8.6: a method that defines a meaning for content sends its length, even zero.
  if (method_ == Method::POST || body.Size() != 0) {
    AppendField(wire, "Content-Length", std::to_string(body.Size()));
  }
  if (!route.cookies.empty()) {
    AppendField(wire, "Cookie", route.cookies);
  }
  for (const auto& [name, value] : headers_) {
    AppendField(wire, name, value);
  }
  wire.Append("\r\n");
  wire.Append(body.Text());
  body.Clear();
}

void CreateHttpRequest(Method method, const std::string& target, Ref<ClientRequest>& request) {
  if (target.empty()) {
    throw InvalidArgumentException("The HTTP request target is empty.");
  }
  if (!std::all_of(target.begin(), target.end(), IsTargetCharacter)) {
    throw InvalidArgumentException(
        "The HTTP request target holds a blank, a control character or a character outside ASCII.");
  }
  request = MakeRef<ClientRequestImpl>(method, target);
}

}  // namespace Tarnik::Http
