#include "xml_edits.h"

#include <algorithm>
#include <cstddef>
#include <utility>

namespace Fuzz {
namespace {

const char* const kContents[] = {"<!--x-->",
                                 "<?x y?>",
                                 "<![CDATA[]]>",
                                 "<![CDATA[a]]>",
                                 "&#13;",
                                 "\r\n",
                                 " ",
                                 "&amp;",
                                 "A",
                                 "<x/>",
                                 "<x Id=\"_a\"/>",
                                 "<x xml:id=\"_d\"/>",
                                 "<x id=\"_c\"/>",
                                 "<x xmlns=\"\"/>",
                                 "<x ID=\"_b\" Id=\"_a\"/>"};

const char* const kAttributes[] = {" Id=\"_a\"",         " ID=\"_b\"",
                                   " id=\"_c\"",         " iD=\"_a\"",
                                   " xml:id=\"_d\"",     " xml:lang=\"de\"",
                                   " xmlns=\"urn:q\"",   " xmlns=\"\"",
                                   " xmlns:q=\"urn:q\"", " xmlns:a=\"urn:q\"",
                                   " q=\"1\"",           " URI=\"\"",
                                   " Type=\"urn:t\"",    " "};

std::size_t Below(FuzzedDataProvider& input, std::size_t bound) {
  return input.ConsumeIntegralInRange<std::size_t>(0, bound - 1);
}

template <std::size_t count>
const char* OneOf(FuzzedDataProvider& input, const char* const (&list)[count]) {
  return list[Below(input, count)];
}

// The first whole element at or after a place, or nothing: its begin and its length.
std::pair<std::size_t, std::size_t> ElementAfter(const std::string& xml, std::size_t from) {
  const std::size_t begin = xml.find('<', from);
  const std::size_t nameEnd =
      begin == std::string::npos ? begin : xml.find_first_of(" />", begin + 1);
  if (nameEnd == std::string::npos || nameEnd == begin + 1) {
    return {0, 0};
  }
  const std::string endTag = "</" + xml.substr(begin + 1, nameEnd - begin - 1) + ">";
  const std::size_t end = xml.find(endTag, nameEnd);
  return end == std::string::npos ? std::pair<std::size_t, std::size_t>{0, 0}
                                  : std::pair{begin, end + endTag.size() - begin};
}

void TakeElementElsewhere(std::string& xml, FuzzedDataProvider& input) {
  const auto [begin, length] = ElementAfter(xml, Below(input, xml.size()));
  const std::string element = xml.substr(begin, length);
  if (input.ConsumeBool()) {
    xml.erase(begin, length);
  }
  const std::size_t tag = xml.find('>', Below(input, xml.size() + 1));
  xml.insert(tag == std::string::npos ? xml.size() : tag + 1, element);
}

void InsertAtTag(std::string& xml, FuzzedDataProvider& input) {
  const std::size_t tag = xml.find('>', Below(input, xml.size()));
  if (tag == std::string::npos) {
    return;
  }
  if (input.ConsumeBool()) {
    xml.insert(tag + 1, OneOf(input, kContents));
    return;
  }
  const bool endsEmpty = tag > 0 && xml[tag - 1] == '/';
  xml.insert(endsEmpty ? tag - 1 : tag, OneOf(input, kAttributes));
}

}  // namespace

void EditXml(std::string& xml, FuzzedDataProvider& input) {
  if (xml.empty()) {
    return;
  }
  switch (Below(input, 8)) {
    case 0:
      xml[Below(input, xml.size())] = static_cast<char>(Below(input, 256));
      return;
    case 1:
      xml.erase(Below(input, xml.size()), 1 + Below(input, 8));
      return;
    case 2: {
      const std::string piece = xml.substr(Below(input, xml.size()), 1 + Below(input, 40));
      xml.insert(Below(input, xml.size()), piece);
      return;
    }
    case 3:
      TakeElementElsewhere(xml, input);
      return;
    default:
      InsertAtTag(xml, input);
  }
}

}  // namespace Fuzz
