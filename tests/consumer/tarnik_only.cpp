#include <cstring>
#include <iostream>

#include <tarnik/core/checked_cast.h>
#include <tarnik/core/reader.h>
#include <tarnik/version.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/xml_parser.h>

int main() {
  if (std::strcmp(TARNIK_VERSION, PACKAGE_VERSION) != 0 ||
      std::strcmp(Tarnik::Version(), PACKAGE_VERSION) != 0) {
    std::cerr << "The package has the version " << PACKAGE_VERSION << ", its library "
              << Tarnik::Version() << ".\n";
    return 1;
  }
  const auto reader = Tarnik::CreateStringReader("<a><b/></a>");
  const auto handler = Tarnik::Xml::CreateXMLDocumentHandler();
  const auto parsed = Tarnik::Xml::CreateXMLParser(reader.get(), handler.get())->Parse();
  const auto* document = Tarnik::CheckedCast<Tarnik::Xml::Document>(parsed.get());
  std::cout << document->RootElement()->LocalName() << '\n';
  return document->RootElement()->FirstChildElement("b") == nullptr ? 1 : 0;
}
