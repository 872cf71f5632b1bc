#include "xml/participants.h"

#include "xml/builder_factories.h"
#include "xml/namespaces.h"

namespace SsoClient {

namespace {

std::shared_ptr<XMLCompositeBuilder> BuildParticipant(const std::string& audience) {
  auto reference = MakeCompositeBuilder("wsa", "EndpointReference");
  reference->Add(MakeTextElementBuilder("wsa", "Address", audience));
  auto participant = MakeCompositeBuilder("wst", "Participant");
  participant->Add(reference);
  return participant;
}

}  // namespace

std::shared_ptr<XMLCompositeBuilder> BuildParticipants(
    const std::set<std::string>& audienceRestriction) {
  auto participants = MakeCompositeBuilder("wst", "Participants", {{"xmlns:wsa", kWsaNamespace}});
  for (const auto& audience : audienceRestriction) {
    participants->Add(BuildParticipant(audience));
  }
  return participants;
}

}  // namespace SsoClient
