#include "talkative_kdc.h"

#include <cstdint>
#include <stdexcept>
#include <utility>

#include <arpa/inet.h>
#include <gtest/gtest.h>
#include <krb5.h>
#include <sys/socket.h>
#include <unistd.h>

#include "handles.h"

namespace SsoClient::Testing {

namespace {

using Leg = std::vector<unsigned char>;

bool Receive(int connection, void* data, std::size_t size) {
  return ::recv(connection, data, size, MSG_WAITALL) == static_cast<ssize_t>(size);
}

// Each message follows its length (RFC 4120, section 7.2.2).
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

// One element of DER (X.690) with a content of less than 256 bytes.
Leg Element(unsigned char tag, const Leg& content) {
  EXPECT_LT(content.size(), 0x100U);
  Leg whole{tag};
  if (content.size() >= 0x80) {
    whole.push_back(0x81);
  }
  whole.push_back(static_cast<unsigned char>(content.size()));
  whole.insert(whole.end(), content.begin(), content.end());
  return whole;
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

std::vector<unsigned char> RefusalWith(const std::string& text) {
  Leg token{0x06, 0x09, 0x2a, 0x86, 0x48, 0x86, 0xf7, 0x12, 0x01, 0x02, 0x02, 0x03, 0x00};
  const std::string error = KerberosError(text);
  token.insert(token.end(), error.begin(), error.end());
  Leg fields{0xa0, 0x03, 0x0a, 0x01, 0x01};
  const Leg response = Element(0xa2, Element(0x04, Element(0x60, token)));
  fields.insert(fields.end(), response.begin(), response.end());
  return Element(0xa1, Element(0x30, fields));
}

}  // namespace SsoClient::Testing
