#ifndef TARNIK_TESTS_SUPPORT_TEMPORARY_FILE_H
#define TARNIK_TESTS_SUPPORT_TEMPORARY_FILE_H

#include <string>

namespace Tarnik::Testing {

/// A file in the folder for temporary files, removed with its owner.
class TemporaryFile {
 public:
  explicit TemporaryFile(const std::string& content);
  ~TemporaryFile();
  TemporaryFile(const TemporaryFile&) = delete;
  TemporaryFile& operator=(const TemporaryFile&) = delete;

  const std::string& Path() const { return path_; }

 private:
  std::string path_;
};

/// An empty folder for temporary files, removed with all that is in it.
class TemporaryFolder {
 public:
  TemporaryFolder();
  ~TemporaryFolder();
  TemporaryFolder(const TemporaryFolder&) = delete;
  TemporaryFolder& operator=(const TemporaryFolder&) = delete;

  const std::string& Path() const { return path_; }
  /// Writes a file and returns its path.
  std::string Write(const std::string& name, const std::string& content) const;

 private:
  std::string path_;
};

}  // namespace Tarnik::Testing

#endif
