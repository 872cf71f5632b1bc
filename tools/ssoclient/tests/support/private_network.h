#ifndef SSOCLIENT_TOOL_TESTS_SUPPORT_PRIVATE_NETWORK_H
#define SSOCLIENT_TOOL_TESTS_SUPPORT_PRIVATE_NETWORK_H

#include <functional>
#include <string>
#include <vector>

namespace SsoClient::Tool::Testing {

/// The DNS server on 127.0.0.1 of a private network.
enum class NameServer {
  kNone,    ///< nothing listens
  kSilent,  ///< never answers
  kEmpty,   ///< answers that the name exists but has no address
  // Answers with these codes (RFC 1035, section 4.1.1).
  kNoSuchName,
  kRefusal,
};

/// How packets to all addresses but loopback are treated.
enum class Route { kMissing, kUnreachable, kProhibited };

/// What a process has that differs from the rest of the system.
struct PrivateNetwork {
  /// /etc/hosts. /etc/nsswitch.conf asks this file and then DNS.
  std::string hosts = "127.0.0.1 localhost\n";
  /// A folder that is empty; none if empty.
  std::string emptyFolder{};
  NameServer nameServer = NameServer::kNone;
  Route route = Route::kMissing;
  /// Whether there are a loopback and a name server of its own. Otherwise the network is that of
  /// the system.
  bool isSeparate = true;
};

/// Puts the process into the private network, for `ToolOptions::prepare`, until it ends. Writes the
/// reason to standard error and ends the process if that fails. Needs namespaces of Linux, of which
/// root of a container often may make none.
std::function<void()> EnterPrivateNetwork(const PrivateNetwork& network);

/// Why this system does not permit private networks; empty if it does. Throws
/// `std::runtime_error` when one fails for another reason.
std::string PrivateNetworkObstacle();

/// Whether unshare(1) and mount(8) can make one, so that an obstacle is a fault of the tests.
bool DoesSystemPermitPrivateNetworks();

}  // namespace SsoClient::Tool::Testing

#endif
