#ifndef SSOCLIENT_TESTS_SUPPORT_TOKEN_EDITOR_H
#define SSOCLIENT_TESTS_SUPPORT_TOKEN_EDITOR_H

#include <cstddef>
#include <functional>
#include <string>

namespace SsoClient::Testing {

/// Makes signed assertions of every kind and edits them. The choices depend on a source of numbers,
/// such as random numbers or the input of a fuzzer.
class TokenEditor {
 public:
  /// `below` returns a number less than its argument, which is at least one.
  explicit TokenEditor(std::function<std::size_t(std::size_t)> below);

  /// An assertion signed by the trusted credential.
  std::string SignedXml();
  /// Changes, removes, repeats or inserts something.
  void Edit(std::string& xml);

 private:
  std::string Snippet();
  std::string Insertion();
  void InsertAtTag(std::string& xml);
  void MoveElement(std::string& xml);

  std::function<std::size_t(std::size_t)> below_;
};

}  // namespace SsoClient::Testing

#endif
