#include "doctor/tcp_findings.h"

#include <algorithm>
#include <cerrno>

#include "input/descriptor.h"
#include "output/count_text.h"

namespace SsoClient::Tool::Doctor {
namespace {

bool IsNoRoute(int error) {
  return error == ENETUNREACH || error == EADDRNOTAVAIL;
}

Finding FindingOfFailure(const Connection& first, bool isOnlyIpv6, int port) {
  const std::string where = "port " + std::to_string(port);
  if (IsNoRoute(first.error) && isOnlyIpv6) {
    return Failure(ExitStatus::kUnreachable, "only-ipv6",
                   "the host has only IPv6 addresses, and this machine has no route to them",
                   "give this machine IPv6, or the host an IPv4 address");
  }
  if (IsNoRoute(first.error)) {
    return Failure(ExitStatus::kUnreachable, "network-unreachable",
                   "this machine has no route to the host",
                   "check the network of this machine, and a VPN if one is needed");
  }
  switch (first.error) {
    case ECONNREFUSED:
      return Failure(ExitStatus::kUnreachable, "refused",
                     "the host refuses connections to " + where,
                     "check that the service runs and that the port in the URL is right");
    case ETIMEDOUT:
      return Failure(ExitStatus::kUnreachable, "tcp-timed-out",
                     "nothing answers at " + where +
                         "; a firewall may drop the packets, or the host is down or overloaded",
                     "check the firewalls between here and the service, and its port");
    case EHOSTUNREACH:
      return Failure(ExitStatus::kUnreachable, "host-unreachable",
                     "a router says that the host cannot be reached",
                     "check that the host is up, and the firewalls on the way");
    default:
      return Failure(ExitStatus::kUnreachable, "tcp-failed",
                     "no connection to " + where + ": " + SystemMessage(first.error),
                     "check the network and the limits of this machine");
  }
}

}  // namespace

Finding FindingOfConnections(const std::vector<Connection>& connections, int port) {
  const auto connected = std::count_if(connections.begin(), connections.end(),
                                       [](const Connection& each) { return each.error == 0; });
  if (connected == 0) {
    const bool isOnlyIpv6 = std::all_of(connections.begin(), connections.end(),
                                        [](const Connection& each) { return each.isIpv6; });
    // An error other than a missing route, which a machine without IPv6 always has, says more.
    const auto decisive =
        std::find_if(connections.begin(), connections.end(),
                     [](const Connection& each) { return !IsNoRoute(each.error); });
    return FindingOfFailure(decisive != connections.end() ? *decisive : connections.front(),
                            isOnlyIpv6, port);
  }
  const std::string message = "port " + std::to_string(port) + " accepts connections at " +
                              std::to_string(connected) + " of " +
                              CountText(static_cast<long>(connections.size()), "address", "es");
  const bool hasProblem =
      std::any_of(connections.begin(), connections.end(), [](const Connection& each) {
        return each.error != 0 && !(each.isIpv6 && IsNoRoute(each.error));
      });
  if (hasProblem) {
    return Warning(ExitStatus::kUnreachable, "some-addresses-fail", message,
                   "remove the other addresses from the DNS, or repair what they belong to");
  }
  return Fine(message);
}

}  // namespace SsoClient::Tool::Doctor
