#include "doctor/dns_probe.h"
#include "doctor/steps.h"

namespace SsoClient::Tool::Doctor {

Step ExamineDns(Examination& examination) {
  Step step;
  const ServiceAddress& service = examination.service;
  Resolution resolution =
      ResolveUntil(ResolveBySystem, service.host, service.port, examination.limit.ForStep());
  step.finding = FindingOfResolution(service.host, resolution);
  step.details["host"] = service.host;
  step.details["addresses"] = nlohmann::json::array();
  for (const Address& address : resolution.addresses) {
    step.lines.push_back(address.text);
    step.details["addresses"].push_back(address.text);
  }
  examination.addresses = std::move(resolution.addresses);
  return step;
}

}  // namespace SsoClient::Tool::Doctor
