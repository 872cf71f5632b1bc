#ifndef SSOCLIENT_TOOL_DOCTOR_STEPS_H
#define SSOCLIENT_TOOL_DOCTOR_STEPS_H

#include "doctor/examination.h"
#include "doctor/report.h"

namespace SsoClient::Tool::Doctor {

// The steps of an examination, in their order. Each records in `examination` what those after it
// need. Name and duration of the result are set by the runner.

/// The URL and the options that belong together.
Step ExamineOptions(Examination& examination);
/// The files that say whom to trust: CAs, revocation lists and signing certificates.
Step ExamineTrust(Examination& examination);
/// The files of the login: certificate and key, or keytab.
Step ExamineCredentials(Examination& examination);
/// The addresses of the host.
Step ExamineDns(Examination& examination);
/// A connection to each address.
Step ExamineTcp(Examination& examination);
/// Whether the port speaks TLS, and which.
Step ExamineTls(Examination& examination);
/// The certificates of the service.
Step ExamineCertificate(Examination& examination);
/// The exchange of a request that is harmless for every account.
Step ExamineHttp(Examination& examination);
/// The difference between the clocks.
Step ExamineClock(Examination& examination);
/// Whether the answer comes from a Security Token Service.
Step ExamineSts(Examination& examination);
/// A login, by the library.
Step ExamineLogin(Examination& examination);
/// The token that the login gave.
Step ExamineToken(Examination& examination);

}  // namespace SsoClient::Tool::Doctor

#endif
