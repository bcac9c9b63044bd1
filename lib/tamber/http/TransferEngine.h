#ifndef TAMBER_HTTP_TRANSFERENGINE_H
#define TAMBER_HTTP_TRANSFERENGINE_H

#include <deque>
#include <map>
#include <memory>
#include <mutex>
#include <thread>
#include <vector>

#include <curl/curl.h>

#include "tamber/http/PendingRequestItemImpl.h"

namespace Tamber {
namespace Http {

class Transfer;

// The one worker thread of the process that performs every HTTP transfer, through a libcurl
// multi handle. It starts on first use and stops at process exit (an atexit handler), failing
// what is still pending. The engine object itself is never destroyed, so that a late call (from
// a static destructor, say) finds it stopped instead of freed.
//
// Each user agent has at most one transfer running, since its libcurl easy handle serves one
// transfer at a time; further requests of the agent wait in order behind it.
class TransferEngine {
 public:
  static TransferEngine& Get();
  // True on the worker thread (in a completion, typically).
  static bool IsWorkerThread();

  // Hands a request to the worker. Raises HttpException once the engine has stopped.
  void Submit(PendingRequestItemImpl* item);
  // Asks the worker to cancel a request; nothing happens when it is done or the engine stopped.
  void Cancel(PendingRequestItemImpl* item);

 private:
  struct Command {
    bool cancel;
    Ref<PendingRequestItemImpl> item;
  };

  TransferEngine();
  static void StopAtExit();
  void Stop();

  // Worker side.
  void Run();
  void Begin(const Ref<PendingRequestItemImpl>& item);
  void StartTransfer(const Ref<PendingRequestItemImpl>& item);
  // The agent's next waiting request, or null after marking the agent idle.
  Ref<PendingRequestItemImpl> TakeNext(const UserAgentImpl& agent);
  void ReapFinished();
  void CancelOnWorker(PendingRequestItemImpl* item);
  // Ends a running transfer with `result` (or as cancelled) and starts the agent's next one.
  void EndTransfer(CURL* easy, CURLcode result, bool cancelled);
  void AbandonAll();

  std::mutex _mutex;
  std::vector<Command> _commands;  // guarded by _mutex
  bool _stopping = false;          // guarded by _mutex
  CURLM* _multi;
  std::thread _thread;

  // Worker only: the running transfers by easy handle, and for every agent with a running
  // transfer, its requests waiting behind it.
  std::map<CURL*, std::unique_ptr<Transfer>> _running;
  std::map<const UserAgentImpl*, std::deque<Ref<PendingRequestItemImpl>>> _waiting;
};

}  // namespace Http
}  // namespace Tamber

#endif
