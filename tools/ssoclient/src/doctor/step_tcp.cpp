#include "doctor/steps.h"
#include "doctor/tcp_findings.h"
#include "doctor/tcp_probe.h"
#include "input/descriptor.h"

namespace SsoClient::Tool::Doctor {

Step ExamineTcp(Examination& examination) {
  Step step;
  const std::vector<TcpAttempt> attempts =
      ConnectToAll(examination.addresses, examination.limit.ForStep());
  std::vector<Connection> connections;
  for (const TcpAttempt& attempt : attempts) {
    connections.push_back({attempt.error, attempt.address.IsIpv6()});
    const bool isConnected = attempt.error == 0;
    const std::string result = isConnected ? "connected" : SystemMessage(attempt.error);
    const auto milliseconds = static_cast<double>(attempt.duration.count()) / 1000;
    step.lines.push_back(attempt.address.text + ": " + result);
    step.details["connections"].push_back({{"address", attempt.address.text},
                                           {"isConnected", isConnected},
                                           {"result", result},
                                           {"durationMs", milliseconds}});
    if (isConnected && examination.reachable.size == 0) {
      examination.reachable = attempt.address;
    }
  }
  step.finding = FindingOfConnections(connections, examination.service.port);
  return step;
}

}  // namespace SsoClient::Tool::Doctor
