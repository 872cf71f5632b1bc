#ifndef FUZZ_FAULTY_STREAM_H
#define FUZZ_FAULTY_STREAM_H

#include <cstddef>
#include <functional>
#include <string>
#include <utility>

#include <tarnik/core/object_impl.h>
#include <tarnik/core/ref.h>
#include <tarnik/system/stream.h>

#include "words.h"

namespace Fuzz {

/// What happens at one read or write of a stream instead of the operation.
struct StreamFault {
  enum class Kind { kNone, kThrows, kThrowsState, kThrowsMemory, kFails, kIsCancelled, kEnds };

  Kind kind = Kind::kNone;
  bool isWrite = false;
  /// The first operation is 1.
  int operation = 0;
};

/// Of the line "fault read|write N throws|throws-state|throws-memory|fails|cancelled|ends". None
/// for another line, and for a write that ends.
StreamFault StreamFaultOf(const Words& line);

/// A stream with at most one fault. Before the bytes of the stream below, `greeting` arrives.
class FaultyStream final : public Tarnik::System::Stream, public Tarnik::ObjectImpl {
 public:
  FaultyStream(Tarnik::System::Stream* below, StreamFault fault, std::string greeting)
      : below_(below), fault_(fault), greeting_(std::move(greeting)) {}

  void ReadAsync(char* buffer, std::size_t size, ReadCompletion completion) override;
  void WriteAsync(const char* data, std::size_t size, WriteCompletion completion) override;
  void Close() noexcept override { below_->Close(); }

  bool HasFaulted() const { return hasFaulted_; }
  /// What a failure because of the fault says; empty without a fault.
  std::string FaultText() const;

 private:
  /// False if the operation is to be done.
  bool Misbehaves(bool isWrite, const std::function<void(Tarnik::Exception*)>& completion);

  const Tarnik::Ref<Tarnik::System::Stream> below_;
  const StreamFault fault_;
  std::string greeting_;
  int reads_ = 0;
  int writes_ = 0;
  bool hasFaulted_ = false;
};

}  // namespace Fuzz

#endif
