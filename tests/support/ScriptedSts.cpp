#include "support/ScriptedSts.h"

#include <regex>

#include <gtest/gtest.h>

#include "ssoClient/Exceptions.h"
#include "tamber/Stream.h"

namespace TestSupport {

using SsoClient::Request;

struct ScriptedTransport::Script {
  std::mutex mutex;
  std::condition_variable released;
  bool held = false;
  // A queued answer: a body, or a failure to raise.
  struct Queued {
    std::string body;
    boost::shared_ptr<Tamber::Exception> failure;
  };
  std::deque<Queued> queue;
  std::map<std::string, std::string> standing;
  std::vector<RecordedRequest> requests;
  size_t sessions = 0;

  void Send(size_t session, const Request& request, Tamber::Ref<Tamber::Reader>& response) {
    std::unique_lock<std::mutex> lock(mutex);
    requests.push_back({request, session});
    released.wait(lock, [this] { return !held; });
    std::string body;
    if (!queue.empty()) {
      const Queued next = queue.front();
      queue.pop_front();
      if (next.failure) next.failure->Throw();
      body = next.body;
    } else {
      const auto found = standing.find(request.soapAction);
      if (found == standing.end()) {
        throw SsoClient::CommunicationException("No scripted answer for " + request.soapAction);
      }
      body = found->second;
    }
    Tamber::CreateStringReader(body, response);
  }
};

namespace {

class ScriptedSession final : public SsoClient::TransportSession {
 public:
  ScriptedSession(const std::shared_ptr<ScriptedTransport::Script>& script, size_t index)
      : _script(script), _index(index) {}

  void SendRequest(const Request& request, Tamber::Ref<Tamber::Reader>& response) override {
    _script->Send(_index, request, response);
  }

  // Answers at once, on the calling thread.
  void SendRequestAsync(const Request& request, const SsoClient::ResponseCompletion& completion,
                        Tamber::Ref<Tamber::System::ScheduledItem>&) override {
    Tamber::Ref<Tamber::Reader> response;
    try {
      SendRequest(request, response);
    } catch (const Tamber::Exception& e) {
      completion(&e, nullptr);
      return;
    }
    completion(nullptr, response.get());
  }

 private:
  std::shared_ptr<ScriptedTransport::Script> _script;
  size_t _index;
};

}  // namespace

ScriptedTransport::ScriptedTransport() : _script(std::make_shared<Script>()) {}

void ScriptedTransport::Answer(const std::string& body) {
  std::lock_guard<std::mutex> lock(_script->mutex);
  _script->queue.push_back({body, nullptr});
}

void ScriptedTransport::Fail(const Tamber::Exception& failure) {
  std::lock_guard<std::mutex> lock(_script->mutex);
  _script->queue.push_back({std::string(), boost::shared_ptr<Tamber::Exception>(failure.Clone())});
}

void ScriptedTransport::AnswerAlways(const std::string& soapAction, const std::string& body) {
  std::lock_guard<std::mutex> lock(_script->mutex);
  _script->standing[soapAction] = body;
}

void ScriptedTransport::Hold() {
  std::lock_guard<std::mutex> lock(_script->mutex);
  _script->held = true;
}

void ScriptedTransport::Release() {
  {
    std::lock_guard<std::mutex> lock(_script->mutex);
    _script->held = false;
  }
  _script->released.notify_all();
}

std::vector<RecordedRequest> ScriptedTransport::GetRequests() const {
  std::lock_guard<std::mutex> lock(_script->mutex);
  return _script->requests;
}

size_t ScriptedTransport::GetSessionCount() const {
  std::lock_guard<std::mutex> lock(_script->mutex);
  return _script->sessions;
}

boost::shared_ptr<SsoClient::TransportSession> ScriptedTransport::CreateSession() const {
  std::lock_guard<std::mutex> lock(_script->mutex);
  return boost::shared_ptr<SsoClient::TransportSession>(new ScriptedSession(_script, _script->sessions++));
}

std::vector<std::string> FramedMessages(const std::vector<std::string>& messages, const std::string& operation) {
  static const std::regex start("opId=([0-9a-f]{8}-[0-9a-f]{4}-4[0-9a-f]{3}-[89ab][0-9a-f]{3}-[0-9a-f]{12}) START "
                                "operation SecurityTokenServiceImpl::(\\w+)");
  std::smatch match;
  if (messages.size() < 2 || !std::regex_match(messages.front(), match, start) || match[2] != operation) {
    ADD_FAILURE() << "not framed as " << operation << ": " << ::testing::PrintToString(messages);
    return messages;
  }
  EXPECT_EQ(messages.back(), "opId=" + match[1].str() + " END operation SecurityTokenServiceImpl::" + operation);
  return std::vector<std::string>(messages.begin() + 1, messages.end() - 1);
}

SsoClient::Leg MakeLeg(const std::string& text) { return SsoClient::Leg(text.begin(), text.end()); }

}  // namespace TestSupport
