// Token cases about the signature: its place, its parts, what it covers and whose it is.
#include <algorithm>
#include <cstddef>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "support/assertion_text.h"
#include "support/forgeries.h"
#include "support/resigned.h"
#include "support/token_cases.h"

namespace SsoClient::Testing {
namespace {

const DevSts::Credential& Trusted() {
  return TrustedCredential();
}

// The signed original with a change of its SignedInfo, which is signed too.
std::string WithSignedInfo(std::string_view from, std::string_view to) {
  return Resigned(Replaced(OriginalAssertion(), from, to), Trusted());
}

std::string Between(const std::string& text, std::string_view begin, std::string_view end) {
  const std::size_t start = text.find(begin);
  return text.substr(start, text.find(end, start) + end.size() - start);
}

// The element with its tags.
std::string ElementOf(const std::string& name) {
  return Between(OriginalAssertion(), "<ds:" + name, "</ds:" + name + ">");
}

std::string Doubled(const std::string& element) {
  return Replaced(OriginalAssertion(), element, element + element);
}

const char* const kXPathTransform =
    R"(<ds:Transform Algorithm="http://www.w3.org/TR/1999/REC-xpath-19991116">)"
    R"(<ds:XPath>true()</ds:XPath></ds:Transform>)";

// Signed by the oracle as the template says.
std::string SignedByTemplate(const std::string& from, const std::string& to) {
  AssertionText text;
  text.signature = Replaced(text.signature, "AAECAwQFBgcICQoLDA0ODxAREhMUFRYXGBkaGxwdHh8=", "");
  text.signature = Replaced(text.signature, "AAECAwQF", "");
  text.signature = Replaced(text.signature, from, to);
  return DevSts::SignXml(text.ToXml(), Trusted().privateKeyPem, Trusted().certificatePem);
}

void AddPlaced(Place place, std::vector<TokenCase>& cases) {
  const std::string original = OriginalAssertion();
  for (const ForgedId id : AllForgedIds()) {
    for (const ForgedSignature signature : AllForgedSignatures()) {
      std::string text = Arranged(place, ForgedAssertion(id, signature, original), original);
      if (!text.empty()) {
        cases.push_back({"place " + std::to_string(static_cast<int>(place)) + ", id " +
                             std::to_string(static_cast<int>(id)) + ", signature " +
                             std::to_string(static_cast<int>(signature)),
                         std::move(text), Fate::kRefused});
      }
    }
  }
}

}  // namespace

std::vector<TokenCase> WrappingCases() {
  std::vector<TokenCase> cases{{"original", OriginalAssertion(), Fate::kAccepted}};
  for (const Place place : AllPlaces()) {
    AddPlaced(place, cases);
  }
  return cases;
}

std::vector<TokenCase> SignaturePlaceCases() {
  const std::string original = OriginalAssertion();
  const std::string signature = SignatureOf(original);
  const std::string bare = Replaced(original, signature, "");
  const std::string dsig = "http://www.w3.org/2000/09/xmldsig#";
  std::string otherNamespace = original;
  for (std::size_t at = 0; (at = otherNamespace.find(dsig + "\"", at)) != std::string::npos; ++at) {
    otherNamespace.replace(at, dsig.size(), "http://www.w3.org/2000/09/xmldsig");
  }
  return {
      {"original", original, Fate::kAccepted},
      {"left out", bare, Fate::kNotAToken},
      {"empty", InsertedAfter(bare, "</saml2:Issuer>", "<ds:Signature/>"), Fate::kNotAToken},
      {"twice", InsertedAfter(original, signature, signature), Fate::kNotAToken},
      {"in another namespace", otherNamespace, Fate::kNotAToken},
      {"before the issuer", Replaced(bare, "<saml2:Issuer ", signature + "<saml2:Issuer "),
       Fate::kNotAToken},
      {"after the subject", InsertedAfter(bare, "</saml2:Subject>", signature), Fate::kNotAToken},
      {"at the end", Replaced(bare, "</saml2:Assertion>", signature + "</saml2:Assertion>"),
       Fate::kNotAToken}};
}

std::vector<TokenCase> SignaturePartCases() {
  const std::string info = ElementOf("SignedInfo");
  const std::string original = OriginalAssertion();
  std::vector<TokenCase> cases{
      {"original", original, Fate::kAccepted},
      {"two SignedInfo", Doubled(info), Fate::kNotAToken},
      {"two SignatureValue", Doubled(ElementOf("SignatureValue")), Fate::kNotAToken},
      {"SignedInfo in Object",
       Replaced(original, "</ds:Signature>", "<ds:Object>" + info + "</ds:Object></ds:Signature>"),
       Fate::kNotAToken},
      {"SignatureMethod in Object",
       Replaced(original, "</ds:Signature>",
                R"(<ds:Object><ds:SignatureMethod Algorithm="urn:a"/></ds:Object></ds:Signature>)"),
       Fate::kNotAToken},
      {"reference to itself",
       Resigned(Replaced(Replaced(original,
                                  "<ds:Signature xmlns:ds=", R"(<ds:Signature Id="_s" xmlns:ds=)"),
                         R"(URI="#_a1")", R"(URI="#_s")"),
                Trusted()),
       Fate::kNotAToken}};
  for (const char* value : {"DigestValue", "SignatureValue"}) {
    const std::string begin = std::string("<ds:") + value + ">";
    for (const char* inserted : {"<!-- -->", "<?pi?>", "<![CDATA[]]>", "<x/>"}) {
      cases.push_back({std::string(value) + " with " + inserted,
                       InsertedAfter(original, begin, inserted), Fate::kNotAToken});
    }
  }
  cases.push_back({"SignatureValue with white space",
                   InsertedAfter(original, "<ds:SignatureValue>", " \n\t"), Fate::kAccepted});
  cases.push_back({"DigestValue with white space",
                   WithSignedInfo("<ds:DigestValue>", "<ds:DigestValue> \n"), Fate::kAccepted});
  return cases;
}

std::vector<TokenCase> IdCases() {
  const std::string wsu =
      "xmlns:u=\"http://docs.oasis-open.org/wss/2004/01/"
      "oasis-200401-wss-wssecurity-utility-1.0.xsd\" u:Id";
  std::vector<TokenCase> cases;
  for (const std::string& name :
       {std::string("ID"), std::string("Id"), std::string("id"), std::string("xml:id"),
        std::string("xmlns:p=\"urn:p\" p:ID"), wsu}) {
    for (const char* value : {"_a1", "_a2"}) {
      const std::string element =
          std::string("<x ").append(name).append("=\"").append(value).append("\"/>");
      cases.push_back({element,
                       Replaced(OriginalAssertion(), "</ds:KeyInfo>", element + "</ds:KeyInfo>"),
                       std::string_view(value) == "_a1" ? Fate::kBadSignature : Fate::kAccepted});
    }
  }
  for (const char* uri :
       {"#", "_a1", "#_a", "##_a1", "#_A1", "#_a1 ", " #_a1", "#'_a1'", "#xpointer(id('_a1'))",
        "#xpointer(/)", "urn:x#_a1", "#_a1&quot;", "file:///etc/hostname"}) {
    cases.push_back({std::string("reference ") + uri,
                     WithSignedInfo(R"(URI="#_a1")", "URI=\"" + std::string(uri) + "\""),
                     Fate::kNotAToken});
  }
  cases.push_back(
      {"reference to the document", WithSignedInfo(R"(URI="#_a1")", R"(URI="")"), Fate::kAccepted});
  return cases;
}

std::vector<TokenCase> NamespaceCases() {
  AssertionText text;
  text.attributes += R"( xmlns:q="urn:q" xmlns:r="urn:r")";
  DevSts::SignOptions options;
  options.inclusivePrefixes = {"q", "r"};
  const std::string original = text.ToSignedXml(Trusted(), options);
  const std::string empty =
      Replaced(original, Between(original, "<ds:DigestValue>", "</ds:DigestValue>"),
               "<ds:DigestValue>47DEQpj8HBSa+/TImW+5JCeuQeRkm5NMpJWZG3hSuFU=</ds:DigestValue>");
  std::vector<TokenCase> cases{
      {"original", original, Fate::kAccepted},
      {"signed again", Resigned(original, Trusted()), Fate::kAccepted},
      {"digest of nothing", Resigned(empty, Trusted()), Fate::kBadSignature},
      // Without escapes, the canonical text would be that of the original.
      {"quotes in a URI",
       Replaced(original, R"(xmlns:q="urn:q" xmlns:r="urn:r")",
                R"(xmlns:q='urn:q" xmlns:r="urn:r')"),
       Fate::kBadSignature},
      {"other order",
       Replaced(original, R"(xmlns:q="urn:q" xmlns:r="urn:r")",
                R"(xmlns:r="urn:r" xmlns:q="urn:q")"),
       Fate::kAccepted}};
  for (const char* uri : {"relative/uri", "../other", "not a uri", "#x"}) {
    cases.push_back(
        {std::string("URI without a canonical form: ") + uri,
         Replaced(Resigned(empty, Trusted()), "\"urn:q\"", "\"" + std::string(uri) + "\""),
         Fate::kBadSignature});
  }
  return cases;
}

std::vector<TokenCase> TransformCases() {
  const std::string enveloped =
      R"(<ds:Transform Algorithm="http://www.w3.org/2000/09/xmldsig#enveloped-signature"/>)";
  const std::string exclusive =
      R"(<ds:Transform Algorithm="http://www.w3.org/2001/10/xml-exc-c14n#"/>)";
  const auto with = [&](const std::string& transforms) {
    return SignedByTemplate("<ds:Transforms>" + enveloped + exclusive + "</ds:Transforms>",
                            transforms);
  };
  const std::string begin = "<ds:Transforms>";
  const std::string end = "</ds:Transforms>";
  std::vector<TokenCase> cases{
      {"enveloped and exclusive", with(begin + enveloped + exclusive + end), Fate::kAccepted},
      {"enveloped", with(begin + enveloped + end), Fate::kAccepted},
      {"XPath that selects all", with(begin + enveloped + kXPathTransform + end),
       Fate::kBadSignature},
      {"canonicalised twice", with(begin + enveloped + exclusive + exclusive + end),
       Fate::kBadSignature},
      {"none", with(""), Fate::kBadSignature},
      {"not enveloped", with(begin + exclusive + end), Fate::kBadSignature},
      {"exclusive first", WithSignedInfo(enveloped + exclusive + end, exclusive + enveloped + end),
       Fate::kBadSignature}};
  for (const char* algorithm :
       {"", "urn:unknown", "http://www.w3.org/TR/1999/REC-xslt-19991116",
        "http://www.w3.org/TR/1999/REC-xpath-19991116", "http://www.w3.org/2002/06/xmldsig-filter2",
        "http://www.w3.org/2000/09/xmldsig#base64", "http://www.w3.org/2006/12/xml-c14n11",
        "http://www.w3.org/2001/10/xml-exc-c14n# "}) {
    const std::string transform =
        R"(<ds:Transform Algorithm=")" + std::string(algorithm) + R"("/></ds:Transforms>)";
    cases.push_back({std::string("transform '") + algorithm + "'",
                     WithSignedInfo("</ds:Transforms>", transform), Fate::kBadSignature});
  }
  return cases;
}

std::vector<TokenCase> AlgorithmCases() {
  std::vector<TokenCase> cases{
      {"signed again", Resigned(OriginalAssertion(), Trusted()), Fate::kAccepted}};
  const std::string method = "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha256";
  for (const std::string& other :
       {std::string(), method + " ", " " + method,
        std::string("http://www.w3.org/2001/04/xmldsig-more#ECDSA-SHA256"),
        std::string("http://www.w3.org/2001/04/xmldsig-more#rsa-sha256"),
        std::string("http://www.w3.org/2001/04/xmldsig-more#hmac-sha256"),
        std::string("http://www.w3.org/2000/09/xmldsig#hmac-sha1"),
        std::string("http://www.w3.org/2000/09/xmldsig#rsa-sha1"),
        std::string("http://www.w3.org/2001/04/xmldsig-more#rsa-md5"),
        std::string("http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha1"),
        std::string("http://www.w3.org/2001/04/xmlenc#sha256")}) {
    cases.push_back({"method '" + other + "'", WithSignedInfo(method, other), Fate::kBadSignature});
  }
  for (const char* digest :
       {"", "http://www.w3.org/2001/04/xmlenc#sha256 ", "http://www.w3.org/2001/04/xmlenc#SHA256",
        "http://www.w3.org/2001/04/xmldsig-more#md5", "http://www.w3.org/2000/09/xmldsig#sha1"}) {
    cases.push_back({std::string("digest '") + digest + "'",
                     WithSignedInfo("http://www.w3.org/2001/04/xmlenc#sha256", digest),
                     Fate::kBadSignature});
  }
  DevSts::SignOptions options;
  options.digest = DevSts::DigestAlgorithm::Sha1;
  cases.push_back({"digested with SHA-1", AssertionText().ToSignedXml(Trusted(), options),
                   Fate::kBadSignature});
  options.digest = DevSts::DigestAlgorithm::Sha512;
  cases.push_back(
      {"digested with SHA-512", AssertionText().ToSignedXml(Trusted(), options), Fate::kAccepted});
  const auto inclusive = SignedByTemplate(
      R"(CanonicalizationMethod Algorithm="http://www.w3.org/2001/10/xml-exc-c14n#")",
      R"(CanonicalizationMethod Algorithm="http://www.w3.org/2006/12/xml-c14n11")");
  cases.push_back({"canonicalised with another method", inclusive, Fate::kBadSignature});
  return cases;
}

std::vector<TokenCase> SignatureValueCases() {
  const std::string original = OriginalAssertion();
  const std::vector<unsigned char> value = SignatureValueOf(original);
  const auto halves = [&value](bool isFirstZero, bool isSecondZero, unsigned char octet) {
    std::vector<unsigned char> other = value;
    const auto middle = other.begin() + static_cast<std::ptrdiff_t>(other.size() / 2);
    if (isFirstZero) {
      std::fill(other.begin(), middle, octet);
    }
    if (isSecondZero) {
      std::fill(middle, other.end(), octet);
    }
    return other;
  };
  std::vector<unsigned char> longer = value;
  longer.push_back(0);
  const std::vector<unsigned char> shorter(value.begin(), value.end() - 1);
  std::vector<unsigned char> flipped = value;
  flipped.back() ^= 1;
  const std::string digest = Between(original, "<ds:DigestValue>", "</ds:DigestValue>");
  std::vector<TokenCase> cases{{"original", original, Fate::kAccepted}};
  for (const auto& other : {halves(true, false, 0), halves(false, true, 0), halves(true, true, 0),
                            halves(true, false, 0xFF), halves(false, true, 0xFF), InDer(value),
                            longer, shorter, flipped}) {
    cases.push_back({"value " + std::to_string(cases.size()), WithSignatureValue(original, other),
                     Fate::kBadSignature});
  }
  for (const char* other : {"AA==", "AAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAA="}) {
    cases.push_back(
        {std::string("digest ") + other,
         Resigned(Replaced(original, digest,
                           "<ds:DigestValue>" + std::string(other) + "</ds:DigestValue>"),
                  Trusted()),
         Fate::kBadSignature});
  }
  return cases;
}

}  // namespace SsoClient::Testing
