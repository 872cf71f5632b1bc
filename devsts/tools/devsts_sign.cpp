// devsts_sign KEY CERTIFICATE INPUT OUTPUT: signs with the template in the input, or with the
// default options of SignXml.
#include <exception>
#include <iostream>

#include "devsts/xml_security.h"
#include "program.h"

int main(int argc, char** argv) {
  if (argc != 5) {
    std::cerr << "usage: devsts_sign KEY.pem CERTIFICATE.pem INPUT.xml OUTPUT.xml\n";
    return 2;
  }
  try {
    const std::string key = DevSts::ReadFile(argv[1]);
    const std::string certificate = DevSts::ReadFile(argv[2]);
    DevSts::WriteFile(argv[4], DevSts::SignXml(DevSts::ReadFile(argv[3]), key, certificate));
    return 0;
  } catch (const std::exception& error) {
    std::cerr << "devsts_sign: " << error.what() << '\n';
    return 1;
  }
}
