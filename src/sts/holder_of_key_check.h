#ifndef SSOCLIENT_STS_HOLDER_OF_KEY_CHECK_H
#define SSOCLIENT_STS_HOLDER_OF_KEY_CHECK_H

#include <boost/optional.hpp>

#include <ssoclient/holder_of_key_config.h>
#include <tarnik/system/date_time.h>

namespace SsoClient {

/// Judges what a service is given to sign with, so that a mistake is not found out by the first
/// request that the security token service refuses. Throws `Tarnik::InvalidArgumentException` when
/// a part is null, the certificate's key cannot be read, the private key is not that key's, or it
/// cannot sign RSA-SHA256; nothing without a configuration.
void CheckHolderOfKeyConfig(const boost::optional<HolderOfKeyConfig>& config);

/// Throws `Tarnik::InvalidStateException` when `certificate` is not valid at `now`, with a
/// tolerance of 600 seconds for clocks that differ.
void CheckPeriodOfValidity(const Tarnik::Crypto::Certificate& certificate,
                           const Tarnik::System::DateTime& now);

}  // namespace SsoClient

#endif
