#include "certificate_values.h"

#include <cstddef>

#include "input.h"
#include "support/openssl.h"

namespace Fuzz {

using namespace Tarnik;

const unsigned char* BytesOf(std::string_view text) {
  return reinterpret_cast<const unsigned char*>(text.data());
}

std::string TextOf(const X509_NAME* name) {
  const OpenSsl::OwnedBio memory(BIO_new(BIO_s_mem()));
  X509_NAME_print_ex(memory.get(), name, 0,
                     XN_FLAG_RFC2253 & ~static_cast<unsigned long>(ASN1_STRFLGS_ESC_MSB));
  char* text = nullptr;
  const long length = BIO_get_mem_data(memory.get(), &text);
  return {text, static_cast<std::size_t>(length)};
}

long SecondsOf(const ASN1_TIME* time) {
  const OpenSsl::Owned<ASN1_TIME, ASN1_TIME_free> epoch(ASN1_TIME_set(nullptr, 0));
  int days = 0;
  int seconds = 0;
  Require(ASN1_TIME_diff(&days, &seconds, epoch.get(), time) == 1);
  return days * 86'400L + seconds;
}

}  // namespace Fuzz
