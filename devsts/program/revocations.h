#ifndef DEVSTS_PROGRAM_REVOCATIONS_H
#define DEVSTS_PROGRAM_REVOCATIONS_H

#include <set>
#include <string>
#include <vector>

#include "keys.h"

namespace DevSts::Program {

// The revocation list of the authority, in the file ca.crl of each folder. Used by one thread at a
// time.
class Revocations {
 public:
  // The certificates that the list in the state folder already names stay revoked. `stateFolder`
  // may be empty. Throws FileError if that list is broken.
  Revocations(Keys keys, const std::string& stateFolder);

  // Writes the list to this folder, now and after each change.
  void WriteTo(const std::string& folder);
  // Revokes the certificate "signing", "server" or "client". Throws std::invalid_argument for
  // another name, a certificate that the authority has not issued, and if there is no folder; and
  // FileError if a list cannot be written, in which case later lists do not name the certificate.
  void Revoke(const std::string& name);

 private:
  const std::string& CertificateOf(const std::string& name) const;
  std::string ListPem(const std::set<std::string>& names) const;

  Keys keys_;
  std::set<std::string> revoked_;
  std::vector<std::string> folders_;
};

}  // namespace DevSts::Program

#endif
