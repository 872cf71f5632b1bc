#include "transport/https_session.h"

#include <functional>
#include <future>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <type_traits>

#include <gmock/gmock.h>

#include <ssoclient/exceptions.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/core/reader.h>
#include <tarnik/core/ref.h>
#include <tarnik/http/connection_spec.h>
#include <tarnik/http/http_user_agent.h>

#include "support/vtable_slot.h"
#include "transport/fake_http.h"
#include "transport/loopback_server.h"
#include "transport/read_all.h"
#include "transport/sso_connection_specs.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::Http::ClientResponse;
using Tarnik::Http::PendingRequestItem;
using testing::ElementsAre;
using testing::IsEmpty;

constexpr unsigned long kTimeout = 240'000'000;

class HttpsSessionTest : public testing::Test {
 protected:
  HttpsSessionTest() {
    request_.action = "urn:action";
    request_.body = "<envelope/>";
  }

  std::string SendFailure() {
    Tarnik::Ref<Tarnik::Reader> reader;
    try {
      session_.SendRequest(request_, reader);
    } catch (const CommunicationException& error) {
      EXPECT_EQ(reader, nullptr);
      return error.Message();
    }
    ADD_FAILURE() << "the request did not fail";
    return {};
  }

  Tarnik::Ref<FakeUserAgent> agent_ = Tarnik::MakeRef<FakeUserAgent>();
  HttpsSession session_{agent_, "/sts", kTimeout};
  SoapRequest request_;
};

TEST_F(HttpsSessionTest, ReturnsAReaderOfTheAnswer) {
  Tarnik::Ref<Tarnik::Reader> reader;
  session_.SendRequest(request_, reader);
  ASSERT_NE(reader, nullptr);
  EXPECT_EQ(ReadAll(*reader), "answer");
}

TEST_F(HttpsSessionTest, AFaultIsAnAnswer) {
  agent_->onWait = [] {
    return Tarnik::MakeRef<FakeResponse>(500, "Internal Server Error", "<fault/>");
  };
  Tarnik::Ref<Tarnik::Reader> reader;
  session_.SendRequest(request_, reader);
  EXPECT_EQ(ReadAll(*reader), "<fault/>");
}

TEST_F(HttpsSessionTest, TheBlockingWaitHasTheLimitAndSendingHasNone) {
  Tarnik::Ref<Tarnik::Reader> reader;
  session_.SendRequest(request_, reader);
  EXPECT_THAT(agent_->sendTimeouts, ElementsAre(0UL));
  EXPECT_THAT(agent_->waitTimeouts, ElementsAre(kTimeout));
  EXPECT_THAT(agent_->waitedItems, ElementsAre(agent_->item.get()));
}

TEST_F(HttpsSessionTest, TheBlockingSendIgnoresTheCompletion) {
  Tarnik::Ref<Tarnik::Reader> reader;
  session_.SendRequest(request_, reader);
  ASSERT_EQ(agent_->completions.size(), 1U);
  Tarnik::IOException error("late");
  agent_->completions[0](&error, nullptr, nullptr);
}

TEST_F(HttpsSessionTest, ATimeOutKeepsThePlatformsMessage) {
  agent_->onWait = []() -> Tarnik::Ref<ClientResponse> {
    throw Tarnik::TimeoutException("No answer from sts within 240 seconds.");
  };
  EXPECT_EQ(SendFailure(), "No answer from sts within 240 seconds.");
}

TEST_F(HttpsSessionTest, AnyPlatformFailureOfTheWaitBecomesACommunicationFailure) {
  agent_->onWait = []() -> Tarnik::Ref<ClientResponse> {
    throw Tarnik::InvalidStateException("broken");
  };
  EXPECT_EQ(SendFailure(), "broken");
}

TEST_F(HttpsSessionTest, AnErrorStatusIsAFailure) {
  agent_->onWait = [] { return Tarnik::MakeRef<FakeResponse>(503, "Service Unavailable"); };
  EXPECT_EQ(SendFailure(), "Server returned error: 503 Service Unavailable");
}

TEST_F(HttpsSessionTest, AnUnreadableResponseIsAFailure) {
  agent_->onWait = [] {
    auto response = Tarnik::MakeRef<FakeResponse>(200, "OK");
    response->bodyFailure = "no body";
    return response;
  };
  EXPECT_EQ(SendFailure(), "no body");
}

TEST_F(HttpsSessionTest, FailuresToMakeTheRequestPassUnchanged) {
  Tarnik::Ref<Tarnik::Reader> reader;
  agent_->onSend = [] { throw Tarnik::InvalidStateException("not now"); };
  EXPECT_THROW(session_.SendRequest(request_, reader), Tarnik::InvalidStateException);
  agent_->onSend = nullptr;
  const HttpsSession badTarget(agent_, "/a b", kTimeout);
  EXPECT_THROW(badTarget.SendRequest(request_, reader), Tarnik::InvalidArgumentException);
  request_.action = "urn:a\r\nInjected: 1";
  EXPECT_THROW(session_.SendRequest(request_, reader), Tarnik::InvalidArgumentException);
  EXPECT_THAT(agent_->completions, IsEmpty());
}

TEST_F(HttpsSessionTest, OtherExceptionsOfTheWaitPassUnchanged) {
  agent_->onWait = []() -> Tarnik::Ref<ClientResponse> { throw std::runtime_error("other"); };
  Tarnik::Ref<Tarnik::Reader> reader;
  EXPECT_THROW(session_.SendRequest(request_, reader), std::runtime_error);
}

class HttpsSessionAsyncTest : public HttpsSessionTest {
 protected:
  void Send() {
    session_.SendRequestAsync(
        request_,
        [this](const Tarnik::Exception* error, Tarnik::Reader* reader) {
          ++calls_;
          EXPECT_NE(error == nullptr, reader == nullptr);
          if (error != nullptr) {
            isCommunicationException_ =
                dynamic_cast<const CommunicationException*>(error) != nullptr;
            message_ = error->Message();
            return;
          }
          body_ = ReadAll(*reader);
        },
        handle_);
  }

  void Complete(Tarnik::Exception* error, ClientResponse* response) {
    ASSERT_EQ(agent_->completions.size(), 1U);
    agent_->completions[0](error, response, agent_->item.get());
  }

  Tarnik::Ref<PendingRequestItem> handle_;
  int calls_ = 0;
  bool isCommunicationException_ = false;
  std::string message_;
  std::string body_;
};

TEST_F(HttpsSessionAsyncTest, ReturnsTheHandleAtOnceAndGivesTheLimitToTheAgent) {
  Send();
  EXPECT_EQ(handle_, agent_->item);
  EXPECT_EQ(calls_, 0);
  EXPECT_THAT(agent_->sendTimeouts, ElementsAre(kTimeout));
  EXPECT_THAT(agent_->waitTimeouts, IsEmpty());
}

TEST_F(HttpsSessionAsyncTest, ReportsTheAnswerOnce) {
  Send();
  Complete(nullptr, Tarnik::MakeRef<FakeResponse>(200, "OK", "answer").get());
  EXPECT_EQ(calls_, 1);
  EXPECT_EQ(body_, "answer");
}

TEST_F(HttpsSessionAsyncTest, ReleasesTheAnswerAfterTheCallback) {
  long during = 0;
  session_.SendRequestAsync(
      request_,
      [&during](const Tarnik::Exception*, Tarnik::Reader* reader) { during = reader->RefCount(); },
      handle_);
  const auto response = Tarnik::MakeRef<FakeResponse>(200, "OK", "answer");
  const auto body = response->Body();
  const long before = body->RefCount();
  Complete(nullptr, response.get());
  EXPECT_EQ(during, before + 1);
  EXPECT_EQ(body->RefCount(), before);
}

TEST_F(HttpsSessionAsyncTest, ReportsAPlatformFailure) {
  Send();
  Tarnik::CancelledException error("called off");
  Complete(&error, nullptr);
  EXPECT_EQ(calls_, 1);
  EXPECT_TRUE(isCommunicationException_);
  EXPECT_EQ(message_, "called off");
}

TEST_F(HttpsSessionAsyncTest, ReportsAnErrorStatus) {
  Send();
  Complete(nullptr, Tarnik::MakeRef<FakeResponse>(404, "Not Found").get());
  EXPECT_EQ(calls_, 1);
  EXPECT_TRUE(isCommunicationException_);
  EXPECT_EQ(message_, "Server returned error: 404 Not Found");
}

TEST_F(HttpsSessionAsyncTest, AnEmptyCallbackFailsWhenTheExchangeEnds) {
  session_.SendRequestAsync(request_, nullptr, handle_);
  const auto response = Tarnik::MakeRef<FakeResponse>(200, "OK");
  EXPECT_THROW(agent_->completions[0](nullptr, response.get(), nullptr), std::bad_function_call);
}

TEST_F(HttpsSessionTest, OperationsKeepTheirSlotOrder) {
  static_assert(!std::has_virtual_destructor_v<TransportSession>);
  const TransportSession& session = session_;
  using Send = void(const void*, const SoapRequest&, Tarnik::Ref<Tarnik::Reader>&);
  Tarnik::Ref<Tarnik::Reader> reader;
  VtableSlot<Send>(&session, 0)(&session, request_, reader);
  EXPECT_NE(reader, nullptr);
  using SendAsync = void(const void*, const SoapRequest&, const TransportSession::Completion&,
                         Tarnik::Ref<PendingRequestItem>&);
  Tarnik::Ref<PendingRequestItem> handle;
  VtableSlot<SendAsync>(&session, 1)(&session, request_, nullptr, handle);
  EXPECT_EQ(handle, agent_->item);
}

/// Both send a request and return the body of the answer.
std::string SendNow(const HttpsSession& session, const SoapRequest& request) {
  Tarnik::Ref<Tarnik::Reader> reader;
  session.SendRequest(request, reader);
  return ReadAll(*reader);
}

std::string SendLater(const HttpsSession& session, const SoapRequest& request) {
  const auto body = std::make_shared<std::promise<std::string>>();
  Tarnik::Ref<PendingRequestItem> handle;
  session.SendRequestAsync(
      request,
      [body, caller = std::this_thread::get_id()](const Tarnik::Exception* error,
                                                  Tarnik::Reader* reader) {
        EXPECT_NE(std::this_thread::get_id(), caller);
        body->set_value(error != nullptr ? error->Message() : ReadAll(*reader));
      },
      handle);
  EXPECT_NE(handle, nullptr);
  return body->get_future().get();
}

TEST(HttpsSessionWireTest, PostsTheEnvelopeWithTheTwoHeadersInOrder) {
  const LoopbackServer server([](const std::string&) { return OkAnswer("ok"); });
  Tarnik::Ref<Tarnik::Http::ConnectionSpec> spec;
  CreateSsoConnectionSpec("127.0.0.1", server.Port(), false, spec);
  const HttpsSession session(Tarnik::Http::CreateHttpUserAgent(spec.get(), nullptr, nullptr),
                             "/sts/STSService?x=1", kTimeout);
  SoapRequest request;
  request.action = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue";
  request.body = std::string("<a>\r\n\xc3\xa9\0</a>", 13);
  EXPECT_EQ(SendNow(session, request), "ok");
  EXPECT_EQ(SendLater(session, request), "ok");

  const auto requests = server.Requests();
  ASSERT_EQ(requests.size(), 2U);
  for (const auto& received : requests) {
    EXPECT_EQ(received.substr(0, received.find("\r\n")), "POST /sts/STSService?x=1 HTTP/1.1");
    EXPECT_THAT(
        received,
        testing::HasSubstr("\r\nContent-Type: text/xml\r\nSOAPAction: "
                           "\"http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue\"\r\n"));
    EXPECT_EQ(BodyOf(received), request.body);
  }
}

TEST(HttpsSessionWireTest, AServerThatDoesNotAnswerTimesOut) {
  const LoopbackServer server([](const std::string&) { return std::string(); });
  Tarnik::Ref<Tarnik::Http::ConnectionSpec> spec;
  CreateSsoConnectionSpec("127.0.0.1", server.Port(), false, spec);
  const HttpsSession session(Tarnik::Http::CreateHttpUserAgent(spec.get(), nullptr, nullptr), "/",
                             50'000);
  const SoapRequest request;
  Tarnik::Ref<Tarnik::Reader> reader;
  EXPECT_THROW(session.SendRequest(request, reader), CommunicationException);
}

}  // namespace
}  // namespace SsoClient::Testing
