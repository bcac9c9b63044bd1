#ifndef TESTS_SUPPORT_SCRIPTEDSTS_H
#define TESTS_SUPPORT_SCRIPTEDSTS_H

// A transport that answers from a script instead of the network, and the WS-Trust answers an STS
// sends, for the token-service suites. Requests still go through the real request builder and
// answers through the real response handler.

#include <condition_variable>
#include <cstddef>
#include <deque>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

#include <boost/shared_ptr.hpp>

#include "StsAnswers.h"
#include "ssoClient/HttpsClient.h"
#include "ssoClient/NegotiationHandler.h"
#include "ssoClient/Request.h"
#include "tamber/Exception.h"

namespace TestSupport {

// One request as the transport received it, with the session (0, 1, ... in creation order) it
// was sent on.
struct RecordedRequest {
  SsoClient::Request request;
  size_t session;
};

// Answers each request with the next queued answer, or else with the standing answer for its
// SOAP action, or else with a CommunicationException saying that nothing was scripted. Records
// every request. Safe for concurrent sessions.
class ScriptedTransport final : public SsoClient::Transport {
 public:
  ScriptedTransport();

  // Queues the body of the next answer.
  void Answer(const std::string& body);
  // Queues a failure that the next request raises, as a transport failure does.
  void Fail(const Tamber::Exception& failure);
  // Answers every request with `soapAction` for which nothing is queued.
  void AnswerAlways(const std::string& soapAction, const std::string& body);
  // While held, requests wait before they are answered.
  void Hold();
  void Release();

  std::vector<RecordedRequest> GetRequests() const;
  size_t GetSessionCount() const;

  boost::shared_ptr<SsoClient::TransportSession> CreateSession() const override;

  // What the sessions share with the transport.
  struct Script;

 private:
  std::shared_ptr<Script> _script;
};

// The WS-Trust answers of an STS, in SOAP 1.1 envelopes: those of the development STS.
using DevSts::FaultAnswer;
using DevSts::IssueAnswer;
using DevSts::RenewAnswer;
using DevSts::SPNegoFinalAnswer;
using DevSts::SPNegoLegAnswer;
using DevSts::ValidateAnswer;

// The messages logged between the START and END messages of one operation of the service; adds a
// test failure unless `messages` begins with START and ends with END of `operation` under one
// operation id.
std::vector<std::string> FramedMessages(const std::vector<std::string>& messages, const std::string& operation);

// A leg from text, for readable tests.
SsoClient::Leg MakeLeg(const std::string& text);

}  // namespace TestSupport

#endif
