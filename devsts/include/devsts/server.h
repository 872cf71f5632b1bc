#ifndef DEVSTS_SERVER_H
#define DEVSTS_SERVER_H

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <system_error>
#include <utility>
#include <vector>

#include "devsts/certificates.h"
#include "devsts/misbehavior.h"
#include "devsts/negotiation.h"
#include "devsts/users.h"
#include "devsts/xml_security.h"

/// A small WS-Trust 1.3 Security Token Service for tests and demonstrations.
namespace DevSts {

/// The kind of TLS server certificate.
enum class ServerCertificate {
  Valid,                ///< for localhost, 127.0.0.1 and ::1, issued by the CA
  ThroughIntermediate,  ///< the same, issued by an intermediate CA whose certificate is sent
  MissingIntermediate,  ///< issued by an intermediate CA that is not sent
  Expired,
  NotYetValid,
  SelfSigned,
  WrongHost,             ///< for elsewhere.example only
  NameOnlyInCommonName,  ///< common name localhost, no alternative names
  AddressAsDnsName,      ///< the addresses as dNSName entries, without localhost
  NulInName,             ///< dNSName "localhost", NUL, ".elsewhere.example"
  Custom,  ///< `TlsOptions::dnsNames` and `addresses`, issued by the CA (for wildcards, for
           ///< example)
};

enum class TlsProtocol {
  Modern,  ///< TLS 1.2 and 1.3
  Tls12Only,
  Tls11Only,
  AnonymousSuites,  ///< TLS 1.2 with cipher suites without authentication
};

struct TlsOptions {
  ServerCertificate certificate = ServerCertificate::Valid;
  std::vector<std::string> dnsNames;
  std::vector<std::string> addresses;
  TlsProtocol protocol = TlsProtocol::Modern;
  /// Requests a certificate issued by the CA (see `Server::MakeClientCredential`) and refuses peers
  /// without one.
  bool requireClientCertificate = false;
  /// Issues TLS session tickets.
  bool sessionResumption = true;
};

struct ReceivedRequest;

/// The form of the assertions that are issued.
struct AssertionOptions {
  /// The prefix list of the exclusive form contains the prefixes that occur only in xsi:type
  /// values. A token signed in inclusive form does not verify when it comes back inside a request.
  SignOptions signing = DefaultSigning();
  /// The key type of the signing certificate; ECDSA algorithms need an EC key.
  KeyType signingKey = KeyType::Rsa2048;
  /// Declares the assertion's namespaces on the SOAP envelope instead of on the assertion.
  bool inheritNamespaces = false;
  /// Writes line breaks and indentation between elements.
  bool indent = false;
  /// Writes a Format attribute on Issuer.
  bool issuerFormat = true;
  /// Writes xsi:type="xs:string" on AttributeValue.
  bool attributeValueTypes = true;
  /// Count of RenewRestrictionType and of ProxyRestriction in tokens that are requested as
  /// renewable or delegable.
  unsigned renewCount = 10;
  unsigned proxyCount = 10;
  /// Postdatable and RenewExpired of RenewRestrictionType: whether a renewed token may begin in the
  /// future, and whether an expired token may be renewed.
  bool postdatable = false;
  bool renewExpired = false;
  /// The longest lifetime that is granted.
  std::chrono::seconds maxLifetime{30L * 24 * 3600};
  /// NotBefore of the Conditions is this long before the current time.
  std::chrono::seconds notBeforeOffset{0};
  /// Changes the assertion's text before it is signed. A ds:Signature in it is used as the
  /// template. This hook and the next one may be called on several threads at once.
  std::function<void(std::string& assertion)> beforeSigning;
  /// Changes the assertion's text in the answer after it has been signed.
  std::function<void(std::string& assertion)> afterSigning;

  static SignOptions DefaultSigning() {
    SignOptions options;
    options.inclusivePrefixes = {"del", "rsa", "xs"};
    return options;
  }
};

/// Keys that a server uses in place of new ones, each with its certificate. The server makes a new
/// key for each credential that is empty.
struct ServerKeys {
  Credential authority = {};
  /// For TLS, issued by the authority; only used with `ServerCertificate::Valid`.
  Credential server = {};
  /// Signs the assertions. Of the type `AssertionOptions::signingKey`.
  Credential signing = {};
};

struct ServerOptions {
  /// The numeric address to listen on; usually a loopback address, "127.0.0.1" or "::1".
  std::string address = "127.0.0.1";
  /// 0 takes a free port.
  std::uint16_t httpPort = 0;
  std::uint16_t httpsPort = 0;
  Users users = DemoUsers();
  /// The host in the vendor's namespaces and attribute names.
  std::string vendorHost = "sts-vendor.example";
  /// The host in the solution-user attribute's name.
  std::string solutionHost = "sso.example";
  /// The Issuer of the assertions.
  std::string issuer = "https://sts.example.com/STS";
  /// The difference between clocks that is tolerated in a request's Timestamp.
  std::chrono::seconds clockSkew{60};
  AssertionOptions assertion;
  TlsOptions tls;
  NegotiationOptions negotiation;
  /// Remembers at most this many issued tokens (the oldest are forgotten first). Forgotten tokens
  /// are refused.
  std::size_t issuedTokenLimit = 8192;
  /// Keeps at most this many requests in the log (the oldest are removed first).
  std::size_t requestLogLimit = 4096;
  /// Called once for each request, on the connection's thread, after the answer has been determined
  /// and before it is sent.
  std::function<void(const ReceivedRequest&)> onRequest;
  /// Called on a thread of the service when a port can accept no more connections, with a message
  /// that names it. Must not throw. Without this function, standard error receives the message.
  std::function<void(const std::string& message)> onFailure;
  ServerKeys keys;
};

/// How a request is signed, by the form of the reference in its ds:KeyInfo.
enum class RequestSignature {
  None,
  ByCertificate,  ///< a BinarySecurityToken (X.509 Token Profile 1.1, section 3.2)
  ByToken,        ///< an assertion's ID (SAML Token Profile 1.1, section 3.4)
  Other,          ///< a form that the service does not support
};

/// A received leg of a negotiation.
struct ReceivedLeg {
  std::string context;
  /// The number of the leg in its negotiation, counted from 1; 0 if it does not belong to one.
  unsigned ordinal = 0;
  std::string octets;
};

/// A received request. Bodies contain passwords: tests may inspect them, but they must not be
/// logged.
struct ReceivedRequest {
  std::uint64_t connectionId = 0;       ///< counts accepted connections from 1
  std::size_t ordinalOnConnection = 0;  ///< counts the connection's requests from 1
  bool overTls = false;
  bool tlsSessionReused = false;
  std::string tlsVersion;          ///< "TLSv1.3", empty without TLS
  std::string serverName;          ///< the peer's server_name extension, empty if none
  std::string peerCertificatePem;  ///< the client certificate, empty if none
  std::string head;                ///< request line and header fields, octet for octet
  std::string method;
  std::string target;
  std::vector<std::pair<std::string, std::string>> headers;  ///< in order, names as sent
  std::string body;
  /// Also None if the envelope or the Security header could not be read, or if a misbehaviour
  /// answered the request. Whether the signature is valid can be seen from the answer.
  RequestSignature signature = RequestSignature::None;
  /// The leg, if the request was one of a negotiation and could be read.
  std::optional<ReceivedLeg> leg;
  int answeredStatus = 0;     ///< 0 when raw octets were sent
  std::string answeredFault;  ///< faultstring of the answer if it is a fault, else empty

  /// The first field of this name, ignoring case; empty if the field is missing.
  std::string Header(const std::string& name) const;
  std::size_t HeaderCount(const std::string& name) const;
};

struct Counters {
  std::uint64_t connectionsAccepted = 0;
  std::uint64_t connectionsOpen = 0;
  std::uint64_t handshakesDone = 0;
  std::uint64_t handshakesFailed = 0;
  std::uint64_t handshakesResumed = 0;
  std::uint64_t requests = 0;
  std::uint64_t malformedRequests =
      0;  ///< input that was not an HTTP request; the connection is closed
  std::uint64_t tokensIssued = 0;
  std::uint64_t faults = 0;
  std::uint64_t negotiations = 0;      ///< first legs that began a negotiation
  std::uint64_t negotiationLegs = 0;   ///< legs that a negotiation took, first ones included
  std::uint64_t negotiatedTokens = 0;  ///< negotiations that ended in a token
  std::uint64_t stalls = 0;            ///< stalls that were reached
  std::uint64_t stalled = 0;           ///< connections that are stalled now
  std::uint64_t delayed = 0;           ///< requests whose answer is being delayed now
};

/// One of the two ports cannot be opened.
class PortError : public std::system_error {
 public:
  PortError(std::error_code code, bool overTls)
      : std::system_error(code, overTls ? "the HTTPS port" : "the HTTP port"), overTls_(overTls) {}

  bool IsOverTls() const { return overTls_; }

 private:
  bool overTls_;
};

/// The service. It listens on one HTTP and one HTTPS port from construction to destruction and uses
/// one thread for each connection, up to about 2,000 connections at once. Connections wait while
/// the system has no file descriptor for them, and are closed if it has no thread. All members are
/// thread-safe.
class Server {
 public:
  /// Throws `PortError` if a port cannot be opened, and `std::runtime_error` if a certificate
  /// cannot be made or the keytab has no key.
  explicit Server(ServerOptions options = {});
  /// Stops accepting, ends every connection and waits for their threads.
  ~Server();
  Server(const Server&) = delete;
  Server& operator=(const Server&) = delete;

  std::uint16_t HttpPort() const;
  std::uint16_t HttpsPort() const;
  /// The URL with the numeric address as host, with brackets around ::1.
  std::string HttpUrl(const std::string& path = "/sts") const;
  std::string HttpsUrl(const std::string& path = "/sts") const;
  /// The same with another host, for example "localhost".
  std::string HttpsUrlFor(const std::string& host, const std::string& path = "/sts") const;

  /// The CA that issued the TLS certificates.
  std::string CaCertificatePem() const;
  std::string ServerCertificatePem() const;
  /// The certificate whose key signs assertions; `SigningCredential` adds the key, for tests that
  /// sign their own.
  std::string SigningCertificatePem() const;
  Credential SigningCredential() const;
  /// A signing certificate with the same subject name that the service never uses.
  Credential StrangerCredential() const;
  /// A client certificate issued by the CA.
  Credential MakeClientCredential(const std::string& commonName) const;

  void SetUsers(Users users);
  /// Adds a certificate with which this user may request tokens. Throws `std::out_of_range` if
  /// there is no such user, `std::runtime_error` if the certificate does not load.
  void RegisterCertificate(const std::string& userName, const std::string& certificatePem);

  /// Revokes the issued token with this ID, which is then neither valid nor accepted. Returns false
  /// if no such token is known.
  bool Revoke(const std::string& assertionId);

  void SetAssertionOptions(AssertionOptions options);

  /// Applies to connections that are accepted from now on. A certificate that is made for these
  /// options is issued by the same authority. Throws `std::runtime_error` if it cannot be made.
  void SetTlsOptions(const TlsOptions& options);

  void SetNegotiationScript(NegotiationScript script);
  /// The number of negotiations in progress.
  std::size_t OpenNegotiations() const;

  /// Applies to every request (and, for the stalls before a request, every connection) from now on.
  void SetMisbehavior(Misbehavior misbehavior);
  /// Forgets the misbehaviour that `SetMisbehavior` and `MisbehaveNext` have set.
  void ClearMisbehavior();
  /// Applies to each of the next `count` requests, in the order of the calls and before the
  /// misbehaviour of `SetMisbehavior`. A misbehaviour with a stall before the request is used up by
  /// a connection, not by a request.
  void MisbehaveNext(Misbehavior misbehavior, std::size_t count = 1);

  std::vector<ReceivedRequest> Requests() const;
  /// Throws `std::out_of_range` if no request was received.
  ReceivedRequest LastRequest() const;
  void ClearRequests();
  Counters GetCounters() const;
  /// Waits until the counters satisfy `condition`, which is evaluated after each change. Returns
  /// false if that does not happen before the time-out.
  bool WaitUntil(const std::function<bool(const Counters&)>& condition,
                 std::chrono::milliseconds timeout = std::chrono::seconds(10)) const;

 private:
  class Impl;
  std::unique_ptr<Impl> impl_;
};

}  // namespace DevSts

#endif
