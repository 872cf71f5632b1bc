#ifndef SSOCLIENT_TOOL_TESTS_SUPPORT_PEER_H
#define SSOCLIENT_TOOL_TESTS_SUPPORT_PEER_H

#include <functional>
#include <string>
#include <thread>
#include <vector>

namespace SsoClient::Tool::Testing {

/// A listening socket on a free port of 127.0.0.1 that accepts nothing.
class ListeningSocket {
 public:
  explicit ListeningSocket(int backlog);
  ~ListeningSocket();
  ListeningSocket(const ListeningSocket&) = delete;
  ListeningSocket& operator=(const ListeningSocket&) = delete;

  int Number() const { return number_; }
  int Port() const;
  /// "https://127.0.0.1:PORT/sts".
  std::string Url() const;

 private:
  int number_ = -1;
};

/// A port whose packets are dropped: its queue of connections is full.
class Blackhole {
 public:
  Blackhole();
  ~Blackhole();
  Blackhole(const Blackhole&) = delete;
  Blackhole& operator=(const Blackhole&) = delete;

  std::string Url() const { return socket_.Url(); }

 private:
  ListeningSocket socket_;
  std::vector<int> clients_;
};

/// Serves connections one after the other on a thread of its own, until it is destroyed.
class Peer {
 public:
  /// `serve` does not close the descriptor and does not throw.
  using Serve = std::function<void(int descriptor)>;

  explicit Peer(Serve serve);
  ~Peer();
  Peer(const Peer&) = delete;
  Peer& operator=(const Peer&) = delete;

  std::string Url() const { return socket_.Url(); }
  /// Refuses further connections. `Serve` may call it.
  void StopListening() const;

 private:
  void Run();

  ListeningSocket socket_;
  Serve serve_;
  int stop_[2] = {-1, -1};
  std::thread thread_;
};

/// Reads once, sends `answer` and ends the connection.
Peer::Serve Answering(const std::string& answer);
/// Sends `banner` before anything is read, and then reads until the end.
Peer::Serve Greeting(const std::string& banner);
/// Reads and never answers, until the client ends the connection.
Peer::Serve Silent();
/// Runs a TLS handshake with a certificate, its key and the further certificates that are sent,
/// all PEM, and then reads until the end. `ciphers` are the suites of TLS 1.2, if not empty.
Peer::Serve TlsPeer(const std::string& certificate, const std::string& key,
                    const std::string& chain = "", const std::string& ciphers = "");

}  // namespace SsoClient::Tool::Testing

#endif
