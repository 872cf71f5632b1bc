#ifndef SSOCLIENT_GSSAPI_TESTS_LOOPBACK_LISTENER_H
#define SSOCLIENT_GSSAPI_TESTS_LOOPBACK_LISTENER_H

namespace SsoClient::Testing {

/// A TCP socket that listens at a free port of 127.0.0.1. Connections to it come about without
/// anybody who accepts them.
class LoopbackListener {
 public:
  LoopbackListener();
  LoopbackListener(const LoopbackListener&) = delete;
  LoopbackListener& operator=(const LoopbackListener&) = delete;
  ~LoopbackListener();

  int Handle() const { return socket_; }
  unsigned short Port() const;

 private:
  int socket_;
};

}  // namespace SsoClient::Testing

#endif
