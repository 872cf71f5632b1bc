#ifndef SSOCLIENT_STS_HOLDER_OF_KEY_CHECK_H
#define SSOCLIENT_STS_HOLDER_OF_KEY_CHECK_H

#include <boost/optional.hpp>

#include <ssoclient/holder_of_key_config.h>
#include <tarnik/system/date_time.h>

namespace SsoClient {

/// Validates what a service is to sign with, so that a mistake is found before the security token
/// service rejects a request. Throws `Tarnik::InvalidArgumentException` when a part is null, the
/// certificate's key cannot be read, the private key does not belong to the certificate, or it
/// cannot sign RSA-SHA256. Accepts an absent configuration.
void CheckHolderOfKeyConfig(const boost::optional<HolderOfKeyConfig>& config);

/// Throws `Tarnik::InvalidStateException` when `certificate` is not valid at `now`, within the
/// default clock tolerance.
void CheckPeriodOfValidity(const Tarnik::Crypto::Certificate& certificate,
                           const Tarnik::System::DateTime& now);

}  // namespace SsoClient

#endif
