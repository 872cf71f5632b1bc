#ifndef SSOCLIENT_TESTS_STS_FAKES_H
#define SSOCLIENT_TESTS_STS_FAKES_H

#include <algorithm>
#include <memory>
#include <mutex>
#include <optional>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>
#include <ssoclient/saml_token.h>
#include <ssoclient/saml_token_factory.h>
#include <tarnik/core/reader.h>
#include <tarnik/core/ref.h>
#include <tarnik/http/http_user_agent.h>
#include <tarnik/xml/element_node.h>

#include "support/fake_saml_token.h"
#include "transport/transport.h"

namespace SsoClient::Testing {

/// Records what is sent and answers each request with the next text (the last one repeatedly), or
/// fails. Requests may be sent from many threads; the records are read afterwards.
class FakeTransport final : public Transport {
 public:
  explicit FakeTransport(std::string answer) : answers_{std::move(answer)} {}
  explicit FakeTransport(std::vector<std::string> answers) : answers_(std::move(answers)) {}

  std::shared_ptr<TransportSession> CreateSession() const override {
    const std::lock_guard lock(mutex_);
    ++sessions;
    return std::make_shared<Session>(*this);
  }

  mutable int sessions = 0;
  mutable std::vector<std::string> actions;
  mutable std::vector<std::string> bodies;
  std::optional<CommunicationException> failure;

 private:
  class Session final : public TransportSession {
   public:
    explicit Session(const FakeTransport& transport) : transport_(transport) {}

    void SendRequest(const SoapRequest& request,
                     Tarnik::Ref<Tarnik::Reader>& reader) const override {
      const std::string& answer = transport_.Record(request);
      if (transport_.failure) {
        transport_.failure->Throw();
      }
      reader = Tarnik::CreateStringReader(answer);
    }

    void SendRequestAsync(const SoapRequest&, const Completion&,
                          Tarnik::Ref<Tarnik::Http::PendingRequestItem>&) const override {
      FAIL() << "the service sends synchronously";
    }

   private:
    const FakeTransport& transport_;
  };

  /// Records the request and returns its answer.
  const std::string& Record(const SoapRequest& request) const {
    const std::lock_guard lock(mutex_);
    actions.push_back(request.action);
    bodies.push_back(request.body);
    return answers_[std::min(bodies.size(), answers_.size()) - 1];
  }

  mutable std::mutex mutex_;
  std::vector<std::string> answers_;
};

/// Makes a token from any text, or refuses all, or makes none. May be used from many threads.
class FakeTokenFactory final : public SamlTokenFactory {
 public:
  std::shared_ptr<const SamlToken> CreateToken(const std::string&) const override {
    throw std::logic_error("the tolerance must be given");
  }
  std::shared_ptr<const SamlToken> CreateToken(const std::string& xml,
                                               long clockToleranceSec) const override {
    Record(xml, clockToleranceSec);
    if (isRefusing) {
      throw InvalidSignatureException("refused");
    }
    return makesNone ? nullptr : std::make_shared<FakeSamlToken>(xml);
  }
  std::shared_ptr<const SamlToken> CreateToken(Tarnik::Xml::ElementNode*) const override {
    throw std::logic_error("the text must be given");
  }
  std::shared_ptr<const SamlToken> CreateToken(Tarnik::Xml::ElementNode*, long) const override {
    throw std::logic_error("the text must be given");
  }

  bool isRefusing = false;
  bool makesNone = false;
  mutable std::vector<std::string> texts;
  mutable std::vector<long> tolerances;

 private:
  void Record(const std::string& xml, long clockToleranceSec) const {
    const std::lock_guard lock(mutex_);
    texts.push_back(xml);
    tolerances.push_back(clockToleranceSec);
  }

  mutable std::mutex mutex_;
};

}  // namespace SsoClient::Testing

#endif
