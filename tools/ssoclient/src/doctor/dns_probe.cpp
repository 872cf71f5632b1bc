#include "doctor/dns_probe.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstring>
#include <future>
#include <memory>
#include <thread>

#include <netdb.h>

#include "input/descriptor.h"
#include "output/count_text.h"

namespace SsoClient::Tool::Doctor {
namespace {

constexpr const char* kUnknownRemedy = "check the spelling of the host, or add it to the DNS";
constexpr const char* kNoServerRemedy =
    "check the network of this machine and the name servers in /etc/resolv.conf";

struct FreeAddresses {
  void operator()(addrinfo* list) const noexcept { freeaddrinfo(list); }
};

Address ToAddress(const addrinfo& info) {
  Address address;
  std::memcpy(&address.octets, info.ai_addr, info.ai_addrlen);
  address.size = info.ai_addrlen;
  std::array<char, NI_MAXHOST> text{};
  if (getnameinfo(info.ai_addr, info.ai_addrlen, text.data(), text.size(), nullptr, 0,
                  NI_NUMERICHOST) == 0) {
    address.text = text.data();
  }
  return address;
}

long CountIpv6(const std::vector<Address>& addresses) {
  return std::count_if(addresses.begin(), addresses.end(),
                       [](const Address& each) { return each.IsIpv6(); });
}

}  // namespace

Resolution ResolveBySystem(const std::string& host, int port) {
  addrinfo hints{};
  hints.ai_family = AF_UNSPEC;
  hints.ai_socktype = SOCK_STREAM;
  hints.ai_flags = AI_NUMERICSERV;
  addrinfo* list = nullptr;
  Resolution resolution;
  resolution.error = getaddrinfo(host.c_str(), std::to_string(port).c_str(), &hints, &list);
  const int systemError = errno;
  if (resolution.error != 0) {
    resolution.errorText = resolution.error == EAI_SYSTEM ? SystemMessage(systemError)
                                                          : gai_strerror(resolution.error);
    return resolution;
  }
  const std::unique_ptr<addrinfo, FreeAddresses> owner(list);
  for (const addrinfo* info = list; info != nullptr; info = info->ai_next) {
    const Address address = ToAddress(*info);
    const bool isNew =
        std::none_of(resolution.addresses.begin(), resolution.addresses.end(),
                     [&](const Address& known) { return known.text == address.text; });
    if (isNew) {
      resolution.addresses.push_back(address);
    }
  }
  return resolution;
}

Resolution ResolveUntil(const Resolver& resolver, const std::string& host, int port,
                        TimeLimit::Clock::time_point end) {
  // getaddrinfo cannot be interrupted, so the thread may outlive this call.
  std::packaged_task<Resolution()> task([=] { return resolver(host, port); });
  std::future<Resolution> answer = task.get_future();
  std::thread(std::move(task)).detach();
  if (answer.wait_until(end) == std::future_status::ready) {
    return answer.get();
  }
  Resolution resolution;
  resolution.isTimedOut = true;
  return resolution;
}

Finding FindingOfResolution(const std::string& host, const Resolution& resolution) {
  if (resolution.isTimedOut) {
    return Failure(ExitStatus::kUnreachable, "dns-timed-out",
                   "no name server has answered in time for '" + host + "'", kNoServerRemedy);
  }
  switch (resolution.error) {
    case 0:
      break;
    case EAI_NONAME:
#ifdef EAI_NODATA
    case EAI_NODATA:
#endif
      return Failure(ExitStatus::kUnreachable, "unknown-host",
                     "there is no host '" + host + "': " + resolution.errorText, kUnknownRemedy);
    case EAI_SYSTEM:
    case EAI_MEMORY:
      return Failure(ExitStatus::kLocal, "local-failure",
                     "the look-up of '" + host + "' has failed: " + resolution.errorText,
                     "check what this machine has left of memory and descriptors");
    default:
      return Failure(ExitStatus::kUnreachable, "no-name-server",
                     "no name server has an answer for '" + host + "': " + resolution.errorText,
                     kNoServerRemedy);
  }
  if (resolution.addresses.empty()) {
    return Failure(ExitStatus::kUnreachable, "unknown-host", "'" + host + "' has no address",
                   kUnknownRemedy);
  }
  const long ipv6 = CountIpv6(resolution.addresses);
  const long ipv4 = static_cast<long>(resolution.addresses.size()) - ipv6;
  return Fine(CountText(ipv4, "IPv4 address", "es") + " and " +
              CountText(ipv6, "IPv6 address", "es"));
}

}  // namespace SsoClient::Tool::Doctor
