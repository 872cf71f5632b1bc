#include "tls_names.h"

#include <string>

namespace DevSts::Program {
namespace {

using Value = const std::string&;

template <ServerCertificate certificate>
void Use(Value /*value*/, TlsOptions& target) {
  target.certificate = certificate;
}

template <TlsProtocol protocol>
void Speak(Value /*value*/, TlsOptions& target) {
  target.protocol = protocol;
}

}  // namespace

const Vocabulary<TlsOptions>& TlsNames() {
  static const Vocabulary<TlsOptions> names{
      {"valid", "", "a certificate for localhost, 127.0.0.1 and ::1, issued by the CA (default)",
       Use<ServerCertificate::Valid>},
      {"through-intermediate", "", "issued by an intermediate CA whose certificate is sent",
       Use<ServerCertificate::ThroughIntermediate>},
      {"missing-intermediate", "", "issued by an intermediate CA that is not sent",
       Use<ServerCertificate::MissingIntermediate>},
      {"expired", "", "a certificate that has expired", Use<ServerCertificate::Expired>},
      {"not-yet-valid", "", "a certificate that is not valid yet",
       Use<ServerCertificate::NotYetValid>},
      {"self-signed", "", "a certificate that no CA has issued",
       Use<ServerCertificate::SelfSigned>},
      {"wrong-host", "", "a certificate for elsewhere.example", Use<ServerCertificate::WrongHost>},
      {"name-only-in-common-name", "", "a certificate without alternative names",
       Use<ServerCertificate::NameOnlyInCommonName>},
      {"address-as-dns-name", "", "a certificate with the addresses as DNS names",
       Use<ServerCertificate::AddressAsDnsName>},
      {"nul-in-name", "", "a certificate with a NUL in its DNS name",
       Use<ServerCertificate::NulInName>},
      {"name", "HOST", "a certificate for this DNS name; may be repeated",
       [](Value value, TlsOptions& target) {
         target.certificate = ServerCertificate::Custom;
         target.dnsNames.push_back(value);
       }},
      {"address", "ADDRESS", "a certificate for this address; may be repeated",
       [](Value value, TlsOptions& target) {
         target.certificate = ServerCertificate::Custom;
         target.addresses.push_back(value);
       }},
      {"modern", "", "TLS 1.2 and 1.3 (default)", Speak<TlsProtocol::Modern>},
      {"tls12-only", "", "only TLS 1.2", Speak<TlsProtocol::Tls12Only>},
      {"tls11-only", "", "only TLS 1.1", Speak<TlsProtocol::Tls11Only>},
      {"anonymous-suites", "", "only cipher suites without authentication",
       Speak<TlsProtocol::AnonymousSuites>},
      {"client-certificate", "", "requires a client certificate that the CA has issued",
       [](Value, TlsOptions& target) { target.requireClientCertificate = true; }},
      {"no-resumption", "", "resumes no TLS session",
       [](Value, TlsOptions& target) { target.sessionResumption = false; }},
  };
  return names;
}

}  // namespace DevSts::Program
