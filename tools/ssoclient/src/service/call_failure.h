#ifndef SSOCLIENT_TOOL_SERVICE_CALL_FAILURE_H
#define SSOCLIENT_TOOL_SERVICE_CALL_FAILURE_H

#include <string>
#include <string_view>

#include <tarnik/core/exception.h>

#include "failure.h"
#include "service/exchange_notes.h"

namespace SsoClient::Tool {

/// The failure that an exception of an operation of the client means, with the exact kind. If the
/// service's text contains `secret`, it is left out; `secret` may be empty for none.
/// `remedyOfRefusal` is the remedy when the service has refused the request, or empty for that of
/// its kind; but if the clocks differ by more than `kLargeClockOffsetSec`, the remedy says so.
Failure FailureOfCall(const Tarnik::Exception& exception, const ExchangeNotes& notes,
                      std::string_view secret, const std::string& remedyOfRefusal);

}  // namespace SsoClient::Tool

#endif
