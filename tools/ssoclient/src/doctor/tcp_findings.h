#ifndef SSOCLIENT_TOOL_DOCTOR_TCP_FINDINGS_H
#define SSOCLIENT_TOOL_DOCTOR_TCP_FINDINGS_H

#include <vector>

#include "doctor/report.h"

namespace SsoClient::Tool::Doctor {

/// How the connection to an address went.
struct Connection {
  int error = 0;  ///< of `connect`; 0 when it is connected
  bool isIpv6 = false;
};

/// What the connections to all addresses, at least one, mean.
Finding FindingOfConnections(const std::vector<Connection>& connections, int port);

}  // namespace SsoClient::Tool::Doctor

#endif
