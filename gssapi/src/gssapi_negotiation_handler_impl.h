#ifndef SSOCLIENT_GSSAPI_GSSAPI_NEGOTIATION_HANDLER_IMPL_H
#define SSOCLIENT_GSSAPI_GSSAPI_NEGOTIATION_HANDLER_IMPL_H

#include <atomic>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include <ssoclient/gssapi_negotiation_handler.h>

#include "credentials.h"
#include "handles.h"

namespace SsoClient {

class GssapiNegotiationHandlerImpl final : public GssapiNegotiationHandler {
 public:
  /// `config` must have been checked. Throws `SsoException` if the library cannot parse the
  /// service's name.
  explicit GssapiNegotiationHandlerImpl(const GssapiNegotiationConfig& config);

  std::shared_ptr<const std::vector<unsigned char>> Negotiate(
      const std::vector<unsigned char>& serverLeg) override;
  bool IsEstablished() const override;

 private:
  enum class State { kIdle, kInProgress, kEstablished };

  void Begin();
  void CountLeg();
  void End(State state) noexcept;
  std::string Attempt() const;  // the beginning of a failure's message
  std::vector<unsigned char> NextLeg(const std::vector<unsigned char>& serverLeg);

  const std::string targetService_;
  GssName target_;
  // Declared before the credentials, which keep it open.
  std::optional<MemoryCache> ownCache_;
  CredentialSource source_;
  GssCredential credentials_;
  GssContext context_;
  State state_ = State::kIdle;
  int legs_ = 0;  // since the negotiation began
  std::atomic_flag isInUse_ = ATOMIC_FLAG_INIT;
};

}  // namespace SsoClient

#endif
