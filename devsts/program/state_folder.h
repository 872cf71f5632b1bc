#ifndef DEVSTS_PROGRAM_STATE_FOLDER_H
#define DEVSTS_PROGRAM_STATE_FOLDER_H

#include <string>

#include "descriptor.h"
#include "keys.h"

namespace DevSts::Program {

// A folder that keeps the keys of a service from one start to the next. It is locked as long as the
// object exists, so that two processes do not use it at once.
class StateFolder {
 public:
  // Makes the folder if it does not exist. Throws FileError if another process uses it.
  explicit StateFolder(std::string path);

  // The keys in the folder, or new ones if it contains none, which are written to it. Throws
  // FileError if a file is missing, can be read by others, is broken or has expired.
  Keys LoadOrMake(const KeyPlan& plan) const;

 private:
  Keys Load(const KeyPlan& plan) const;
  void Write(const Keys& keys) const;
  std::string PathOf(const std::string& file) const { return path_ + "/" + file; }

  std::string path_;
  Descriptor lock_;
};

}  // namespace DevSts::Program

#endif
