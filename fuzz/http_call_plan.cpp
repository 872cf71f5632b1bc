#include "http_call_plan.h"

#include <algorithm>
#include <map>
#include <new>
#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/ssl/ssl_context.h>

namespace Fuzz {
namespace {

using Tarnik::Ref;
using Tarnik::System::ConnectStage;

/// What cancels a connect, and says what it waits for.
class StagedItem final : public Tarnik::System::CancellableItem,
                         public Tarnik::System::ConnectProgress,
                         public Tarnik::ObjectImpl {
 public:
  StagedItem(Ref<Tarnik::System::CancellableItem> connect, ConnectStage stage)
      : connect_(std::move(connect)), stage_(stage) {}

  bool Cancel() override { return connect_->Cancel(); }
  ConnectStage Stage() const noexcept override { return stage_; }
  int Port() const noexcept override { return 443; }

 private:
  const Ref<Tarnik::System::CancellableItem> connect_;
  const ConnectStage stage_;
};

// At most `most`, and `least` for another text than a number.
unsigned long NumberOf(const std::string& text, unsigned long least, unsigned long most) {
  constexpr std::size_t kMaxDigits = 9;
  const bool isNumber = !text.empty() && text.size() <= kMaxDigits &&
                        text.find_first_not_of("0123456789") == std::string::npos;
  return isNumber ? std::clamp(std::stoul(text), least, most) : least;
}

}  // namespace

HttpCallPlan::HttpCallPlan(std::string_view input) {
  const std::size_t end = std::min(input.find("\n\n"), input.size());
  answer = input.substr(std::min(end + 2, input.size()));
  for (const Words& line : LinesOfWords(input.substr(0, end))) {
    Take(line);
  }
}

void HttpCallPlan::Take(const Words& line) {
  static const std::map<std::string, ConnectStage> stages = {
      {"look-up", ConnectStage::kLookUp},
      {"connection", ConnectStage::kConnection},
      {"handshake", ConnectStage::kConnected}};
  static const std::map<std::string, std::string HttpCallPlan::*> texts = {
      {"scenario", &HttpCallPlan::scenario}, {"host", &HttpCallPlan::host},
      {"port", &HttpCallPlan::port},         {"target", &HttpCallPlan::target},
      {"holds", &HttpCallPlan::held},        {"cookies", &HttpCallPlan::cookies}};
  const std::string& kind = line.front();
  const std::string value = line.size() > 1 ? line[1] : "";
  if (const auto text = texts.find(kind); text != texts.end()) {
    this->*text->second = value;
  } else if (kind == "tls") {
    isTls = true;
  } else if (kind == "proxy") {
    isProxy = true;
  } else if (kind == "bounded") {
    isBounded = true;
  } else if (kind == "body") {
    bodySize = NumberOf(value, 0, 100'000);
  } else if (kind == "pieces") {
    pieceSize = NumberOf(value, 1, 100'000);
  } else if (kind == "count") {
    count = NumberOf(value, 1, 12);
  } else if (kind == "endpoints") {
    endpoints = NumberOf(value, 1, 10);
  } else if (kind == "limit") {
    limit = NumberOf(value, 1, 3000);
  } else if (kind == "stage" && stages.count(value) != 0) {
    stage = stages.at(value);
  } else if (kind == "fault") {
    fault = StreamFaultOf(line);
  }
}

Tarnik::Testing::ScriptedSpec::Script HttpCallPlan::Script() const {
  Tarnik::Testing::ScriptedSpec::Script script;
  script.host = host;
  script.cookieHost = "cookies.example";
  script.endpointKey = EndpointKey();
  script.isProxy = isProxy;
  script.isTls = isTls;
  script.stream.pieceSize = pieceSize;
  script.stream.holdWrites = held == "write";
  script.holdConnects = held == "connect";
  return script;
}

// RFC 9110, section 7.2, and RFC 3986, section 3.2.2.
std::string HttpCallPlan::HostField() const {
  const std::string name = host.find(':') == std::string::npos ? host : "[" + host + "]";
  const std::string last = EndpointKey().substr(EndpointKey().rfind(':') + 1);
  const bool isNumber = !last.empty() && last.find_first_not_of("0123456789") == std::string::npos;
  return isNumber && last != (isTls ? "443" : "80") ? name + ":" + last : name;
}

Ref<Tarnik::System::CancellableItem> FaultySpec::StartConnect(ConnectCompletion completion) {
  const auto wrap = [self = Ref<FaultySpec>(this), completion = std::move(completion)](
                        Tarnik::System::Stream* stream, Tarnik::Exception* error) {
    const bool isTls = dynamic_cast<Tarnik::Ssl::SSLStream*>(stream) != nullptr;
    if (error != nullptr || stream == nullptr || isTls) {
      completion(stream, error);
      return;
    }
    self->last_ = Tarnik::MakeRef<FaultyStream>(stream, self->fault_, "");
    completion(self->last_.get(), nullptr);
  };
  return Tarnik::MakeRef<StagedItem>(scripted_->StartConnect(wrap), stage_);
}

void FaultyCookies::Fail() {
  hasFailed_ = true;
  if (kind_ == "fail-memory") {
    throw std::bad_alloc();
  }
  throw Tarnik::IOException("a broken store");
}

void FaultyCookies::Store(std::string_view /*host*/, std::string_view /*path*/, bool /*isSecure*/,
                          std::string_view /*setCookie*/, const Tarnik::System::DateTime& /*now*/) {
  if (kind_ == "fail" || kind_ == "fail-memory") {
    Fail();
  }
}

std::string FaultyCookies::HeaderFor(std::string_view host, std::string_view path,
                                     bool /*isSecure*/, const Tarnik::System::DateTime& /*now*/) {
  requestedFor_.assign(host).append(path);
  if (kind_ == "refuse") {
    Fail();
  }
  if (hook_) {
    std::exchange(hook_, nullptr)();
  }
  return "a=b";
}

}  // namespace Fuzz
