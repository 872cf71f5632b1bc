#include "xml_mutator.h"

#include <algorithm>
#include <array>
#include <random>
#include <string>
#include <string_view>
#include <vector>

#include "input.h"

extern "C" std::size_t LLVMFuzzerMutate(std::uint8_t* data, std::size_t size, std::size_t maxSize);

namespace Fuzz {
namespace {

constexpr std::array kValues{"",
                             " ",
                             "0",
                             "1",
                             "-1",
                             "+2",
                             "007",
                             "4294967295",
                             "2.0",
                             "2.1",
                             "true",
                             "FALSE",
                             "yes",
                             "_a1",
                             "a1",
                             "#_a",
                             "a@b@c",
                             "@a",
                             "a@",
                             "a\\b\\c",
                             "\\a",
                             "x:y",
                             "AAEC",
                             "AA==",
                             "AAE=\n",
                             "AB==",
                             "urn:q",
                             "4294967296",
                             "http://www.w3.org/2000/09/xmldsig#",
                             "urn:oasis:names:tc:SAML:2.0:assertion",
                             "2024-03-05T24:00:00Z",
                             "9999-12-31T23:59:59.9999999-00:00",
                             "0001-01-01T00:00:00+00:01"};
constexpr std::array kAttributes{
    " q=\"\"",       " xmlns:q=\"urn:q\"",      " xmlns=\"urn:q\"", " xml:lang=\"en\"", " Id=\"x\"",
    " Format=\"f\"", " xsi:type=\"xs:string\"", " Count=\"1\"",     " Name=\"n\""};
constexpr std::array kPieces{"<!---->",
                             "<!--x-->",
                             "<?p x?>",
                             "<x/>",
                             "x",
                             " \n",
                             "<![CDATA[]]>",
                             "<![CDATA[x]]>",
                             "&amp;",
                             "&#13;",
                             "<x xmlns=\"urn:x\">y</x>"};

constexpr std::string_view kSeparators = "@\\#:/-+=. 0";

/// A part of the text.
struct Range {
  std::size_t begin = 0;
  std::size_t end = 0;

  std::string In(const std::string& xml) const { return xml.substr(begin, end - begin); }
};

class Mutation {
 public:
  Mutation(std::string xml, unsigned seed) : xml_(std::move(xml)), random_(seed) {}

  std::string Result() {
    switch (Below(11)) {
      case 0:
        InsertAttribute();
        break;
      case 1:
        Replace(OneOf(Attributes()), "");
        break;
      case 2:
        CopyAttribute();
        break;
      case 3:
        Replace(OneOf(Values()), OneOf(kValues));
        break;
      case 4:
        Replace(OneOf(FullTexts()), OneOf(kValues));
        break;
      case 5:
        InsertPiece();
        break;
      case 6:
        Replace(OneOf(Elements()), "");
        break;
      case 7:
        Change(OneOf(Values()));
        break;
      case 8:
        Change(OneOf(FullTexts()));
        break;
      default:
        CopyElement();
    }
    return xml_;
  }

 private:
  std::size_t Below(std::size_t bound) { return random_() % bound; }
  template <class List>
  typename List::value_type OneOf(const List& list) {
    return list.empty() ? typename List::value_type() : list[Below(list.size())];
  }
  void Replace(const Range& range, const std::string& text) {
    xml_.replace(range.begin, range.end - range.begin, text);
  }
  void InsertAttribute() { Replace(OneOf(NameEnds()), OneOf(kAttributes)); }
  void CopyAttribute() {
    const std::string attribute = OneOf(Attributes()).In(xml_);
    Replace(OneOf(NameEnds()), attribute);
  }
  // Sometimes inside of a text.
  void InsertPiece() {
    const Range text = OneOf(Texts());
    const std::size_t place = text.begin + Below(text.end - text.begin + 1);
    Replace({place, place}, OneOf(kPieces));
  }
  void CopyElement() {
    const std::string element = OneOf(Elements()).In(xml_);
    const std::size_t place = OneOf(Texts()).begin;
    Replace({place, place}, element);
  }

  // Changes one character of a value, or inserts one that separates something.
  void Change(const Range& range) {
    if (range.begin == range.end) {
      return;
    }
    const std::size_t place = range.begin + Below(range.end - range.begin);
    switch (Below(4)) {
      case 0:
        xml_.erase(place, 1);
        break;
      case 1:
        xml_.insert(place, 1, OneOf(kSeparators));
        break;
      case 2:
        xml_[place] = xml_[range.begin + Below(range.end - range.begin)];
        break;
      default:
        xml_[place] = static_cast<char>(xml_[place] ^ 1 << Below(6));
    }
  }

  std::vector<Range> FullTexts() const {
    std::vector<Range> texts = Texts();
    std::erase_if(texts, [](const Range& text) { return text.begin == text.end; });
    return texts;
  }
  // What is between two tags, most often nothing.
  std::vector<Range> Texts() const {
    std::vector<Range> texts;
    for (std::size_t end = xml_.find('>'); end != std::string::npos;
         end = xml_.find('>', end + 1)) {
      texts.push_back({end + 1, std::min(xml_.find('<', end), xml_.size())});
    }
    return texts;
  }
  // The places after the names of start tags.
  std::vector<Range> NameEnds() const {
    std::vector<Range> places;
    for (std::size_t at = xml_.find('<'); at != std::string::npos; at = xml_.find('<', at + 1)) {
      const std::size_t end = xml_.find_first_of(" />", at + 1);
      if (end != std::string::npos && end > at + 1) {
        places.push_back({end, end});
      }
    }
    return places;
  }
  // What is between double quotes after equals signs.
  std::vector<Range> Values() const {
    std::vector<Range> values;
    for (std::size_t at = xml_.find("=\""); at != std::string::npos;
         at = xml_.find("=\"", at + 1)) {
      const std::size_t end = xml_.find('"', at + 2);
      if (end != std::string::npos) {
        values.push_back({at + 2, end});
      }
    }
    return values;
  }
  // From the blank before the name to the second quote.
  std::vector<Range> Attributes() const {
    std::vector<Range> attributes;
    for (const Range& value : Values()) {
      const std::size_t begin = xml_.rfind(' ', value.begin);
      if (begin != std::string::npos) {
        attributes.push_back({begin, value.end + 1});
      }
    }
    return attributes;
  }
  // Up to the first end tag of their name; without those that contain one of the same name.
  std::vector<Range> Elements() const {
    std::vector<Range> elements;
    for (const Range& name : NameEnds()) {
      const std::size_t begin = xml_.rfind('<', name.begin);
      const std::size_t tagEnd = xml_.find('>', name.begin);
      if (tagEnd == std::string::npos) {
        continue;
      }
      if (xml_[tagEnd - 1] == '/') {
        elements.push_back({begin, tagEnd + 1});
        continue;
      }
      const std::string endTag = "</" + xml_.substr(begin + 1, name.begin - begin - 1) + ">";
      const std::size_t end = xml_.find(endTag, tagEnd);
      if (end != std::string::npos) {
        elements.push_back({begin, end + endTag.size()});
      }
    }
    return elements;
  }

  std::string xml_;
  std::minstd_rand random_;
};

}  // namespace

std::size_t MutateXml(std::uint8_t* data, std::size_t size, std::size_t maxSize, unsigned seed) {
  if (seed % 3 != 0) {
    const std::string changed = Mutation(TextOf(data, size), seed / 3 + 1).Result();
    if (!changed.empty() && changed.size() <= maxSize) {
      std::copy(changed.begin(), changed.end(), data);
      return changed.size();
    }
  }
  return LLVMFuzzerMutate(data, size, maxSize);
}

}  // namespace Fuzz
