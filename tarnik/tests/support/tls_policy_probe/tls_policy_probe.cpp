// Prints what a ClientHello of the library offers, and the offer of a context of OpenSSL that only
// the configuration file has changed. A separate program, since OpenSSL reads its configuration
// once in a process.
#include <cstddef>
#include <iostream>
#include <memory>
#include <string>

#include <openssl/ssl.h>

#include <tarnik/core/exception.h>
#include <tarnik/ssl/ssl_context.h>

#include "support/client_hello.h"

namespace {

std::string DefaultOffer() {
  const std::unique_ptr<SSL_CTX, decltype(&SSL_CTX_free)> context(SSL_CTX_new(TLS_client_method()),
                                                                  SSL_CTX_free);
  const std::unique_ptr<SSL, decltype(&SSL_free)> ssl(SSL_new(context.get()), SSL_free);
  BIO* output = BIO_new(BIO_s_mem());
  SSL_set_bio(ssl.get(), BIO_new(BIO_s_mem()), output);
  SSL_connect(ssl.get());
  char* bytes = nullptr;
  const long length = BIO_get_mem_data(output, &bytes);
  return Tarnik::Testing::OfferOf(std::string(bytes, static_cast<std::size_t>(length)));
}

}  // namespace

int main(int argc, char** argv) {
  if (argc > 1 && std::string(argv[1]) == "default") {
    std::cout << DefaultOffer();
    return 0;
  }
  try {
    const auto context = Tarnik::Ssl::CreateSSLContext({});
    std::cout << Tarnik::Testing::OfferOf(Tarnik::Testing::ClientHelloOf(*context));
  } catch (const Tarnik::Exception& error) {
    std::cout << error.Message() << "\n";
  }
  return 0;
}
