#include "control_socket.h"

#include <array>
#include <cerrno>
#include <cstring>
#include <system_error>
#include <utility>

#include <sys/stat.h>
#include <unistd.h>

#include "errors.h"
#include "wire/accept.h"

namespace DevSts::Program {
namespace {

constexpr std::size_t kMaxClients = 64;
constexpr std::size_t kMaxLine = 65536;

Descriptor NewSocket() {
  return Descriptor(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0));
}

bool Connects(const std::string& path) {
  const Descriptor probe = NewSocket();
  const sockaddr_un address = AddressOf(path);
  return connect(probe.Get(), reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0;
}

// Removes the socket of a process that no longer exists.
void RemoveStale(const std::string& path) {
  struct stat found {};
  if (lstat(path.c_str(), &found) != 0) {
    return;
  }
  if (!S_ISSOCK(found.st_mode)) {
    throw FileError(path + ": there is a file that is not a socket");
  }
  if (Connects(path)) {
    throw FileError(path + ": another process listens at this socket");
  }
  unlink(path.c_str());
}

Descriptor ListenAt(const std::string& path) {
  const sockaddr_un address = AddressOf(path);
  Descriptor listener = NewSocket();
  // From the beginning, only the owner can connect. No other thread creates files yet.
  const mode_t before = umask(S_IRWXG | S_IRWXO | S_IXUSR);
  const bool done =
      bind(listener.Get(), reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0;
  const int error = errno;
  umask(before);
  if (!done || listen(listener.Get(), SOMAXCONN) != 0) {
    throw FileError(path + ": cannot listen: " + std::strerror(done ? errno : error));
  }
  return listener;
}

}  // namespace

sockaddr_un AddressOf(const std::string& path) {
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  if (path.empty() || path.size() >= sizeof address.sun_path) {
    throw FileError(path + ": the path of a socket has from 1 to " +
                    std::to_string(sizeof address.sun_path - 1) + " octets");
  }
  path.copy(address.sun_path, path.size());
  return address;
}

void SendLine(int socket, const std::string& line) {
  const std::string text = line + "\n";
  for (std::size_t at = 0; at < text.size();) {
    const ssize_t size = send(socket, text.data() + at, text.size() - at, MSG_NOSIGNAL);
    if (size <= 0) {
      return;
    }
    at += static_cast<std::size_t>(size);
  }
}

ControlSocket::ControlSocket(std::string path) : path_(std::move(path)) {
  RemoveStale(path_);
  listener_ = ListenAt(path_);
  struct stat made {};
  if (lstat(path_.c_str(), &made) == 0) {
    device_ = made.st_dev;
    inode_ = made.st_ino;
  }
}

ControlSocket::~ControlSocket() {
  Stop();
  struct stat found {};
  if (lstat(path_.c_str(), &found) == 0 && found.st_dev == device_ && found.st_ino == inode_) {
    unlink(path_.c_str());
  }
}

void ControlSocket::Start(Commands& commands, std::function<void()> quit,
                          std::function<void(const std::string& message)> failed) {
  commands_ = &commands;
  quit_ = std::move(quit);
  failed_ = std::move(failed);
  acceptor_ = std::thread([this] { Accept(); });
}

void ControlSocket::Stop() {
  if (!acceptor_.joinable()) {
    return;
  }
  commands_->Stop();
  acceptsNoMore_ = true;
  shutdown(listener_.Get(), SHUT_RDWR);  // ends accept() in the thread
  acceptor_.join();
  std::map<std::uint64_t, Client> clients;
  {
    const std::lock_guard lock(mutex_);
    stopped_ = true;
    for (const auto& [id, client] : clients_) {
      shutdown(client.socket.Get(), SHUT_RDWR);
    }
    clients.swap(clients_);
  }
  for (auto& [id, client] : clients) {
    client.thread.join();
  }
}

void ControlSocket::Accept() {
  const int error = AcceptUntilStopped(listener_.Get(), acceptsNoMore_,
                                       [this](int accepted) { Take(Descriptor(accepted)); });
  if (error != 0) {
    failed_(path_ + ": accepts no more connections: " + std::strerror(error));
  }
}

void ControlSocket::Take(Descriptor socket) {
  const std::lock_guard lock(mutex_);
  for (const std::uint64_t id : std::exchange(finished_, {})) {
    clients_.at(id).thread.join();
    clients_.erase(id);
  }
  if (clients_.size() >= kMaxClients) {
    SendLine(socket.Get(), "error there are too many clients");
    return;
  }
  const std::uint64_t id = ++lastId_;
  const int number = socket.Get();
  try {
    // The thread uses the map only after this lock is released.
    std::thread thread([this, id, number] {
      Serve(number);
      const std::lock_guard ended(mutex_);
      shutdown(number, SHUT_RDWR);
      if (!stopped_) {
        finished_.push_back(id);
      }
    });
    clients_.emplace(id, Client{std::move(socket), std::move(thread)});
  } catch (const std::system_error&) {
    SendLine(number, "error there are too many threads");
  }
}

void ControlSocket::Serve(int socket) {
  std::array<char, 4096> octets{};
  std::string text;
  for (;;) {
    const ssize_t size = recv(socket, octets.data(), octets.size(), 0);
    if (size < 0 && errno == EINTR) {
      continue;
    }
    if (size <= 0) {
      return;
    }
    text.append(octets.data(), static_cast<std::size_t>(size));
    if (!ExecuteLines(text, socket)) {
      quit_();
      return;
    }
    if (text.size() > kMaxLine) {
      SendLine(socket, "error the line is too long");
      return;
    }
  }
}

bool ControlSocket::ExecuteLines(std::string& text, int socket) {
  for (std::size_t end = text.find('\n'); end != std::string::npos; end = text.find('\n')) {
    const Commands::Answer answer = commands_->Execute(text.substr(0, end));
    text.erase(0, end + 1);
    SendLine(socket, answer.line);
    if (answer.quits) {
      return false;
    }
  }
  return true;
}

}  // namespace DevSts::Program
