#include <tarnik/core/object_impl.h>
#include <tarnik/core/writer.h>

#include "support/sensitive_text.h"

namespace Tarnik {
namespace {

class StringWriterImpl final : public StringWriter, public ObjectImpl {
 public:
  void Write(std::string_view text) override { text_.Append(text); }
  const std::string& Text() const override { return text_.Text(); }
  std::string TakeText() override { return text_.Take(); }

 private:
  ~StringWriterImpl() override = default;

  SensitiveText text_;
};

}  // namespace

Ref<StringWriter> CreateStringWriter() {
  return Ref<StringWriter>(new StringWriterImpl);
}

}  // namespace Tarnik
