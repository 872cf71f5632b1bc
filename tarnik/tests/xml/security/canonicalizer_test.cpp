#include <string>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/core/writer.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/security/canonicalizer.h>
#include <tarnik/xml/security/xml_security_exception.h>

#include "support/algorithm_uris.h"
#include "support/thrown_message.h"
#include "support/xml_text.h"
#include "xml/security/c14n.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;
using namespace Tarnik::Xml::Security;

std::string Canonical(const Node* node, const char* algorithm,
                      const std::vector<std::string>& prefixes = {}) {
  const Ref<StringWriter> writer = CreateStringWriter();
  CreateCanonicalizer(algorithm, prefixes)->Canonicalize(node, writer.get());
  return writer->TakeText();
}

std::string Canonical(const std::string& text, const char* algorithm) {
  return Canonical(ParseXml(text).get(), algorithm);
}

TEST(CanonicalizerTest, ComparesTheWholeAlgorithmUri) {
  const std::string text = "<a><!--c--></a>";
  EXPECT_EQ(Canonical(text, kInclusive), "<a></a>");
  EXPECT_EQ(Canonical(text, "http://www.w3.org/TR/2001/REC-xml-c14n-20010315#"), "<a></a>");
  EXPECT_EQ(Canonical(text, kInclusiveWithComments), "<a><!--c--></a>");
  EXPECT_EQ(Canonical(text, kExclusive), "<a></a>");
  EXPECT_EQ(Canonical(text, kExclusiveWithComments), "<a><!--c--></a>");
  for (const std::string& uri :
       {std::string(), std::string(kInclusive) + " ", " " + std::string(kInclusive),
        std::string("http://www.w3.org/TR/2001/REC-xml-c14n-20010315#withcomments"),
        std::string("http://www.w3.org/2001/10/xml-exc-c14n"),
        std::string("HTTP://www.w3.org/2001/10/xml-exc-c14n#"),
        std::string("http://www.w3.org/2006/12/xml-c14n11")}) {
    EXPECT_EQ(ThrownMessage<XmlSecurityException>([&uri] { CreateCanonicalizer(uri); }),
              "The canonicalisation algorithm '" + uri + "' is not supported.");
  }
}

// Canonical XML 1.0, section 2.3, "Namespace Axis".
TEST(CanonicalizerTest, NeverDeclaresThePrefixXml) {
  const std::string text =
      "<a xmlns:xml=\"http://www.w3.org/XML/1998/namespace\" xml:lang=\"en\"></a>";
  for (const char* algorithm : {kInclusive, kExclusive}) {
    EXPECT_EQ(Canonical(text, algorithm), "<a xml:lang=\"en\"></a>");
  }
  EXPECT_EQ(Canonical(ParseXml(text).get(), kExclusive, {"xml"}), "<a xml:lang=\"en\"></a>");
}

TEST(CanonicalizerTest, AcceptsPrefixesOnlyForTheExclusiveMethod) {
  EXPECT_THROW(CreateCanonicalizer(kInclusive, {"p"}), XmlSecurityException);
  EXPECT_NO_THROW(CreateCanonicalizer(kExclusive, {"p"}));
}

TEST(CanonicalizerTest, RefusesNullAndLeaves) {
  const Ref<Canonicalizer> canonicalizer = CreateCanonicalizer(kExclusive);
  const Ref<Document> document = ParseXml("<a>t</a>");
  const Ref<StringWriter> writer = CreateStringWriter();
  EXPECT_THROW(canonicalizer->Canonicalize(nullptr, writer.get()), InvalidArgumentException);
  EXPECT_THROW(canonicalizer->Canonicalize(document.get(), nullptr), InvalidArgumentException);
  EXPECT_THROW(canonicalizer->Canonicalize(document->RootElement()->FirstChild(), writer.get()),
               InvalidArgumentException);
  EXPECT_EQ(writer->Text(), "");
}

TEST(CanonicalizerTest, PutsLineFeedsAroundTheRootElement) {
  const std::string text = "<?p  a?><!--b--> <r/>\n<!--c--><?d?>";
  EXPECT_EQ(Canonical(text, kInclusiveWithComments), "<?p a?>\n<!--b-->\n<r></r>\n<!--c-->\n<?d?>");
  EXPECT_EQ(Canonical(text, kInclusive), "<?p a?>\n<r></r>\n<?d?>");
}

TEST(CanonicalizerTest, EscapesAsTheStandardRequires) {
  EXPECT_EQ(
      Canonical("<a b='&lt;>&amp;\"&#9;&#10;&#13;'>&lt;&gt;&amp;\"&#9;&#13;\r\n</a>", kInclusive),
      "<a b=\"&lt;>&amp;&quot;&#x9;&#xA;&#xD;\">&lt;&gt;&amp;\"\t&#xD;\n</a>");
}

// The name of a namespace is escaped like an attribute value; otherwise it could forge markup.
TEST(CanonicalizerTest, EscapesNamespaceNames) {
  const std::string text = "<p:a xmlns:p='urn:x\"&gt;&lt;b c=\"&amp;&#10;'/>";
  const std::string expected = "<p:a xmlns:p=\"urn:x&quot;>&lt;b c=&quot;&amp;&#xA;\"></p:a>";
  EXPECT_EQ(Canonical(text, kInclusive), expected);
  EXPECT_EQ(Canonical(text, kExclusive), expected);
  EXPECT_EQ(Canonical(expected, kInclusive), expected);
}

TEST(CanonicalizerTest, SortsDeclarationsAndAttributes) {
  EXPECT_EQ(
      Canonical("<a z='1' b:y='2' a:y='3' xmlns:b='urn:1' xmlns:a='urn:2' xmlns='urn:0' a='4' "
                "xml:lang='en' a:x='5'/>",
                kInclusive),
      "<a xmlns=\"urn:0\" xmlns:a=\"urn:2\" xmlns:b=\"urn:1\" a=\"4\" z=\"1\" "
      "xml:lang=\"en\" b:y=\"2\" a:x=\"5\" a:y=\"3\"></a>");
}

TEST(CanonicalizerTest, DropsSuperfluousDeclarations) {
  EXPECT_EQ(Canonical("<a xmlns='' xmlns:p='urn:p'><b xmlns:p='urn:p'><c xmlns:p='urn:q'/></b></a>",
                      kInclusive),
            "<a xmlns:p=\"urn:p\"><b><c xmlns:p=\"urn:q\"></c></b></a>");
}

TEST(CanonicalizerTest, UndoesTheDefaultNamespaceOnlyWhereOneIsRendered) {
  const std::string text = "<a xmlns='urn:a'><b xmlns=''><c xmlns=''/></b></a>";
  const std::string expected = "<a xmlns=\"urn:a\"><b xmlns=\"\"><c></c></b></a>";
  EXPECT_EQ(Canonical(text, kInclusive), expected);
  EXPECT_EQ(Canonical(text, kExclusive), expected);
  EXPECT_EQ(Canonical("<p:a xmlns:p='urn:p' xmlns='urn:a'><b xmlns=''/></p:a>", kExclusive),
            "<p:a xmlns:p=\"urn:p\"><b></b></p:a>");
}

TEST(CanonicalizerTest, RendersTheContextThatAnElementInherits) {
  const Ref<Document> document = ParseXml(
      "<e:env xmlns:e='urn:e' xmlns:x='urn:x' xmlns='urn:d' xml:lang='en' xml:space='preserve'>"
      "<e:body xml:lang='de' x:id='1'><tok xml:space='default'><e:v/></tok></e:body></e:env>");
  const ElementNode* body = document->RootElement()->FirstChildElement("body");
  const ElementNode* token = body->FirstChildElement("tok");
  EXPECT_EQ(Canonical(token, kInclusive),
            "<tok xmlns=\"urn:d\" xmlns:e=\"urn:e\" xmlns:x=\"urn:x\" xml:lang=\"de\" "
            "xml:space=\"default\"><e:v></e:v></tok>");
  EXPECT_EQ(Canonical(token, kExclusive),
            "<tok xmlns=\"urn:d\" xml:space=\"default\"><e:v xmlns:e=\"urn:e\"></e:v></tok>");
  EXPECT_EQ(Canonical(body, kExclusive, {"#default", "none"}),
            "<e:body xmlns=\"urn:d\" xmlns:e=\"urn:e\" xmlns:x=\"urn:x\" xml:lang=\"de\" "
            "x:id=\"1\"><tok xml:space=\"default\"><e:v></e:v></tok></e:body>");
}

TEST(CanonicalizerTest, RendersUsedPrefixesAgainInEachBranch) {
  EXPECT_EQ(Canonical("<r xmlns:p='urn:p'><p:a><p:b/></p:a><p:a/></r>", kExclusive),
            "<r><p:a xmlns:p=\"urn:p\"><p:b></p:b></p:a><p:a xmlns:p=\"urn:p\"></p:a></r>");
}

TEST(CanonicalizerTest, RefusesRelativeNamespaceNames) {
  for (const char* uri : {"relative", "a/b:c", "/path", "#x", "?q", "//host/x", ":x", "1a:b",
                          " urn:x", "%75rn:x", "a b:c"}) {
    const Ref<Document> document =
        ParseXml("<r xmlns:ok='urn:ok'><o xmlns:p='" + std::string(uri) + "'><i/></o></r>");
    const ElementNode* inner =
        document->RootElement()->FirstChildElement("o")->FirstChildElement("i");
    for (const char* algorithm : {kInclusive, kExclusive}) {
      for (const Node* node :
           {static_cast<const Node*>(document.get()), static_cast<const Node*>(inner)}) {
        EXPECT_EQ(ThrownMessage<XmlSecurityException>([&] { Canonical(node, algorithm); }),
                  "Element 'o' declares a namespace with a relative URI.")
            << uri << " " << algorithm;
      }
    }
  }
  EXPECT_NO_THROW(Canonical("<r xmlns:p='a+-.1:'/>", kInclusive));
}

TEST(CanonicalizerTest, RefusesAnUnboundPrefix) {
  Ref<ElementNode> element;
  CreateElementNode("p", "e", element);
  EXPECT_THROW(Canonical(element.get(), kExclusive), XmlSecurityException);
  element->SetAttribute("xmlns:p", "urn:p");
  EXPECT_EQ(Canonical(element.get(), kExclusive), "<p:e xmlns:p=\"urn:p\"></p:e>");
}

TEST(CanonicalizerTest, LeavesTheOmittedElementOut) {
  const Ref<Document> document = ParseXml("<r xmlns:p='urn:p'>a<p:s><p:t/></p:s>b<p:s/><p:u/></r>");
  const ElementNode* signature = document->RootElement()->FirstChildElement("s");
  C14nOptions options;
  options.exclusive = true;
  const Ref<StringWriter> writer = CreateStringWriter();
  WriteCanonical(document.get(), signature, options, *writer);
  EXPECT_EQ(writer->TakeText(),
            "<r>ab<p:s xmlns:p=\"urn:p\"></p:s><p:u xmlns:p=\"urn:p\"></p:u></r>");
}

TEST(CanonicalizerTest, WalksTreesOfAnyDepth) {
  constexpr int kDepth = 100000;
  Ref<ElementNode> top;
  CreateElementNode("", "e", top);
  ElementNode* current = top.get();
  for (int level = 1; level < kDepth; ++level) {
    Ref<ElementNode> inner;
    CreateElementNode("", "e", inner);
    current->AppendChild(inner.get());
    current = inner.get();
  }
  EXPECT_EQ(Canonical(top.get(), kInclusive).size(), kDepth * std::string("<e></e>").size());
}

TEST(CanonicalizerTest, DistinguishesManyDeclarations) {
  std::string declarations;
  std::string uses;
  for (int index = 100; index < 400; ++index) {
    const std::string number = std::to_string(index);
    declarations += " xmlns:p" + number + "=\"urn:" + number + "\"";
    uses += "<p" + number + ":e xmlns:p100=\"urn:" + number + "\"/>";
  }
  const Ref<Document> document = ParseXml("<r" + declarations + ">" + uses + "</r>");
  std::string expected = "<r>";
  for (int index = 100; index < 400; ++index) {
    const std::string prefix = "p" + std::to_string(index);
    expected += "<" + prefix + ":e xmlns:" + prefix + "=\"urn:" + std::to_string(index) + "\"></" +
                prefix + ":e>";
  }
  EXPECT_EQ(Canonical(document.get(), kExclusive), expected + "</r>");
}

TEST(CanonicalizerTest, PropagatesTheFailureOfTheWriter) {
  class FailingWriter final : public Writer, public ObjectImpl {
   public:
    void Write(std::string_view) override { throw IOException("full"); }
  };
  const auto writer = MakeRef<FailingWriter>();
  const Ref<Canonicalizer> canonicalizer = CreateCanonicalizer(kExclusive);
  EXPECT_THROW(canonicalizer->Canonicalize(ParseXml("<a/>").get(), writer.get()), IOException);
}

}  // namespace
}  // namespace Tarnik::Testing
