#ifndef SSOCLIENT_TESTS_XML_UNSENDABLE_TEXTS_H
#define SSOCLIENT_TESTS_XML_UNSENDABLE_TEXTS_H

#include <string>
#include <vector>

namespace SsoClient::Testing {

/// Texts that XML 1.0 does not allow (section 2.2), each with "s3cret" in it.
inline std::vector<std::string> UnsendableTexts() {
  return {
      std::string("s3cret\0tail", 11),  // NUL
      "s3cret\x01",                     // a control character
      "s3cret\x1f",
      "s3cret\xc3",              // a truncated character
      "s3cret\xff",              // not UTF-8
      "s3cret\xc0\xaf",          // an overlong form
      "s3cret\xed\xa0\x80",      // a surrogate
      "s3cret\xef\xbf\xbe",      // U+FFFE
      "s3cret\xef\xbf\xbf",      // U+FFFF
      "s3cret\xf4\x90\x80\x80",  // above U+10FFFF
  };
}

}  // namespace SsoClient::Testing

#endif
