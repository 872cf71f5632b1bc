#ifndef TARNIK_TESTS_SUPPORT_RANDOM_XML_H
#define TARNIK_TESTS_SUPPORT_RANDOM_XML_H

#include <cstddef>
#include <random>
#include <string>
#include <vector>

namespace Tarnik::Testing {

/// Generates well-formed documents that exercise the rules of Canonical XML.
class RandomXml {
 public:
  explicit RandomXml(unsigned seed) : random_(seed) {}

  std::string Document() {
    std::string text = Chance(3) ? "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n" : "";
    elements_ = 0;
    text += Misc();
    text += Element({{"", ""}}, 0);
    text += Misc();
    return text;
  }

  /// The number of elements of the last document.
  int Elements() const { return elements_; }

  int Below(int limit) { return std::uniform_int_distribution<int>(0, limit - 1)(random_); }
  /// True in one of `n` cases on average.
  bool Chance(int n) { return Below(n) == 0; }

  template <class T>
  const T& Pick(const std::vector<T>& values) {
    return values[static_cast<std::size_t>(Below(static_cast<int>(values.size())))];
  }

 private:
  struct Binding {
    std::string prefix;
    std::string uri;
  };
  using Scope = std::vector<Binding>;

  static const std::string* Find(const Scope& scope, const std::string& prefix) {
    for (auto binding = scope.rbegin(); binding != scope.rend(); ++binding) {
      if (binding->prefix == prefix) {
        return &binding->uri;
      }
    }
    return nullptr;
  }

  std::string Misc() {
    std::string text;
    for (int count = Below(3); count > 0; --count) {
      text += Chance(2) ? "<!-- around\n \"it\" -->\n" : "<?around  some <data> & more ?>\n";
    }
    return text;
  }

  std::string Text() {
    static const std::vector<std::string> kTexts = {
        "plain",
        "a longer run of plain characters, past any block",
        "&lt;&amp;&gt;\"'",
        "]]&gt;",
        "&#13;",
        "\r\n",
        "\r",
        "\n  \t",
        "\xC3\xA9\xE2\x82\xAC\xF0\x9F\x98\x80",
        "&#x10FFFF;",
        "&#9;&#10;&#13;",
        "<![CDATA[<cdata> & ]] > \r\n]]>",
        "&quot;&apos;"};
    return Pick(kTexts);
  }

  std::string Value() {
    static const std::vector<std::string> kValues = {"",
                                                     "v",
                                                     "a b  c",
                                                     "&quot;&apos;",
                                                     "&lt;&amp;>",
                                                     "\t\n\r\n",
                                                     "&#9;&#10;&#13;",
                                                     "\xC3\xBC",
                                                     "  lead and trail ",
                                                     "&#x1F600;",
                                                     "it&apos;s"};
    return Pick(kValues);
  }

  // No markup characters: libxml2 does not escape them in namespace names, so its output cannot be
  // compared there.
  std::string Uri() {
    static const std::vector<std::string> kUris = {
        "urn:a", "urn:b",        "http://x.example/",  "http://x.example/?q=1",
        "urn:A", "urn:a:longer", "mailto:q@x.example", "urn:%C3%A9"};
    return Pick(kUris);
  }

  std::string Declarations(Scope& scope) {
    static const std::vector<std::string> kPrefixes = {"", "a", "b", "c", "aa", "Z", "_", "x-y"};
    std::string text;
    std::vector<std::string> done;
    for (int count = Chance(2) ? 0 : Below(5); count > 0; --count) {
      const std::string prefix = Pick(kPrefixes);
      bool repeated = false;
      for (const std::string& earlier : done) {
        repeated = repeated || earlier == prefix;
      }
      if (repeated) {
        continue;
      }
      done.push_back(prefix);
      const std::string uri = prefix.empty() && Chance(3) ? "" : Uri();
      scope.push_back({prefix, uri});
      text += (prefix.empty() ? " xmlns='" : " xmlns:" + prefix + "='") + uri + "'";
    }
    return text;
  }

  std::string AnyPrefix(const Scope& scope) {
    const std::string& prefix = Pick(scope).prefix;
    return prefix.empty() ? "" : prefix + ":";
  }

  std::string Attributes(const Scope& scope) {
    static const std::vector<std::string> kLocals = {"z", "a", "B", "id", "a-b", "long.name"};
    std::string text;
    std::vector<std::string> done;
    for (int count = Below(5); count > 0; --count) {
      const std::string& prefix = Pick(scope).prefix;
      const std::string local = Pick(kLocals);
      const std::string key = (prefix.empty() ? "" : *Find(scope, prefix)) + "|" + local;
      bool repeated = false;
      for (const std::string& earlier : done) {
        repeated = repeated || earlier == key;
      }
      if (!repeated) {
        done.push_back(key);
        text += " " + (prefix.empty() ? "" : prefix + ":") + local + "=\"" + Quote(Value()) + "\"";
      }
    }
    static const std::vector<std::string> kXml = {" xml:lang='en'", " xml:space='preserve'",
                                                  " xml:lang=''"};
    if (Chance(5)) {
      text += Pick(kXml);
    }
    return text;
  }

  static std::string Quote(std::string value) {
    for (std::size_t at = value.find('"'); at != std::string::npos; at = value.find('"', at)) {
      value.replace(at, 1, "&quot;");
    }
    return value;
  }

  std::string Element(Scope scope, int depth) {
    static const std::vector<std::string> kLocals = {"e", "Element", "x", "y.z", "_"};
    ++elements_;
    const std::string declarations = Declarations(scope);
    const std::string name = AnyPrefix(scope) + Pick(kLocals);
    std::string attributes = Attributes(scope);
    attributes = Chance(2) ? declarations + attributes : attributes + declarations;
    std::string content;
    for (int count = depth > 5 ? 0 : Below(5); count > 0; --count) {
      const int kind = Below(8);
      if (kind < 3) {
        content += Element(scope, depth + 1);
      } else if (kind < 6) {
        content += Text();
      } else {
        content += kind == 6 ? "<!-- a - comment -->" : "<?target some data?>";
      }
    }
    if (content.empty() && Chance(2)) {
      return "<" + name + attributes + "/>";
    }
    return "<" + name + attributes + ">" + content + "</" + name + " >";
  }

  std::mt19937 random_;
  int elements_ = 0;
};

}  // namespace Tarnik::Testing

#endif
