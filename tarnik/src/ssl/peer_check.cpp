#include "ssl/peer_check.h"

#include <algorithm>

#include <arpa/inet.h>

#include <tarnik/ssl/ssl_exception.h>

#include "system/host_name.h"

namespace Tarnik::Ssl {
namespace {

constexpr std::size_t kMaxDescribedName = 256;

// In RFC 2253 form, which escapes control characters, since the peer chooses this text.
std::string Describe(const X509_NAME* name) {
  const OpenSsl::OwnedBio bio(BIO_new(BIO_s_mem()));
  if (bio == nullptr || X509_NAME_print_ex(bio.get(), name, 0, XN_FLAG_RFC2253) < 0) {
    return "a name that cannot be shown";
  }
  char* text = nullptr;
  const long length = BIO_get_mem_data(bio.get(), &text);
  const std::string described(text, static_cast<std::size_t>(std::max(length, 0L)));
  if (described.empty()) {
    return "no subject";
  }
  return described.size() > kMaxDescribedName ? described.substr(0, kMaxDescribedName) + "..."
                                              : described;
}

bool IsMissingIssuer(int error) {
  return error == X509_V_ERR_UNABLE_TO_GET_ISSUER_CERT ||
         error == X509_V_ERR_UNABLE_TO_GET_ISSUER_CERT_LOCALLY ||
         error == X509_V_ERR_UNABLE_TO_VERIFY_LEAF_SIGNATURE;
}

bool IsMismatch(int error) {
  return error == X509_V_ERR_HOSTNAME_MISMATCH || error == X509_V_ERR_IP_ADDRESS_MISMATCH;
}

void Require(bool condition) {
  if (!condition) {
    throw SSLException("Cannot set up the check of the TLS peer.");
  }
}

void ExpectAddress(X509_VERIFY_PARAM* parameters, const std::string& address) {
  unsigned char bytes[sizeof(in6_addr)];
  if (inet_pton(AF_INET, address.c_str(), bytes) == 1) {
    Require(X509_VERIFY_PARAM_set1_ip(parameters, bytes, sizeof(in_addr)) == 1);
    return;
  }
  const std::string withoutZone = address.substr(0, address.find('%'));
  Require(inet_pton(AF_INET6, withoutZone.c_str(), bytes) == 1);
  Require(X509_VERIFY_PARAM_set1_ip(parameters, bytes, sizeof(in6_addr)) == 1);
}

}  // namespace

PeerCheck::PeerCheck(const std::string& host, const std::string& serverName,
                     const PinnedCertificates& pinned)
    : expected_(System::WithoutRootDot(serverName.empty() ? host : serverName)), pinned_(pinned) {}

void PeerCheck::ApplyTo(SSL* ssl) const {
  X509_VERIFY_PARAM* parameters = SSL_get0_param(ssl);
  if (System::IsAddressLiteral(expected_)) {
    ExpectAddress(parameters, expected_);
    return;
  }
  X509_VERIFY_PARAM_set_hostflags(
      parameters, X509_CHECK_FLAG_NO_PARTIAL_WILDCARDS | X509_CHECK_FLAG_NEVER_CHECK_SUBJECT);
  Require(X509_VERIFY_PARAM_set1_host(parameters, expected_.data(), expected_.size()) == 1);
  // The expansion of the macro SSL_set_tlsext_host_name, without its C-style cast. OpenSSL copies
  // the name.
  Require(SSL_ctrl(ssl, SSL_CTRL_SET_TLSEXT_HOSTNAME, TLSEXT_NAMETYPE_host_name,
                   const_cast<char*>(expected_.c_str())) == 1);
}

bool PeerCheck::OnVerified(bool isValid, X509_STORE_CTX* context) {
  X509* certificate = X509_STORE_CTX_get_current_cert(context);
  if (!isValid) {
    return Reject(X509_STORE_CTX_get_error(context), certificate);
  }
  if (X509_STORE_CTX_get_error_depth(context) > 0 || IsPinned(certificate)) {
    return true;
  }
  X509_STORE_CTX_set_error(context, X509_V_ERR_APPLICATION_VERIFICATION);
  return Reject(X509_V_ERR_APPLICATION_VERIFICATION, certificate);
}

bool PeerCheck::IsAccepted(const SSL* ssl) {
  X509* certificate = SSL_get0_peer_certificate(ssl);
  if (certificate == nullptr) {
    failure_ = "the peer has no certificate";
    return false;
  }
  const long result = SSL_get_verify_result(ssl);
  if (result != X509_V_OK) {
    return Reject(static_cast<int>(result), certificate);
  }
  if (!IsPinned(certificate)) {
    return Reject(X509_V_ERR_APPLICATION_VERIFICATION, certificate);
  }
  return true;
}

bool PeerCheck::IsPinned(X509* certificate) const {
  if (pinned_.empty()) {
    return true;
  }
  unsigned char* der = nullptr;
  const int length = i2d_X509(certificate, &der);
  const OpenSsl::OwnedMemory<unsigned char> owner(der);
  return length > 0 && std::any_of(pinned_.begin(), pinned_.end(), [&](const auto& pinned) {
           return std::equal(der, der + length, pinned->DerBytes(),
                             pinned->DerBytes() + pinned->DerLength());
         });
}

bool PeerCheck::Reject(int error, X509* certificate) {
  isOtherPeer_ = IsMismatch(error);
  failure_ = DescribeFailure(error, certificate);
  return false;
}

std::string PeerCheck::DescribeFailure(int error, X509* certificate) const {
  const std::string subject =
      certificate == nullptr ? "no certificate" : Describe(X509_get_subject_name(certificate));
  if (IsMismatch(error)) {
    return "the certificate (" + subject + ") does not name '" + expected_ + "'";
  }
  if (error == X509_V_ERR_APPLICATION_VERIFICATION) {
    return "the certificate (" + subject + ") is not one of the pinned certificates";
  }
  std::string text = X509_verify_cert_error_string(error);
  text.append(" (").append(subject);
  if (IsMissingIssuer(error) && certificate != nullptr) {
    text.append(", issued by ").append(Describe(X509_get_issuer_name(certificate)));
  }
  return text.append(")");
}

}  // namespace Tarnik::Ssl
