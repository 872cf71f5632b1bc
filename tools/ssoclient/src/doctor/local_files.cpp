#include "doctor/local_files.h"

#include <cerrno>

#include <sys/stat.h>
#include <unistd.h>

#include "input/descriptor.h"
#include "output/count_text.h"

namespace SsoClient::Tool::Doctor {
namespace {

constexpr long kMicrosecondsOfDay = 24L * 3600 * 1000000;

std::string Quoted(const std::string& path) {
  return "'" + path + "'";
}

}  // namespace

std::optional<Finding> FileProblem(const std::string& path) {
  struct stat status {};
  if (stat(path.c_str(), &status) != 0) {
    return Failure(ExitStatus::kLocal, "file-missing", Quoted(path) + ": " + SystemMessage(errno),
                   "check the path of the option");
  }
  if (S_ISDIR(status.st_mode)) {
    return Failure(ExitStatus::kLocal, "file-missing", Quoted(path) + " is a folder",
                   "name a file");
  }
  if (access(path.c_str(), R_OK) != 0) {
    return Failure(ExitStatus::kLocal, "file-unreadable",
                   Quoted(path) + ": " + SystemMessage(errno), "let this user read the file");
  }
  return std::nullopt;
}

std::optional<Finding> ValidityProblem(const std::string& what,
                                       const Tarnik::Crypto::Certificate& certificate,
                                       const Tarnik::System::DateTime& now,
                                       const std::string& soonRemedy) {
  if (certificate.NotAfter() <= now) {
    return Failure(ExitStatus::kLocal, "local-certificate-expired",
                   what + " has expired on " + certificate.NotAfter().ToString(),
                   "use a newer certificate");
  }
  if (certificate.NotBefore() > now) {
    return Failure(ExitStatus::kLocal, "local-certificate-not-yet-valid",
                   what + " is valid only from " + certificate.NotBefore().ToString() +
                       "; it is now " + now.ToString(),
                   "check the clock of this machine, or wait");
  }
  if (const long days = DaysUntil(certificate.NotAfter(), now); days < kSoonDays) {
    return Warning(ExitStatus::kLocal, "local-certificate-expires-soon",
                   what + " expires in " + CountText(days, "day") + ", on " +
                       certificate.NotAfter().ToString(),
                   soonRemedy);
  }
  return std::nullopt;
}

long DaysUntil(const Tarnik::System::DateTime& then, const Tarnik::System::DateTime& now) {
  const long left = then.GetUtcTime() - now.GetUtcTime();
  return left >= 0 ? left / kMicrosecondsOfDay : -1;
}

}  // namespace SsoClient::Tool::Doctor
