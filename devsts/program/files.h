#ifndef DEVSTS_PROGRAM_FILES_H
#define DEVSTS_PROGRAM_FILES_H

#include <string>

#include "descriptor.h"

namespace DevSts::Program {

enum class Readers { Everybody, OwnerOnly };

// Each function throws FileError with the path and the system's reason.

// The content of a file of at most a few megabytes.
std::string ReadWhole(const std::string& path);
// The same for a file of a folder that the program itself has made. Others must not be able to
// replace it by a link, so symbolic links and files that are not regular are refused; for
// `OwnerOnly`, also files that others can access.
std::string ReadOwnWhole(const std::string& path, Readers readers = Readers::Everybody);

// Opens a file to which the program writes, which is made if it does not exist, with these flags of
// open(). Symbolic links are refused, which could lead to a file that the user has not named.
Descriptor OpenOwn(const std::string& path, int flags, Readers readers = Readers::Everybody);

// Replaces the file as a whole: readers see the old content or the new one, never a part. What is
// there must be a regular file, if anything.
void WriteWhole(const std::string& path, const std::string& text,
                Readers readers = Readers::Everybody);

void MakeFolder(const std::string& path);
bool Exists(const std::string& path);
// Does nothing if there is no such file. What is there must be a regular file.
void RemoveFile(const std::string& path);

// A file that exists as long as the object, unless somebody else replaces it.
class TemporaryFile {
 public:
  TemporaryFile(std::string path, std::string text);
  ~TemporaryFile();
  TemporaryFile(const TemporaryFile&) = delete;
  TemporaryFile& operator=(const TemporaryFile&) = delete;

 private:
  std::string path_;
  std::string text_;
};

}  // namespace DevSts::Program

#endif
