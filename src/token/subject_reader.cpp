#include "token/subject_reader.h"

#include <vector>

#include <ssoclient/exceptions.h>
#include <tarnik/text/string_util.h>

#include "support/concat.h"
#include "support/namespaces.h"
#include "token/name_id_reader.h"
#include "token/strict_rules.h"

namespace SsoClient {
namespace {

using Tarnik::Xml::ElementNode;

TokenConfirmationType ParseMethod(std::string_view method) {
  if (method == "urn:oasis:names:tc:SAML:2.0:cm:bearer") {
    return BEARER;
  }
  if (method == "urn:oasis:names:tc:SAML:2.0:cm:holder-of-key") {
    return HOLDER_OF_KEY;
  }
  throw ParseException(Concat({"Unknown subject confirmation method: '", method, "'"}));
}

Tarnik::Ref<const Tarnik::Crypto::Certificate> ReadCertificate(ChildCursor& cursor) {
  const ElementNode& element = cursor.TakeElement("X509Certificate", kDsigNamespace);
  CheckAttributes(element, {});
  std::vector<unsigned char> der;
  Tarnik::StringUtil::Base64Decode(ReadTextContent(element), der);
  return Tarnik::Crypto::CreateCertificateFromDer(der.data(), der.size());
}

Tarnik::Ref<const Tarnik::Crypto::Certificate> ReadX509Data(ChildCursor& cursor) {
  const ElementNode& element = cursor.TakeElement("X509Data", kDsigNamespace);
  CheckAttributes(element, {});
  ChildCursor children = cursor.Into(element);
  auto certificate = ReadCertificate(children);
  children.ExpectEnd("Unexpected elements after X509Certificate");
  return certificate;
}

Tarnik::Ref<const Tarnik::Crypto::Certificate> ReadKeyInfo(ChildCursor& cursor) {
  const ElementNode& element = cursor.TakeElement("KeyInfo", kDsigNamespace);
  CheckAttributes(element, {});
  ChildCursor children = cursor.Into(element);
  auto certificate = ReadX509Data(children);
  children.ExpectEnd("Unexpected elements after X509Data");
  return certificate;
}

// SAML 2.0 core, section 2.4.1.3: the type of data that contains the holder's key.
void CheckKeyInfoType(const ElementNode& data) {
  const std::string_view type = FindTypeAttribute(data).value_or("");
  if (ResolveQNameValue(data, type) != QNameView{kSamlNamespace, "KeyInfoConfirmationDataType"}) {
    throw ParseException(Concat({"Invalid SubjectConfirmationData type: '", type, "'"}));
  }
}

void ReadHolderOfKeyData(const ElementNode& data, ChildCursor& children, ParsedSubject& subject) {
  CheckEachAttribute(data, {{"", "NotOnOrAfter"}, kTypeAttribute});
  CheckKeyInfoType(data);
  subject.notOnOrAfter = ReadDateAttribute(data, "NotOnOrAfter");
  subject.holderOfKeyCertificate = ReadKeyInfo(children);
  children.ExpectEnd("Unexpected elements after SubjectConfirmationData/KeyInfo");
}

void ReadBearerData(const ElementNode& data, const ChildCursor& children, ParsedSubject& subject) {
  // No type requires anything of bearer data, so xsi:type is not read.
  CheckEachAttribute(data, {{"", "NotOnOrAfter"}}, {kTypeAttribute});
  subject.notOnOrAfter = ReadDateAttribute(data, "NotOnOrAfter");
  ExpectEmpty(children);
}

void ReadConfirmationData(ChildCursor& cursor, ParsedSubject& subject) {
  const ElementNode& data = cursor.TakeElement("SubjectConfirmationData", kSamlNamespace);
  ChildCursor children = cursor.Into(data);
  if (subject.confirmationMethod == HOLDER_OF_KEY) {
    ReadHolderOfKeyData(data, children, subject);
  } else {
    ReadBearerData(data, children, subject);
  }
}

void ReadConfirmation(ChildCursor& cursor, ParsedSubject& subject) {
  const ElementNode& element = cursor.TakeElement("SubjectConfirmation", kSamlNamespace);
  CheckAttributes(element, {"Method"});
  subject.confirmationMethod = ParseMethod(ReadAttribute(element, "Method"));
  ChildCursor children = cursor.Into(element);
  if (children.IsAtElement("NameID")) {
    subject.delegateId = ReadPrincipal(children);
  }
  ReadConfirmationData(children, subject);
  children.ExpectEnd("Unexpected elements after SubjectConfirmationData");
}

}  // namespace

ParsedSubject ReadSubject(ChildCursor& cursor) {
  const ElementNode& element = cursor.TakeElement("Subject", kSamlNamespace);
  CheckAttributes(element, {});
  ParsedSubject subject;
  ChildCursor children = cursor.Into(element);
  subject.principal = ReadPrincipal(children);
  ReadConfirmation(children, subject);
  children.ExpectEnd("Unexpected elements after SubjectConfirmation");
  return subject;
}

}  // namespace SsoClient
