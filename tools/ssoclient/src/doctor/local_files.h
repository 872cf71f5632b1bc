#ifndef SSOCLIENT_TOOL_DOCTOR_LOCAL_FILES_H
#define SSOCLIENT_TOOL_DOCTOR_LOCAL_FILES_H

#include <optional>
#include <string>

#include <tarnik/crypto/certificate.h>
#include <tarnik/system/date_time.h>

#include "doctor/report.h"

namespace SsoClient::Tool::Doctor {

/// Why the file cannot be read: missing, not permitted or not a file; nothing if it can.
std::optional<Finding> FileProblem(const std::string& path);
/// Whether the certificate is valid at `now`, or expires within 30 days; `what` begins the message.
/// `soonRemedy` is what to do before it expires.
std::optional<Finding> ValidityProblem(const std::string& what,
                                       const Tarnik::Crypto::Certificate& certificate,
                                       const Tarnik::System::DateTime& now,
                                       const std::string& soonRemedy);

/// How long a certificate must still be valid not to need attention.
inline constexpr long kSoonDays = 30;
/// The days from `now` to `then`, rounded down.
long DaysUntil(const Tarnik::System::DateTime& then, const Tarnik::System::DateTime& now);

}  // namespace SsoClient::Tool::Doctor

#endif
