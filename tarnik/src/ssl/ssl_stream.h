#ifndef TARNIK_SSL_SSL_STREAM_H
#define TARNIK_SSL_SSL_STREAM_H

#include <string>

#include <tarnik/ssl/ssl_context.h>

#include "ssl/ssl_context_impl.h"

namespace Tarnik::Ssl {

/// A TLS stream of `context` over `stream`; `name` is a label for diagnostics.
Ref<SSLStream> CreateSSLStream(SSLContextImpl* context, System::Stream* stream,
                               const std::string& name);

}  // namespace Tarnik::Ssl

#endif
