#include "support/token_editor.h"

#include <array>
#include <cstddef>
#include <functional>
#include <string>
#include <utility>

#include <devsts/xml_security.h>

#include "support/assertion_text.h"
#include "support/forgeries.h"

namespace SsoClient::Testing {
namespace {

// Texts whose insertion may change the canonical form.
constexpr std::array kSnippets{" ",
                               "\t",
                               "\r\n",
                               "\n",
                               "&#13;",
                               "&#xA;",
                               "&#x9;",
                               "&#32;",
                               "&amp;",
                               "<!---->",
                               "<!--x-->",
                               "<?x y?>",
                               "<![CDATA[]]>",
                               "<![CDATA[ ]]>",
                               "<![CDATA[a]]>",
                               "<x/>",
                               "<x ID=\"_a1\"/>",
                               "<x xmlns=\"\"/>",
                               " xmlns:q=\"urn:q\"",
                               " xmlns=\"urn:q\"",
                               " xmlns=\"\"",
                               " xmlns:ds=\"urn:q\"",
                               " xml:lang=\"en\"",
                               " xml:space=\"preserve\"",
                               " xml:id=\"x\"",
                               " Id=\"x\"",
                               " xmlns:xml=\"http://www.w3.org/XML/1998/namespace\"",
                               "\xEF\xBB\xBF",
                               "<?xml version=\"1.0\"?>",
                               "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n",
                               "\xC2\x85",
                               "\xE2\x80\xA8",
                               "=",
                               "A",
                               "ds:",
                               " URI=\"\"",
                               "#",
                               "<!DOCTYPE a>"};

// An element that begins at or after `from`, up to the first end tag of its name.
std::pair<std::size_t, std::size_t> ElementAfter(const std::string& xml, std::size_t from) {
  std::size_t begin = xml.find('<', from);
  while (begin != std::string::npos && begin + 1 < xml.size() && xml[begin + 1] == '/') {
    begin = xml.find('<', begin + 1);
  }
  if (begin == std::string::npos) {
    return {0, 0};
  }
  const std::size_t nameEnd = xml.find_first_of(" />\t\r\n", begin + 1);
  if (nameEnd == std::string::npos) {
    return {0, 0};
  }
  const std::string endTag = "</" + xml.substr(begin + 1, nameEnd - begin - 1) + ">";
  const std::size_t end = xml.find(endTag, nameEnd);
  return end == std::string::npos ? std::pair<std::size_t, std::size_t>{0, 0}
                                  : std::pair{begin, end + endTag.size()};
}

}  // namespace

TokenEditor::TokenEditor(std::function<std::size_t(std::size_t)> below)
    : below_(std::move(below)) {}

std::string TokenEditor::SignedXml() {
  DevSts::SignOptions options;
  options.digest = static_cast<DevSts::DigestAlgorithm>(below_(3));
  options.canonicalization = static_cast<DevSts::CanonicalMode>(below_(4));
  options.keyInfo =
      below_(2) == 0 ? DevSts::KeyInfoContent::X509Data : DevSts::KeyInfoContent::None;
  if (below_(3) == 0) {
    options.inclusivePrefixes = {"xs", "rsa", "#default"};
  }
  AssertionText text;
  if (below_(2) == 0) {
    text.Delegate();
  }
  if (below_(3) == 0) {
    text.conditions += "\r\n\t<!-- a comment -->&#10;";
  }
  return text.ToSignedXml(TrustedCredential(), options);
}

void TokenEditor::Edit(std::string& xml) {
  if (xml.empty()) {
    return;
  }
  switch (below_(8)) {
    case 0:
      xml[below_(xml.size())] = static_cast<char>(below_(256));
      return;
    case 1:
      xml.erase(below_(xml.size()), 1 + below_(8));
      return;
    case 2: {
      const std::string piece = xml.substr(below_(xml.size()), 1 + below_(40));
      xml.insert(below_(xml.size()), piece);
      return;
    }
    case 3:
      xml.insert(below_(xml.size()), Snippet());
      return;
    case 4:
      MoveElement(xml);
      return;
    default:
      InsertAtTag(xml);
  }
}

std::string TokenEditor::Snippet() {
  return kSnippets[below_(kSnippets.size())];
}

// Mostly a short text, sometimes a whole forged assertion or its signature.
std::string TokenEditor::Insertion() {
  if (below_(8) != 0) {
    return Snippet();
  }
  const auto id = AllForgedIds()[below_(AllForgedIds().size())];
  const auto signature = AllForgedSignatures()[below_(AllForgedSignatures().size())];
  const std::string forged = ForgedAssertion(id, signature, OriginalAssertion());
  return below_(2) == 0 ? forged : SignatureOf(forged);
}

// After a tag, before its end, or at either end of the text, where edits may be harmless.
void TokenEditor::InsertAtTag(std::string& xml) {
  const std::size_t from = below_(xml.size() + 1);
  const std::size_t tag = xml.find('>', from);
  if (tag == std::string::npos) {
    xml.insert(below_(2) == 0 ? 0 : xml.size(), Insertion());
    return;
  }
  std::size_t place = below_(2) == 0 ? tag + 1 : tag;
  if (place == tag && tag > 0 && xml[tag - 1] == '/') {
    --place;
  }
  xml.insert(place, Insertion());
}

// Moves or copies an element to the place after another tag.
void TokenEditor::MoveElement(std::string& xml) {
  const auto [begin, end] = ElementAfter(xml, below_(xml.size()));
  const std::string element = xml.substr(begin, end - begin);
  if (below_(2) == 0) {
    xml.erase(begin, end - begin);
  }
  const std::size_t tag = xml.find('>', below_(xml.size() + 1));
  xml.insert(tag == std::string::npos ? xml.size() : tag + 1, element);
}

}  // namespace SsoClient::Testing
