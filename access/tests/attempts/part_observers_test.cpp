#include "attempts/part_observers.h"

#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

namespace SsoClient::Access {
namespace {

/// A factory that does what `action` does, whatever text it is given.
template <class Action>
class ScriptedFactory final : public SamlTokenFactory {
 public:
  explicit ScriptedFactory(Action action) : action_(std::move(action)) {}

  std::shared_ptr<const SamlToken> CreateToken(const std::string&) const override {
    return action_();
  }
  std::shared_ptr<const SamlToken> CreateToken(const std::string&, long) const override {
    return action_();
  }
  std::shared_ptr<const SamlToken> CreateToken(Tarnik::Xml::ElementNode*) const override {
    return action_();
  }
  std::shared_ptr<const SamlToken> CreateToken(Tarnik::Xml::ElementNode*, long) const override {
    return action_();
  }

 private:
  const Action action_;
};

template <class Action>
FailureKind FailureOf(Action action) {
  const ObservingTokenFactory factory(std::make_shared<ScriptedFactory<Action>>(action));
  try {
    EXPECT_EQ(factory.CreateToken("text", 600), nullptr);
  } catch (...) {
    EXPECT_NE(factory.Failure(), FailureKind::kNone);
  }
  return factory.Failure();
}

using Result = std::shared_ptr<const SamlToken>;

TEST(ObservingTokenFactoryTest, RejectedTokensAreNotFailuresOfTheFactory) {
  EXPECT_EQ(FailureOf([]() -> Result { throw InvalidSignatureException("no"); }),
            FailureKind::kBadToken);
  EXPECT_EQ(FailureOf([]() -> Result { throw SsoException("no"); }), FailureKind::kBadToken);
  EXPECT_EQ(FailureOf([]() -> Result { throw Tarnik::InvalidStateException("no"); }),
            FailureKind::kLocal);
  EXPECT_EQ(FailureOf([]() -> Result { throw std::runtime_error("no"); }), FailureKind::kLocal);
  EXPECT_EQ(FailureOf([]() -> Result { return nullptr; }), FailureKind::kBadToken);
}

TEST(ObservingTokenFactoryTest, HasNotFailedBeforeItIsUsed) {
  const auto unused = [] { return Result(); };
  const ObservingTokenFactory factory(std::make_shared<ScriptedFactory<decltype(unused)>>(unused));
  EXPECT_EQ(factory.Failure(), FailureKind::kNone);
}

class ScriptedHandler final : public NegotiationHandler {
 public:
  std::shared_ptr<const std::vector<unsigned char>> Negotiate(
      const std::vector<unsigned char>& serverLeg) override {
    if (serverLeg.empty()) {
      return std::make_shared<const std::vector<unsigned char>>(1, 'a');
    }
    if (serverLeg.size() == 1) {
      return nullptr;
    }
    throw std::runtime_error("no ticket");
  }
};

TEST(ObservingNegotiationHandlerTest, ReportsWhetherTheLastLegHasFailed) {
  ScriptedHandler inner;
  ObservingNegotiationHandler handler(inner);
  EXPECT_EQ(handler.Negotiate({})->size(), 1U);
  EXPECT_FALSE(handler.HasFailed());
  EXPECT_EQ(handler.Negotiate({1}), nullptr);
  EXPECT_TRUE(handler.HasFailed());
  EXPECT_THROW(handler.Negotiate({1, 2}), std::runtime_error);
  EXPECT_TRUE(handler.HasFailed());
  handler.Negotiate({});
  EXPECT_FALSE(handler.HasFailed());
}

}  // namespace
}  // namespace SsoClient::Access
