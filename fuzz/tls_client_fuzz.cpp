// The lines of an input describe trust stores, revocation lists and a client's identity, and the
// connections that are made with them. A model says which settings are refused and why, which
// servers are accepted, and what a server learns about its client. A stream below that fails ends
// the connection once, with its own words. The lines are those of client_case.h and:
//   server NAME [chain]   the end, such as "direct"; with its intermediate certificate
//   greets http|ssh       what comes instead of TLS
//   tls12                 the newest version of the server
//   host NAME, server-name NAME
//   fault read|write N throws|throws-state|throws-memory|fails|cancelled|ends
//   closed                the client closes before the handshake
//   connect               once more, with what the lines above say
#include <algorithm>
#include <set>
#include <string>

#include <fuzzer/FuzzedDataProvider.h>
#include <netinet/in.h>
#include <openssl/err.h>
#include <openssl/ssl.h>
#include <strings.h>

#include <tarnik/core/exception.h>
#include <tarnik/ssl/ssl_context.h>
#include <tarnik/ssl/ssl_exception.h>

#include "client_case.h"
#include "client_pki.h"
#include "faulty_stream.h"
#include "fixed_random.h"
#include "host_model.h"
#include "input.h"
#include "single_thread.h"
#include "tls_server.h"

namespace {

using namespace Tarnik;
using Fuzz::ClientCase;
using Fuzz::StreamFault;

constexpr int kMaxConnections = 80;

/// What the lines before a connection say about it.
struct Plan {
  std::string server = "direct";
  bool isChainSent = false;
  bool isTls13 = true;
  bool isClosed = false;
  std::string greeting;
  std::string host = Fuzz::kServerHost;
  std::string serverName;
  StreamFault fault;

  void Take(const Fuzz::Words& line);
  const std::string& ExpectedName() const { return serverName.empty() ? host : serverName; }
};

void Plan::Take(const Fuzz::Words& line) {
  static const std::set<std::string> ends = {"direct", "indirect", "stranger", "expired"};
  const std::string& kind = line.front();
  const std::string value = line.size() > 1 ? line[1] : "";
  if (kind == "server" && ends.count(value) != 0) {
    server = value;
    isChainSent = line.back() == "chain" && server == "indirect";
  } else if (kind == "greets") {
    greeting = value == "http" ? "HTTP/1.1 400 Bad Request\r\n\r\n" : "SSH-2.0-x\r\n";
  } else if (kind == "tls12") {
    isTls13 = false;
  } else if (kind == "closed") {
    isClosed = true;
  } else if (kind == "host") {
    host = value;
  } else if (kind == "server-name") {
    serverName = value;
  } else if (kind == "fault") {
    fault = Fuzz::StreamFaultOf(line);
  }
}

// A reader of names of another make than the library's.

bool IsHostName(const std::string& name) {
  const std::size_t length = name.size() - (name.size() > 1 && name.back() == '.' ? 1 : 0);
  return !name.empty() && length <= 253 && name.front() != '.' &&
         std::all_of(name.begin(), name.end(), [](char c) { return c > 0x20 && c < 0x7F; }) &&
         name.find_first_of("[]/\\@\"<>") == std::string::npos;
}

// The zone is one of this machine, so it is in no certificate (RFC 4007, section 11.2).
std::string LongAddressOf(const std::string& name) {
  const std::size_t zone = name.find('%');
  const std::string address =
      zone == std::string::npos ? "" : Fuzz::AddressBytes(name.substr(0, zone));
  return address.size() == sizeof(in6_addr) ? address : "";
}

/// The bytes of an address, whose zone does not count; empty for a name.
std::string AddressOf(const std::string& name) {
  const std::string address = Fuzz::AddressBytes(name);
  return address.empty() ? LongAddressOf(name) : address;
}

std::string WithoutRoot(const std::string& name) {
  return name.size() > 1 && name.back() == '.' ? name.substr(0, name.size() - 1) : name;
}

bool IsNamed(const std::string& name) {
  const std::string address = AddressOf(WithoutRoot(name));
  if (address.empty()) {
    return strcasecmp(WithoutRoot(name).c_str(), Fuzz::kServerHost) == 0;
  }
  return address == AddressOf(Fuzz::kServerAddress) ||
         address == AddressOf(Fuzz::kServerLongAddress);
}

// The server.

OpenSsl::OwnedSslContext ServerContext() {
  OpenSsl::OwnedSslContext context(SSL_CTX_new(TLS_server_method()));
  const unsigned char id[] = {'f'};
  SSL_CTX_set_session_id_context(context.get(), id, sizeof(id));
  SSL_CTX_set_verify(context.get(), SSL_VERIFY_PEER,
                     [](int /*isValid*/, X509_STORE_CTX* /*context*/) { return 1; });
  return context;
}

void Prepare(SSL* ssl, const Plan& plan) {
  const auto& own = Fuzz::FindCertificate(plan.server)->identity;
  SSL_set_max_proto_version(ssl, plan.isTls13 ? TLS1_3_VERSION : TLS1_2_VERSION);
  Fuzz::Require(SSL_use_certificate(ssl, own.certificate.get()) == 1 &&
                SSL_use_PrivateKey(ssl, own.key.get()) == 1);
  if (plan.isChainSent) {
    const auto& issuer = Fuzz::FindCertificate("intermediate")->identity;
    Fuzz::Require(SSL_add1_chain_cert(ssl, issuer.certificate.get()) == 1);
  }
}

bool IsSame(const X509* certificate, const std::string& name) {
  return X509_cmp(certificate, Fuzz::FindCertificate(name)->identity.certificate.get()) == 0;
}

/// The server has learnt exactly what the client is set up to present.
void RequirePresented(const SSL* ssl, const std::vector<std::string>& names) {
  const X509* certificate = SSL_get0_peer_certificate(ssl);
  Fuzz::Require((certificate == nullptr) == names.empty());
  if (names.empty()) {
    return;
  }
  Fuzz::Require(IsSame(certificate, names.front()));
  const STACK_OF(X509)* chain = SSL_get_peer_cert_chain(ssl);
  if (SSL_session_reused(ssl) == 1) {
    return;  // the chain is not kept with a session
  }
  Fuzz::Require(sk_X509_num(chain) == static_cast<int>(names.size()) - 1);
  for (int i = 0; i < sk_X509_num(chain); ++i) {
    Fuzz::Require(IsSame(sk_X509_value(chain, i), names[static_cast<std::size_t>(i) + 1]));
  }
}

void RequireServerName(const SSL* ssl, const std::string& expected) {
  if (SSL_session_reused(ssl) == 1) {
    return;  // OpenSSL does not keep it with a session of TLS 1.2
  }
  const char* sent = SSL_get_servername(ssl, TLSEXT_NAMETYPE_host_name);
  const std::string name = WithoutRoot(expected);
  Fuzz::Require(AddressOf(name).empty() ? sent != nullptr && name == sent : sent == nullptr);
}

template <class Refusal, class Call>
void RequireThrows(const Call& call) {
  bool isThrown = false;
  try {
    call();
  } catch (const Refusal&) {
    isThrown = true;
  }
  Fuzz::Require(isThrown);
}

/// The end of one operation.
struct Outcome {
  int count = 0;
  std::size_t size = 0;
  std::string failure;

  void Report(const Exception* error, std::size_t bytes = 0) {
    Fuzz::Require(++count == 1);
    size = bytes;
    failure = error == nullptr ? "" : error->Message();
    Fuzz::Require(error == nullptr || !failure.empty());
  }
  bool Says(const std::string& text) const { return failure.find(text) != std::string::npos; }
};

class Connection {
 public:
  Connection(Ssl::SSLContext& context, SSL_CTX* serverContext, const Plan& plan)
      : plan_(plan),
        server_(MakeRef<Fuzz::TlsServer>(serverContext, noInput_)),
        below_(MakeRef<Fuzz::FaultyStream>(server_.get(), plan.fault, plan.greeting)),
        stream_(context.WrapStream(below_.get(), "a label")) {
    Prepare(server_->Ssl(), plan);
  }

  /// True if it was opened and nothing has failed.
  bool Run(const ClientCase& setting) {
    Fuzz::Require(stream_->ToString() == "<SSLStream:a label>");
    char byte = 0;
    RequireThrows<InvalidStateException>([&] { stream_->ReadAsync(&byte, 1, {}); });
    RequireThrows<InvalidArgumentException>([&] { stream_->ReadAsync(&byte, 0, {}); });
    RequireThrows<InvalidArgumentException>(
        [&] { stream_->HandshakeClientAsync(plan_.host, plan_.serverName, {}); });
    if (plan_.isClosed) {
      stream_->Close();
    }
    Outcome handshake;
    const auto shake = [&] {
      stream_->HandshakeClientAsync(plan_.host, plan_.serverName,
                                    [&](Exception* error) { handshake.Report(error); });
    };
    const bool isName = plan_.serverName.empty() || IsHostName(plan_.serverName);
    if (!IsHostName(plan_.host) || !isName) {
      RequireThrows<InvalidArgumentException>(shake);
      return false;
    }
    shake();
    RequireThrows<InvalidStateException>(shake);
    Settle();
    // A stream that ends without TLS: nothing more comes.
    server_->End(true);
    Settle();
    Fuzz::Require(handshake.count == 1);
    return Check(setting, handshake);
  }

  bool WasResumed() const { return server_->WasResumed(); }

 private:
  bool Check(const ClientCase& setting, const Outcome& handshake) {
    if (plan_.isClosed) {
      Fuzz::Require(handshake.failure == "The TLS connection was closed on this side.");
      Fuzz::Require(below_->HasFaulted() || server_->Received().empty());
      return false;
    }
    // A session that is resumed is that of a server that was trusted.
    const bool isTrusted = server_->WasResumed() || setting.Trusts(plan_.server, plan_.isChainSent);
    const bool isAcceptable = plan_.greeting.empty() && isTrusted && IsNamed(plan_.ExpectedName());
    if (!isAcceptable || (below_->HasFaulted() && !handshake.failure.empty())) {
      RequireExplained(handshake, isTrusted);
      stream_->Close();
      Settle();
      return false;
    }
    Fuzz::Require(handshake.failure.empty());
    const Outcome last = ReadToEnd();
    Fuzz::Require(below_->HasFaulted() ? last.Says(below_->FaultText()) : last.failure.empty());
    if (!below_->HasFaulted()) {
      RequirePresented(server_->Ssl(), setting.Presented());
      RequireServerName(server_->Ssl(), plan_.ExpectedName());
    }
    stream_->Close();
    stream_->Close();
    Settle();
    return !below_->HasFaulted();
  }

  void RequireExplained(const Outcome& handshake, bool isTrusted) const {
    Fuzz::Require(!handshake.failure.empty());
    if (below_->HasFaulted() && handshake.Says(below_->FaultText())) {
      return;
    }
    if (plan_.greeting.empty()) {
      // Which of the reasons is reported is OpenSSL's choice only if there are several.
      const bool isOtherName =
          handshake.Says("does not name '" + WithoutRoot(plan_.ExpectedName()));
      Fuzz::Require(isOtherName ? !IsNamed(plan_.ExpectedName()) : !isTrusted);
    } else {
      Fuzz::Require(handshake.Says(plan_.greeting.starts_with("HTTP/")
                                       ? "the peer answers in plain HTTP"
                                       : "the peer does not answer in TLS"));
    }
  }

  Outcome ReadToEnd() {
    char buffer[64];
    Outcome outcome;
    stream_->ReadAsync(buffer, sizeof(buffer),
                       [&](std::size_t bytes, Exception* error) { outcome.Report(error, bytes); });
    Settle();
    // The server sends nothing but its close_notify.
    Fuzz::Require(outcome.count == 1 && outcome.size == 0);
    return outcome;
  }

  void Settle() {
    bool hasChanged = true;
    while (hasChanged) {
      hasChanged = Fuzz::RunCompletions();
      hasChanged = server_->Drive() || hasChanged;
    }
  }

  const Plan plan_;
  FuzzedDataProvider noInput_{nullptr, 0};
  Ref<Fuzz::TlsServer> server_;
  Ref<Fuzz::FaultyStream> below_;
  Ref<Ssl::SSLStream> stream_;
};

/// Null if the setting is refused.
Ref<Ssl::SSLContext> ContextOf(const ClientCase& setting) {
  try {
    return Ssl::CreateSSLContext(setting.Config());
  } catch (const Ssl::SSLException& error) {
    Fuzz::Require(setting.Explains(false, error.Message()));
  } catch (const InvalidArgumentException& error) {
    Fuzz::Require(setting.Explains(true, error.Message()));
  }
  return nullptr;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  Fuzz::RunOnOneThread();
  ClientCase setting;
  std::vector<Plan> plans(1);
  for (const auto& line : Fuzz::LinesOfWords(Fuzz::TextOf(data, size))) {
    if (setting.Take(line)) {
      continue;
    }
    if (line.front() == "connect" && plans.size() < kMaxConnections) {
      plans.push_back(plans.back());
    }
    plans.back().Take(line);
  }
  Fuzz::FixRandomness(size);
  const auto context = ContextOf(setting);
  Fuzz::Require((context == nullptr) == setting.IsRefused());
  if (context == nullptr) {
    return 0;
  }
  RequireThrows<InvalidArgumentException>([&] { context->WrapStream(nullptr, ""); });
  const OpenSsl::OwnedSslContext serverContext = ServerContext();
  std::set<std::string> opened;
  for (const Plan& plan : plans) {
    Connection connection(*context, serverContext.get(), plan);
    const bool isOpened = connection.Run(setting);
    std::string peer = plan.host + "\n" + plan.serverName;
    std::transform(peer.begin(), peer.end(), peer.begin(),
                   [](char c) { return c >= 'A' && c <= 'Z' ? static_cast<char>(c + 32) : c; });
    Fuzz::Require(!connection.WasResumed() || opened.count(peer) != 0);
    if (isOpened) {
      opened.insert(peer);
    }
  }
  Fuzz::Require(ERR_peek_error() == 0);
  return 0;
}
