#ifndef DEVSTS_PROGRAM_CONTROL_SOCKET_H
#define DEVSTS_PROGRAM_CONTROL_SOCKET_H

#include <atomic>
#include <cstdint>
#include <functional>
#include <map>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include <sys/socket.h>
#include <sys/types.h>
#include <sys/un.h>

#include "commands.h"
#include "descriptor.h"

namespace DevSts::Program {

// Throws FileError if the path is too long for the address of a socket.
sockaddr_un AddressOf(const std::string& path);

// Sends the line. Ignores errors: the peer may end the connection before it has read everything.
void SendLine(int socket, const std::string& line);

// A Unix socket with which several clients at once send commands, one in a line, and receive one
// line in answer to each. Only the owner of the process can connect.
class ControlSocket {
 public:
  // Makes the socket, replacing one that no process listens at. Throws FileError.
  explicit ControlSocket(std::string path);
  // Ends all connections and removes the socket.
  ~ControlSocket();
  ControlSocket(const ControlSocket&) = delete;
  ControlSocket& operator=(const ControlSocket&) = delete;

  // Serves clients on threads of its own until `Stop`, after which it no longer uses `commands`.
  // `quit` is called after the answer to a command that ends the service, and `failed` if the
  // socket can accept no more clients; neither may throw.
  void Start(Commands& commands, std::function<void()> quit,
             std::function<void(const std::string& message)> failed);
  void Stop();

 private:
  struct Client {
    Descriptor socket;
    std::thread thread;
  };

  void Accept();
  void Take(Descriptor socket);
  void Serve(int socket);
  // Executes the complete lines and removes them from the text. Returns false after "quit".
  bool ExecuteLines(std::string& text, int socket);

  std::string path_;
  Descriptor listener_;
  dev_t device_ = 0;
  ino_t inode_ = 0;
  Commands* commands_ = nullptr;
  std::function<void()> quit_;
  std::function<void(const std::string&)> failed_;
  std::atomic<bool> acceptsNoMore_ = false;
  std::thread acceptor_;
  std::mutex mutex_;  // of the members below
  bool stopped_ = false;
  std::uint64_t lastId_ = 0;
  std::map<std::uint64_t, Client> clients_;
  std::vector<std::uint64_t> finished_;
};

}  // namespace DevSts::Program

#endif
