#include <ctime>
#include <memory>

#include <openssl/err.h>
#include <openssl/x509.h>

#include "token_layout.h"
#include "value_model.h"

namespace Fuzz {
namespace {

struct FreeCertificate {
  void operator()(X509* certificate) const noexcept { X509_free(certificate); }
};

struct FreeBio {
  void operator()(BIO* bio) const noexcept { BIO_free(bio); }
};

bool IsName(const X509_NAME* name) {
  const std::unique_ptr<BIO, FreeBio> sink(BIO_new(BIO_s_null()));
  return X509_NAME_print_ex(sink.get(), name, 0, XN_FLAG_RFC2253) >= 0;
}

// As far as OpenSSL can read it, which the library depends on as well.
bool IsCertificate(const std::vector<unsigned char>& bytes) {
  const unsigned char* end = bytes.data();
  const std::unique_ptr<X509, FreeCertificate> certificate(
      d2i_X509(nullptr, &end, static_cast<long>(bytes.size())));
  std::tm time{};
  const bool isRead = certificate != nullptr && end == bytes.data() + bytes.size() &&
                      IsName(X509_get_subject_name(certificate.get())) &&
                      IsName(X509_get_issuer_name(certificate.get())) &&
                      ASN1_TIME_to_tm(X509_get0_notBefore(certificate.get()), &time) == 1 &&
                      ASN1_TIME_to_tm(X509_get0_notAfter(certificate.get()), &time) == 1;
  ERR_clear_error();
  return isRead;
}

// One X509Certificate in one X509Data in one KeyInfo.
std::vector<unsigned char> CertificateIn(const xmlNode* data) {
  const xmlNode* element = data;
  for (const char* name : {"KeyInfo", "X509Data", "X509Certificate"}) {
    Contents contents(element);
    element = contents.Take(name, kSignatures);
    DemandAttributes(element, {});
    contents.DemandEnd();
  }
  const auto bytes = Demanded(BytesOf(OnlyTextOf(element)));
  Demand(IsCertificate(bytes));
  return bytes;
}

void ReadConfirmationData(const xmlNode* data, ModelToken& token) {
  if (token.isHolderOfKey) {
    DemandAttributes(data, {kTypeAttribute, "NotOnOrAfter"});
    Demand(IsNameOfType(data, *TypeOf(data), kSaml, "KeyInfoConfirmationDataType"));
    token.certificate = CertificateIn(data);
  } else {
    DemandAttributes(data, {"NotOnOrAfter"}, {kTypeAttribute});
    DemandNoContent(data);
  }
  token.confirmedUntil = DateAttributeOf(data, "NotOnOrAfter");
}

void ReadConfirmation(const xmlNode* confirmation, ModelToken& token) {
  DemandAttributes(confirmation, {"Method"});
  const std::string method = Demanded(AttributeOf(confirmation, "Method"));
  token.isHolderOfKey = method == "urn:oasis:names:tc:SAML:2.0:cm:holder-of-key";
  Demand(token.isHolderOfKey || method == "urn:oasis:names:tc:SAML:2.0:cm:bearer");
  Contents contents(confirmation);
  if (contents.IsAt("NameID")) {
    token.confirmedDelegate = PrincipalOf(contents.TakeAny());
  }
  ReadConfirmationData(contents.Take("SubjectConfirmationData"), token);
  contents.DemandEnd();
}

}  // namespace

void ReadSubject(const xmlNode* subject, ModelToken& token) {
  DemandAttributes(subject, {});
  Contents contents(subject);
  token.subject = PrincipalOf(contents.Take("NameID"));
  ReadConfirmation(contents.Take("SubjectConfirmation"), token);
  contents.DemandEnd();
}

}  // namespace Fuzz
