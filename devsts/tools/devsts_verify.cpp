// devsts_verify CERTIFICATE FILE: exits with 0 if the first signature is valid, 1 if it is not, 2
// on errors.
#include <exception>
#include <iostream>

#include "devsts/xml_security.h"
#include "program.h"

int main(int argc, char** argv) {
  if (argc != 3) {
    std::cerr << "usage: devsts_verify CERTIFICATE.pem FILE.xml\n";
    return 2;
  }
  try {
    const DevSts::VerifyResult result =
        DevSts::VerifyXml(DevSts::ReadFile(argv[2]), DevSts::ReadFile(argv[1]));
    std::cout << (result ? "valid" : "invalid: " + result.reason) << '\n';
    return result ? 0 : 1;
  } catch (const std::exception& error) {
    std::cerr << "devsts_verify: " << error.what() << '\n';
    return 2;
  }
}
