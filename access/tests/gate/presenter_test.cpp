#include <utility>

#include <gtest/gtest.h>

#include <ssoclient/access/presenter.h>
#include <tarnik/core/object_impl.h>

#include "support/issued_token.h"

namespace SsoClient::Access::Testing {
namespace {

TEST(PresenterTest, Nobody) {
  EXPECT_EQ(Presenter::Nobody().GetKind(), Presenter::Kind::kNobody);
  EXPECT_EQ(Presenter::Nobody().Certificate(), nullptr);
}

TEST(PresenterTest, TlsCertificate) {
  const auto certificate = Tarnik::MakeRef<NamedCertificate>("name");
  const Presenter presenter = Presenter::WithTlsCertificate(certificate);
  EXPECT_EQ(presenter.GetKind(), Presenter::Kind::kTlsCertificate);
  EXPECT_EQ(presenter.Certificate().get(), certificate.get());
  EXPECT_EQ(Presenter::WithTlsCertificate(nullptr).GetKind(), Presenter::Kind::kNobody);
}

TEST(PresenterTest, Signature) {
  const auto algorithm = Tarnik::Crypto::SignatureAlgorithm::kRsaPssSha384;
  const Presenter presenter = Presenter::WithSignature("data", {1, 2}, algorithm);
  EXPECT_EQ(presenter.GetKind(), Presenter::Kind::kSignature);
  EXPECT_EQ(presenter.Certificate(), nullptr);
  EXPECT_EQ(presenter.Data(), "data");
  EXPECT_EQ(presenter.Signature(), (std::vector<unsigned char>{1, 2}));
  EXPECT_EQ(presenter.Algorithm(), algorithm);
}

TEST(PresenterTest, MovedFromProvesNothing) {
  Presenter presenter = Presenter::WithTlsCertificate(Tarnik::MakeRef<NamedCertificate>("name"));
  const Presenter moved = std::move(presenter);
  EXPECT_EQ(moved.GetKind(), Presenter::Kind::kTlsCertificate);
  EXPECT_EQ(presenter.GetKind(), Presenter::Kind::kNobody);
}

}  // namespace
}  // namespace SsoClient::Access::Testing
