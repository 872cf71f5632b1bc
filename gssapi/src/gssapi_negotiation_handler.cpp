#include <atomic>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include <ssoclient/exceptions.h>
#include <ssoclient/gssapi_negotiation_handler.h>
#include <tarnik/core/exception.h>
#include <tarnik/text/string_util.h>

#include "credentials.h"
#include "errors.h"
#include "gssapi_negotiation_handler_impl.h"
#include "handles.h"

namespace SsoClient {

namespace {

using Leg = std::vector<unsigned char>;

// Integrity lets SPNEGO protect the choice of the mechanism (RFC 4178, section 5).
constexpr OM_uint32 kFlags = GSS_C_MUTUAL_FLAG | GSS_C_INTEG_FLAG;

// Kerberos takes at most three legs. A service that never ends the negotiation would block its
// caller forever.
constexpr int kMaxLegs = 100;

// Only one thread at a time may work on a negotiation.
class Use {
 public:
  explicit Use(std::atomic_flag& isInUse) : isInUse_(isInUse) {
    if (isInUse_.test_and_set(std::memory_order_acquire)) {
      throw Tarnik::InvalidStateException("The negotiation handler is in use by another thread.");
    }
  }
  Use(const Use&) = delete;
  Use& operator=(const Use&) = delete;
  ~Use() { isInUse_.clear(std::memory_order_release); }

 private:
  std::atomic_flag& isInUse_;
};

Leg BytesOf(const GssBuffer& buffer) {
  const auto* bytes = static_cast<const unsigned char*>(buffer.Get().value);
  return {bytes, bytes + buffer.Get().length};
}

// A leg authenticates its sender, so its memory is cleared when its last owner releases it.
std::shared_ptr<const Leg> HandOut(Leg leg) {
  return {new Leg(std::move(leg)), [](Leg* handedOut) {
            Tarnik::StringUtil::Cleanse(*handedOut);
            delete handedOut;
          }};
}

void Require(bool condition, const std::string& demand) {
  if (!condition) {
    throw Tarnik::InvalidArgumentException("GssapiNegotiationConfig: " + demand);
  }
}

// GSSAPI would misinterpret the form of a Kerberos principal, "service/host@REALM".
bool IsServiceAtHost(const std::string& name) {
  const auto at = name.find('@');
  return at != std::string::npos && at != 0 && at + 1 != name.size() && name.rfind('@') == at &&
         name.find('/') == std::string::npos;
}

void RequireNoNul(const std::string& text, const char* field) {
  Require(text.find('\0') == std::string::npos,
          std::string("the ") + field + " must not contain a NUL.");
}

}  // namespace

GssapiNegotiationHandlerImpl::GssapiNegotiationHandlerImpl(const GssapiNegotiationConfig& config)
    : targetService_(config.targetService),
      source_{config.principal, config.keytab, config.credentialCache} {
  ImportGssName(targetService_, GSS_C_NT_HOSTBASED_SERVICE, target_);
  if (!source_.keytab.empty() && source_.cache.empty()) {
    source_.cache = ownCache_.emplace().Name();
  }
}

std::shared_ptr<const Leg> GssapiNegotiationHandlerImpl::Negotiate(const Leg& serverLeg) {
  const Use use(isInUse_);
  if (serverLeg.empty()) {
    Begin();
  }
  if (state_ == State::kIdle) {
    throw Tarnik::InvalidStateException(
        "The negotiation handler was given a leg of the service, but no negotiation is in "
        "progress.");
  }
  try {
    CountLeg();
    // The service may send a leg even after the negotiation is complete.
    if (state_ == State::kEstablished) {
      return std::make_shared<const Leg>();
    }
    return HandOut(NextLeg(serverLeg));
  } catch (...) {
    End(State::kIdle);
    throw;
  }
}

bool GssapiNegotiationHandlerImpl::IsEstablished() const {
  return state_ == State::kEstablished;
}

void GssapiNegotiationHandlerImpl::Begin() {
  End(State::kIdle);
  AcquireCredentials(source_, credentials_);
  state_ = State::kInProgress;
  legs_ = 0;
}

void GssapiNegotiationHandlerImpl::CountLeg() {
  if (++legs_ > kMaxLegs) {
    throw SsoException(Attempt() + ": the service asks for more than " + std::to_string(kMaxLegs) +
                       " legs.");
  }
}

std::string GssapiNegotiationHandlerImpl::Attempt() const {
  return "The login at `" + targetService_ + "' failed";
}

// No messages will be protected with the context's keys, so they need not be kept.
void GssapiNegotiationHandlerImpl::End(State state) noexcept {
  context_.Reset();
  credentials_.Reset();
  state_ = state;
}

Leg GssapiNegotiationHandlerImpl::NextLeg(const Leg& serverLeg) {
  const std::string attempt = Attempt();
  gss_buffer_desc input{serverLeg.size(), const_cast<unsigned char*>(serverLeg.data())};
  GssBuffer output;
  OM_uint32 granted = 0;
  GssStatus status;
  status.major = gss_init_sec_context(
      &status.minor, credentials_.Get(), context_.Address(), target_.Get(), SpnegoMechanism(),
      kFlags, 0, GSS_C_NO_CHANNEL_BINDINGS, serverLeg.empty() ? GSS_C_NO_BUFFER : &input, nullptr,
      output.Address(), &granted, nullptr);
  CheckGssStatus(attempt, status);
  if ((status.major & GSS_S_CONTINUE_NEEDED) != 0) {
    // Otherwise both sides would wait for each other.
    if (output.Get().length == 0) {
      throw SsoException(attempt + ": it is not complete, but there is nothing to send.");
    }
    return BytesOf(output);
  }
  if ((granted & GSS_C_MUTUAL_FLAG) == 0) {
    throw SsoException(attempt + ": the service has not proved its identity.");
  }
  Leg leg = BytesOf(output);
  End(State::kEstablished);
  return leg;
}

std::shared_ptr<GssapiNegotiationHandler> CreateGssapiNegotiationHandler(
    const GssapiNegotiationConfig& config) {
  Require(!config.targetService.empty(), "the target service must not be empty.");
  RequireNoNul(config.targetService, "target service");
  RequireNoNul(config.principal, "principal");
  RequireNoNul(config.keytab, "keytab");
  RequireNoNul(config.credentialCache, "credential cache");
  Require(IsServiceAtHost(config.targetService),
          "the target service `" + config.targetService + "' is not of the form service@host.");
  return std::make_shared<GssapiNegotiationHandlerImpl>(config);
}

}  // namespace SsoClient
