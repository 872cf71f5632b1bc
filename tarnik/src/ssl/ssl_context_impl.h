#ifndef TARNIK_SSL_SSL_CONTEXT_IMPL_H
#define TARNIK_SSL_SSL_CONTEXT_IMPL_H

#include <string>

#include <tarnik/core/object_impl.h>
#include <tarnik/ssl/ssl_context.h>

#include "ssl/peer_check.h"
#include "ssl/session_cache.h"
#include "support/openssl.h"

namespace Tarnik::Ssl {

/// The only implementation of `SSLContext`.
class SSLContextImpl final : public SSLContext, public ObjectImpl {
 public:
  explicit SSLContextImpl(const SSLContextConfig& config);

  Ref<SSLStream> WrapStream(System::Stream* stream, const std::string& name) override;
  std::string ToString() const override { return "<SSLContext>"; }

  SSL_CTX* Get() const noexcept { return context_.get(); }
  const PinnedCertificates& Pinned() const noexcept { return pinned_; }
  SessionCache& Sessions() noexcept { return sessions_; }

 private:
  const OpenSsl::OwnedSslContext context_;
  const PinnedCertificates pinned_;
  SessionCache sessions_;
};

}  // namespace Tarnik::Ssl

#endif
