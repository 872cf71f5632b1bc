#include "xml/security/new_signature.h"

#include <tarnik/core/exception.h>
#include <tarnik/xml/xml_writer.h>

#include "support/signed_documents.h"

namespace Tarnik::Xml::Security {
namespace {

constexpr const char* kExclusive = "http://www.w3.org/2001/10/xml-exc-c14n#";
constexpr const char* kRsaSha256 = "http://www.w3.org/2001/04/xmldsig-more#rsa-sha256";
constexpr const char* kSha256 = "http://www.w3.org/2001/04/xmlenc#sha256";

TEST(NewSignature, MakesWhatItVerifies) {
  const Ref<Document> document = Tests::ParseDocument("<a><b Id=\"x\">text</b><c/></a>");
  Ref<Signature> signature;
  CreateBlankSignature(document->RootElement(), kExclusive, kRsaSha256, "ds", signature);
  signature->AddReference("#x", kSha256)->AddTransform(kExclusive);
  signature->Sign(Crypto::CreatePrivateKeyFromPem(Tests::Signer().privateKeyPem).get());
  Tests::FindElement(document.get(), "c")->AppendChild(signature->Element());
  EXPECT_TRUE(signature->Verify(Tests::Trusting(Tests::Signer()).get()));
}

}  // namespace
}  // namespace Tarnik::Xml::Security
