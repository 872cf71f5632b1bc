#ifndef GUARDED_SERVER_TLS_H
#define GUARDED_SERVER_TLS_H

#include <memory>
#include <string>

#include <boost/asio/ssl/context.hpp>

#include <tarnik/crypto/certificate.h>

namespace GuardedServer {

/// TLS 1.2 and 1.3 with this certificate, which is sent with the others in its file. Clients are
/// asked for a certificate. They may have none, or any whose key is not too short: a handshake
/// proves that the client has the certificate's key, and whether that matters is decided by its
/// token.
std::shared_ptr<boost::asio::ssl::context> MakeTlsContext(const std::string& certificateFile,
                                                          const std::string& keyFile);

/// The certificate whose key the client has proved to have; null if it has not presented one.
Tarnik::Ref<const Tarnik::Crypto::Certificate> PeerCertificate(SSL* connection);

}  // namespace GuardedServer

#endif
