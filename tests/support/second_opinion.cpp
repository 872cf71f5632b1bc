#include "support/second_opinion.h"

#include <cstddef>
#include <regex>
#include <string>
#include <utility>

#include <devsts/xml_security.h>

#include "support/assertion_text.h"

namespace SsoClient::Testing {
namespace {

// The attribute that the parser's error message names, "xmlns" or "xmlns:p"; "" for other errors.
std::string MalformedAttributeIn(const std::string& error) {
  const std::size_t begin = error.find(": xmlns");
  const std::size_t end = begin == std::string::npos ? begin : error.find(": '", begin + 2);
  if (end == std::string::npos || !error.ends_with("' is not a valid URI")) {
    return "";
  }
  return error.substr(begin + 2, end - begin - 2);
}

// Replaces every declaration of the prefix that the parser's error message names, except those of a
// well-formed text. Returns false for another error and if there is nothing to replace.
bool ReplaceMalformedNamespace(std::string& xml, const std::string& error) {
  const std::string attribute = MalformedAttributeIn(error);
  if (attribute.empty()) {
    return false;
  }
  const std::regex declaration(attribute + "[ \\t\\r\\n]*=[ \\t\\r\\n]*(\"[^\"]*\"|'[^']*')");
  static const std::string kGood = "urn:replaced";
  std::string result;
  bool isChanged = false;
  auto rest = xml.cbegin();
  for (std::sregex_iterator at(xml.begin(), xml.end(), declaration), end; at != end; ++at) {
    const std::string text = at->str();
    const bool isGood = NamespaceDeclarations().find(text) != std::string::npos ||
                        text.find(kGood) != std::string::npos;
    result.append(rest, (*at)[0].first);
    result += isGood ? text : attribute + "=\"" + kGood + "\"";
    isChanged = isChanged || !isGood;
    rest = (*at)[0].second;
  }
  result.append(rest, xml.cend());
  xml = result;
  return isChanged;
}

}  // namespace

std::string SecondOpinionOf(std::string xml) {
  return SecondOpinionOf(std::move(xml), TrustedCredential().certificatePem);
}

std::string SecondOpinionOf(std::string xml, const std::string& certificatePem) {
  while (true) {
    const DevSts::VerifyResult opinion = DevSts::VerifyXml(xml, certificatePem);
    if (opinion) {
      return "";
    }
    if (!ReplaceMalformedNamespace(xml, opinion.reason)) {
      return opinion.reason.empty() ? "refused without a reason" : opinion.reason;
    }
  }
}

}  // namespace SsoClient::Testing
