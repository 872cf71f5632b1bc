#include "state_folder.h"

#include <array>
#include <utility>

#include <fcntl.h>
#include <sys/file.h>

#include "errors.h"
#include "files.h"

namespace DevSts::Program {
namespace {

constexpr std::chrono::hours kYear{365L * 24};

using Entry = std::pair<const char*, Credential Keys::*>;

// In the order of writing. The certificate of the authority comes last, so that a start that was
// interrupted is noticed.
constexpr std::array<Entry, 4> kEntries{{
    {"server", &Keys::server},
    {"signing", &Keys::signing},
    {"client", &Keys::client},
    {"ca", &Keys::authority},
}};

Descriptor LockFolder(const std::string& path) {
  Descriptor lock = OpenOwn(path + "/lock", O_RDWR, Readers::OwnerOnly);
  if (flock(lock.Get(), LOCK_EX | LOCK_NB) != 0) {
    throw FileError(path + ": another process uses this folder");
  }
  return lock;
}

}  // namespace

StateFolder::StateFolder(std::string path) : path_(std::move(path)) {
  MakeFolder(path_);
  lock_ = LockFolder(path_);
}

Keys StateFolder::LoadOrMake(const KeyPlan& plan) const {
  bool isNew = true;
  for (const auto& [name, member] : kEntries) {
    isNew = isNew && !Exists(PathOf(std::string(name) + ".pem")) &&
            !Exists(PathOf(std::string(name) + "-key.pem"));
  }
  if (!isNew) {
    return Load(plan);
  }
  KeyPlan kept = plan;
  kept.validity = 10 * kYear;
  Keys keys = MakeKeys(kept);
  Write(keys);
  return keys;
}

Keys StateFolder::Load(const KeyPlan& plan) const {
  Keys keys;
  for (const auto& [name, member] : kEntries) {
    const std::string certificate = PathOf(std::string(name) + ".pem");
    const std::string key = PathOf(std::string(name) + "-key.pem");
    for (const std::string& file : {key, certificate}) {
      if (!Exists(file)) {
        throw FileError(file + ": the file is missing; remove the folder to make new keys");
      }
    }
    keys.*member = {ReadOwnWhole(certificate), ReadOwnWhole(key, Readers::OwnerOnly)};
  }
  try {
    CheckKeys(keys, plan);
  } catch (const FileError& error) {
    throw FileError(PathOf(error.what()) + "; remove the folder to make new keys");
  }
  return keys;
}

void StateFolder::Write(const Keys& keys) const {
  for (const auto& [name, member] : kEntries) {
    const Credential& credential = keys.*member;
    WriteWhole(PathOf(std::string(name) + "-key.pem"), credential.privateKeyPem,
               Readers::OwnerOnly);
    WriteWhole(PathOf(std::string(name) + ".pem"), credential.certificatePem);
  }
}

}  // namespace DevSts::Program
