#include "talkative_kdc.h"

#include <arpa/inet.h>
#include <sys/socket.h>
#include <unistd.h>

#include <stdexcept>
#include <utility>

#include "krb5_handles.h"

namespace SsoClient::Testing {

namespace {

bool Receive(int connection, void* data, std::size_t size) {
  return ::recv(connection, data, size, MSG_WAITALL) == static_cast<ssize_t>(size);
}

// Messages stand behind their length (RFC 4120, section 7.2.2).
void Answer(int connection, const std::string& message) {
  std::uint32_t size = 0;
  if (!Receive(connection, &size, sizeof(size))) {
    return;
  }
  std::string request(ntohl(size), '\0');
  if (!Receive(connection, request.data(), request.size())) {
    return;
  }
  size = htonl(static_cast<std::uint32_t>(message.size()));
  const std::string framed(reinterpret_cast<const char*>(&size), sizeof(size));
  ::send(connection, (framed + message).data(), framed.size() + message.size(), MSG_NOSIGNAL);
}

}  // namespace

TalkativeKdc::TalkativeKdc(std::string text) : text_(std::move(text)) {
  if (::listen(socket_.Descriptor(), 16) != 0) {
    throw std::runtime_error("The KDC cannot listen");
  }
  thread_ = std::thread([this] { Serve(); });
}

TalkativeKdc::~TalkativeKdc() {
  ::shutdown(socket_.Descriptor(), SHUT_RDWR);
  thread_.join();
}

int TalkativeKdc::Port() const {
  return socket_.Port();
}

void TalkativeKdc::Serve() const {
  const std::string message = KerberosError(text_);
  for (int connection = 0; (connection = ::accept(socket_.Descriptor(), nullptr, nullptr)) >= 0;) {
    Answer(connection, message);
    ::close(connection);
  }
}

std::string KerberosError(std::string text) {
  const auto context = CreateKrb5Context();
  krb5_principal parsed = nullptr;
  if (krb5_parse_name(context.get(), "krbtgt/EXAMPLE.COM@EXAMPLE.COM", &parsed) != 0) {
    throw std::runtime_error("The KDC has no name");
  }
  const Krb5Principal server(parsed, {context.get()});
  krb5_error error{};
  error.error = 60;  // KRB_ERR_GENERIC
  error.server = server.get();
  error.text = {0, static_cast<unsigned>(text.size()), text.data()};
  krb5_data encoded{};
  if (krb5_mk_error(context.get(), &error, &encoded) != 0) {
    throw std::runtime_error("The KDC has no error");
  }
  std::string message(encoded.data, encoded.length);
  krb5_free_data_contents(context.get(), &encoded);
  return message;
}

}  // namespace SsoClient::Testing
