#include "support/private_network.h"

#include <array>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <stdexcept>

#include <arpa/inet.h>
#include <fcntl.h>
#include <linux/rtnetlink.h>
#include <net/if.h>
#include <netinet/in.h>
#include <sched.h>
#include <signal.h>
#include <sys/ioctl.h>
#include <sys/mount.h>
#include <sys/prctl.h>
#include <sys/socket.h>
#include <sys/wait.h>
#include <unistd.h>

#include "support/temporary_file.h"

namespace SsoClient::Tool::Testing {
namespace {

using Tarnik::Testing::TemporaryFolder;

constexpr std::uint16_t kDnsPort = 53;

// What the child needs, made before it is forked: it only calls functions that are
// async-signal-safe.
struct Plan {
  explicit Plan(const PrivateNetwork& theNetwork)
      : network(theNetwork),
        userMap("0 " + std::to_string(geteuid()) + " 1"),
        groupMap("0 " + std::to_string(getegid()) + " 1") {
    Add("/etc/hosts", "hosts", network.hosts);
    Add("/etc/nsswitch.conf", "nsswitch.conf", "hosts: files dns\n");
    Add("/etc/resolv.conf", "resolv.conf", "nameserver 127.0.0.1\noptions timeout:30 attempts:1\n");
  }

  void Add(const std::string& target, const std::string& name, const std::string& content) {
    files.emplace_back(folder.Write(name, content), target);
  }

  PrivateNetwork network;
  TemporaryFolder folder;
  std::vector<std::pair<std::string, std::string>> files;  // what is shown, and where
  std::string userMap;
  std::string groupMap;
};

bool WriteFile(const char* path, const std::string& text) {
  const int file = open(path, O_WRONLY | O_CLOEXEC);
  const bool isWritten =
      file >= 0 && write(file, text.data(), text.size()) == static_cast<ssize_t>(text.size());
  close(file);
  return isWritten;
}

// Root needs no namespace of users, which some systems forbid.
bool Unshare(const Plan& plan) {
  const int spaces = CLONE_NEWNS | (plan.network.isSeparate ? CLONE_NEWNET : 0);
  if (unshare(spaces) == 0) {
    return true;
  }
  return unshare(CLONE_NEWUSER | spaces) == 0 && WriteFile("/proc/self/setgroups", "deny") &&
         WriteFile("/proc/self/uid_map", plan.userMap) &&
         WriteFile("/proc/self/gid_map", plan.groupMap);
}

bool Mount(const Plan& plan) {
  // Mounts are not passed on to the rest of the system, which cannot be had in a folder that is the
  // root (chroot) but not a mount.
  if (mount("none", "/", nullptr, MS_REC | MS_PRIVATE, nullptr) != 0) {
    errno = errno == EINVAL ? EPERM : errno;
    return false;
  }
  for (const auto& [source, target] : plan.files) {
    if (mount(source.c_str(), target.c_str(), nullptr, MS_BIND, nullptr) != 0) {
      return false;
    }
  }
  const std::string& empty = plan.network.emptyFolder;
  return empty.empty() || mount("none", empty.c_str(), "tmpfs", 0, nullptr) == 0;
}

bool StartLoopback() {
  const int control = socket(AF_INET, SOCK_DGRAM | SOCK_CLOEXEC, 0);
  ifreq request{};
  std::memcpy(request.ifr_name, "lo", sizeof "lo");
  request.ifr_flags = IFF_UP;
  const bool isUp = ioctl(control, SIOCSIFFLAGS, &request) == 0;
  close(control);
  return isUp;
}

struct RouteRequest {
  nlmsghdr header;
  rtmsg route;
};

struct RouteAnswer {
  nlmsghdr header;
  nlmsgerr error;
};

// The route of all addresses that have no other.
bool SetDefaultRoute(Route route) {
  if (route == Route::kMissing) {
    return true;
  }
  RouteRequest request{};
  request.header.nlmsg_len = sizeof request;
  request.header.nlmsg_type = RTM_NEWROUTE;
  request.header.nlmsg_flags = NLM_F_REQUEST | NLM_F_CREATE | NLM_F_ACK;
  request.route.rtm_family = AF_INET;
  request.route.rtm_table = RT_TABLE_MAIN;
  request.route.rtm_protocol = RTPROT_BOOT;
  request.route.rtm_scope = RT_SCOPE_UNIVERSE;
  request.route.rtm_type = route == Route::kUnreachable ? RTN_UNREACHABLE : RTN_PROHIBIT;
  const int control = socket(AF_NETLINK, SOCK_RAW | SOCK_CLOEXEC, NETLINK_ROUTE);
  RouteAnswer answer{};
  const bool isAnswered =
      send(control, &request, sizeof request, 0) == static_cast<ssize_t>(sizeof request) &&
      recv(control, &answer, sizeof answer, 0) >= static_cast<ssize_t>(sizeof answer) &&
      answer.header.nlmsg_type == NLMSG_ERROR;
  close(control);
  errno = isAnswered ? -answer.error.error : errno;
  return isAnswered && errno == 0;
}

unsigned char ResponseCode(NameServer server) {
  switch (server) {
    case NameServer::kNoSuchName:
      return 3;
    case NameServer::kRefusal:
      return 5;
    default:
      return 0;
  }
}

// Answers each query with itself as a response without records, until the process that asks ends.
[[noreturn]] void ServeNames(int socket, unsigned char code) {
  prctl(PR_SET_PDEATHSIG, SIGKILL);
  close_range(0, static_cast<unsigned>(socket) - 1, 0);
  close_range(static_cast<unsigned>(socket) + 1, ~0U, 0);
  for (;;) {
    constexpr unsigned char kResponse = 0x80;
    constexpr unsigned char kRecursionAvailable = 0x80;
    std::array<unsigned char, 512> message{};
    sockaddr_in client{};
    socklen_t size = sizeof client;
    auto* const address = reinterpret_cast<sockaddr*>(&client);
    const ssize_t length = recvfrom(socket, message.data(), message.size(), 0, address, &size);
    if (length < 0) {
      _exit(1);
    }
    message[2] |= kResponse;
    message[3] = kRecursionAvailable | code;
    sendto(socket, message.data(), static_cast<std::size_t>(length), 0, address, size);
  }
}

bool StartNameServer(NameServer server) {
  if (server == NameServer::kNone) {
    return true;
  }
  const int listener = socket(AF_INET, SOCK_DGRAM, 0);
  sockaddr_in address{};
  address.sin_family = AF_INET;
  address.sin_port = htons(kDnsPort);
  address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
  if (bind(listener, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0) {
    return false;
  }
  if (server == NameServer::kSilent) {
    return true;  // the program keeps the socket open without knowing it
  }
  const pid_t process = _Fork();
  if (process == 0) {
    ServeNames(listener, ResponseCode(server));
  }
  close(listener);
  return process > 0;
}

// What has failed, with errno; null if nothing has.
const char* Enter(const Plan& plan) {
  if (!Unshare(plan)) {
    return "unshare";
  }
  if (!Mount(plan)) {
    return "mount";
  }
  if (!plan.network.isSeparate) {
    return nullptr;
  }
  if (!StartLoopback()) {
    return "loopback";
  }
  if (!SetDefaultRoute(plan.network.route)) {
    return "route";
  }
  return StartNameServer(plan.network.nameServer) ? nullptr : "name server";
}

bool IsForbidden(int error) {
  return error == EPERM || error == EACCES || error == ENOSYS || error == ENOSPC;
}

}  // namespace

std::function<void()> EnterPrivateNetwork(const PrivateNetwork& network) {
  return [plan = std::make_shared<Plan>(network)] {
    if (const char* const what = Enter(*plan)) {
      const char* const reason = strerrordesc_np(errno);
      for (const char* const part : {"private network: ", what, ": ", reason, "\n"}) {
        if (write(STDERR_FILENO, part, std::strlen(part)) < 0) {
          break;
        }
      }
      _exit(1);
    }
  };
}

std::string PrivateNetworkObstacle() {
  PrivateNetwork network;
  network.route = Route::kProhibited;
  const TemporaryFolder empty;
  network.emptyFolder = empty.Path();
  const Plan plan(network);
  const pid_t process = _Fork();
  if (process == 0) {
    _exit(Enter(plan) == nullptr ? 0 : errno);
  }
  int status = 0;
  if (process < 0 || waitpid(process, &status, 0) != process || !WIFEXITED(status)) {
    throw std::runtime_error("cannot try a private network");
  }
  const int error = WEXITSTATUS(status);
  if (error != 0 && !IsForbidden(error)) {
    throw std::runtime_error(std::string("a private network fails: ") + std::strerror(error));
  }
  return error == 0 ? "" : std::string("no namespaces for this process: ") + std::strerror(error);
}

bool DoesSystemPermitPrivateNetworks() {
  const TemporaryFolder folder;
  const std::string spaces = geteuid() == 0 ? "" : " --map-root-user";
  const std::string line =
      "unshare --mount --net" + spaces + " mount -t tmpfs none '" + folder.Path() + "' 2>/dev/null";
  return std::system(line.c_str()) == 0;
}

}  // namespace SsoClient::Tool::Testing
