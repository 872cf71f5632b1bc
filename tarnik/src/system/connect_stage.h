#ifndef TARNIK_SYSTEM_CONNECT_STAGE_H
#define TARNIK_SYSTEM_CONNECT_STAGE_H

namespace Tarnik::System {

/// What a connect is waiting for.
enum class ConnectStage {
  kLookUp,
  kConnection,
  /// The socket is connected; what follows, such as a TLS handshake, is under way.
  kConnected,
};

/// Implemented by the sockets of this library and by the items that cancel their connects.
class ConnectProgress {
 public:
  virtual ConnectStage Stage() const noexcept = 0;
  /// The port that is connected to; 0 before the connect.
  virtual int Port() const noexcept = 0;

 protected:
  ConnectProgress() = default;
  ~ConnectProgress() = default;
};

}  // namespace Tarnik::System

#endif
