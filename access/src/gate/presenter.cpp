#include <utility>

#include <ssoclient/access/presenter.h>

namespace SsoClient::Access {

Presenter Presenter::Nobody() {
  return {};
}

Presenter Presenter::WithTlsCertificate(
    Tarnik::Ref<const Tarnik::Crypto::Certificate> certificate) {
  Presenter presenter;
  presenter.kind_ = certificate == nullptr ? Kind::kNobody : Kind::kTlsCertificate;
  presenter.certificate_ = std::move(certificate);
  return presenter;
}

Presenter Presenter::WithSignature(std::string data, std::vector<unsigned char> signature,
                                   Tarnik::Crypto::SignatureAlgorithm algorithm) {
  Presenter presenter;
  presenter.kind_ = Kind::kSignature;
  presenter.data_ = std::move(data);
  presenter.signature_ = std::move(signature);
  presenter.algorithm_ = algorithm;
  return presenter;
}

}  // namespace SsoClient::Access
