#ifndef DEVSTS_WIRE_CONVERSATION_H
#define DEVSTS_WIRE_CONVERSATION_H

#include <cstdint>
#include <functional>

#include "operations/service.h"
#include "wire/connection.h"
#include "wire/http_reader.h"
#include "wire/misbehavior_plan.h"
#include "wire/observation.h"
#include "wire/wire_answer.h"
#include "xml/schema_values.h"

namespace DevSts {

// What all conversations share.
struct ConversationParts {
  Service& service;
  MisbehaviorPlan& plan;
  Observation& observation;
  const std::function<void(const ReceivedRequest&)>& onRequest;
};

// Serves one connection from start to end on the calling thread.
class Conversation {
 public:
  Conversation(Connection& connection, std::uint64_t id, ConversationParts parts)
      : connection_(connection), id_(id), parts_(parts), reader_(connection) {}

  void Run();

 private:
  bool Begin();
  bool ServeOne();
  SoapReply Decide(const ReceivedRequest& request, const Misbehavior& misbehavior, Time now) const;
  // Fills in the properties of the connection.
  void Describe(ReceivedRequest& request);
  void Record(ReceivedRequest& request, const SoapReply& reply, const WireAnswer& wire,
              const Misbehavior& misbehavior);
  void StallHere();
  // Returns false if the connection has ended.
  bool Delay(std::chrono::milliseconds time);
  bool Send(const WireAnswer& wire, const Misbehavior& misbehavior);
  bool SendPaced(std::string_view octets, const std::optional<Drip>& drip);

  Connection& connection_;
  const std::uint64_t id_;
  ConversationParts parts_;
  HttpReader reader_;
  std::size_t ordinal_ = 0;
};

}  // namespace DevSts

#endif
