#ifndef TARNIK_SSL_CA_FOLDER_H
#define TARNIK_SSL_CA_FOLDER_H

#include <string>

#include "support/openssl.h"

namespace Tarnik::Ssl {

/// Makes `store` look up certificates and revocation lists in a folder whenever it needs one. Their
/// files are named after the hash of the subject or issuer and numbered from 0: "HASH.0" for a
/// certificate, "HASH.r0" for a list. OpenSSL's own look-up opens files in descriptors that child
/// processes inherit. False when OpenSSL fails.
bool AddCaFolder(X509_STORE* store, const std::string& path);

}  // namespace Tarnik::Ssl

#endif
