#include "soap/element_reader.h"

#include <algorithm>
#include <optional>

#include "soap/fault.h"
#include "xml/document.h"
#include "xml/namespaces.h"

namespace DevSts {
namespace {

std::string NameOf(const xmlNode* element) {
  return std::string(LocalName(element));
}

void RequireNoText(const xmlNode* element) {
  for (const xmlNode* child = element->children; child != nullptr; child = child->next) {
    const bool isText = child->type == XML_TEXT_NODE || child->type == XML_CDATA_SECTION_NODE;
    if (isText && xmlIsBlankNode(child) == 0) {
      ThrowInvalidRequest("Unexpected text in " + NameOf(element));
    }
  }
}

Time ReadTime(const xmlNode* element) {
  const std::optional<Time> time = TimeFromText(PlainText(element));
  if (!time) {
    ThrowInvalidRequest(NameOf(element) + " is not a time");
  }
  return *time;
}

bool IsOneOf(const xmlAttr* attribute, const std::vector<AttributeName>& names) {
  const std::string_view uri =
      attribute->ns != nullptr ? AsText(attribute->ns->href) : std::string_view();
  return std::any_of(names.begin(), names.end(), [&](const AttributeName& name) {
    return AsText(attribute->name) == name.name &&
           uri == (name.namespaceUri != nullptr ? name.namespaceUri : "");
  });
}

}  // namespace

ElementReader::ElementReader(xmlNode* element)
    : element_(element), children_(ChildElements(element)) {
  RequireNoText(element);
}

xmlNode* ElementReader::Expect(const char* namespaceUri, const char* localName) {
  xmlNode* child = Optional(namespaceUri, localName);
  if (child == nullptr) {
    const std::string found = AtEnd() ? "nothing" : NameOf(children_[next_]);
    ThrowInvalidRequest("Expected " + std::string(localName) + " (" + namespaceUri + ") in " +
                        NameOf(element_) + ", found " + found);
  }
  return child;
}

xmlNode* ElementReader::Optional(const char* namespaceUri, const char* localName) {
  if (AtEnd() || !IsElement(children_[next_], namespaceUri, localName)) {
    return nullptr;
  }
  return children_[next_++];
}

void ElementReader::End() const {
  if (!AtEnd()) {
    ThrowInvalidRequest("Unexpected element " + NameOf(children_[next_]) + " in " +
                        NameOf(element_));
  }
}

void RequireAttributes(const xmlNode* element, const std::vector<AttributeName>& names) {
  for (const xmlAttr* attribute = element->properties; attribute != nullptr;
       attribute = attribute->next) {
    if (!IsOneOf(attribute, names)) {
      ThrowInvalidRequest("Unexpected attribute " + std::string(AsText(attribute->name)) + " on " +
                          NameOf(element));
    }
  }
  for (const AttributeName& name : names) {
    if (!HasAttribute(element, name.name, name.namespaceUri)) {
      ThrowInvalidRequest("Missing attribute " + std::string(name.name) + " on " + NameOf(element));
    }
  }
}

std::string PlainText(const xmlNode* element) {
  RequireAttributes(element, {});
  return TextOf(element);
}

std::string TextOf(const xmlNode* element) {
  if (!ChildElements(element).empty()) {
    ThrowInvalidRequest("Unexpected element in " + NameOf(element));
  }
  return ContentOf(element);
}

void RequireText(const xmlNode* element, const std::string& expected) {
  const std::string text = PlainText(element);
  if (text != expected) {
    ThrowInvalidRequest("Unsupported " + NameOf(element) + ": " + text);
  }
}

void RequireRequestType(const xmlNode* element, const std::string& expected) {
  const std::string text = PlainText(element);
  if (text != expected) {
    ThrowInvalidRequest("The RequestType does not fit the SOAPAction: " + text);
  }
}

bool BooleanOf(const std::string& text, const std::string& place) {
  if (text != "true" && text != "false") {
    ThrowInvalidRequest(place + " is neither true nor false");
  }
  return text == "true";
}

std::pair<Time, Time> ReadPeriod(xmlNode* element) {
  ElementReader reader(element);
  const Time created = ReadTime(reader.Expect(kWsuNamespace, "Created"));
  const Time expires = ReadTime(reader.Expect(kWsuNamespace, "Expires"));
  reader.End();
  return {created, expires};
}

}  // namespace DevSts
