#include <tarnik/core/object_impl.h>
#include <tarnik/core/ref.h>
#include <tarnik/system/cancellable_item.h>
#include <tarnik/system/tcp_client_socket.h>

#include "system/connect_stage.h"

namespace Tarnik::System {
namespace {

class ConnectItem final : public CancellableItem, public ConnectProgress, public ObjectImpl {
 public:
  explicit ConnectItem(TCPClientSocket* socket)
      : socket_(socket), progress_(dynamic_cast<const ConnectProgress*>(socket)) {}

  bool Cancel() override {
    socket_->Close();
    return true;
  }
  ConnectStage Stage() const noexcept override {
    return progress_ == nullptr ? ConnectStage::kConnection : progress_->Stage();
  }
  int Port() const noexcept override { return progress_ == nullptr ? 0 : progress_->Port(); }
  std::string ToString() const override { return "<CancellableItem>"; }

 private:
  const Ref<TCPClientSocket> socket_;
  /// Null for a socket of another library.
  const ConnectProgress* const progress_;
};

}  // namespace

Ref<CancellableItem> CreateConnectItem(TCPClientSocket* socket) {
  if (socket == nullptr) {
    throw InvalidArgumentException("The socket of a connect is null.");
  }
  return MakeRef<ConnectItem>(socket);
}

}  // namespace Tarnik::System
