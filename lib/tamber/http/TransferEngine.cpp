#include "tamber/http/TransferEngine.h"

#include <cstdlib>

#include "tamber/http/Curl.h"
#include "tamber/http/HttpException.h"
#include "tamber/http/Transfer.h"
#include "tamber/http/UserAgentImpl.h"

namespace Tamber {
namespace Http {

namespace {

// How long the worker sleeps at most when nothing happens; every new command wakes it at once.
constexpr int kIdleWaitMillis = 1000;

thread_local bool tIsWorkerThread = false;

}  // namespace

TransferEngine& TransferEngine::Get() {
  // Never destroyed; see the class comment.
  static TransferEngine* engine = new TransferEngine();
  return *engine;
}

bool TransferEngine::IsWorkerThread() { return tIsWorkerThread; }

TransferEngine::TransferEngine() {
  Curl::GlobalInit();
  _multi = curl_multi_init();
  if (_multi == nullptr) throw InvalidStateException("libcurl could not create its transfer engine");
  _thread = std::thread([this] { Run(); });
  std::atexit(&TransferEngine::StopAtExit);
}

void TransferEngine::StopAtExit() { Get().Stop(); }

void TransferEngine::Stop() {
  {
    std::lock_guard<std::mutex> lock(_mutex);
    if (_stopping) return;
    _stopping = true;
    curl_multi_wakeup(_multi);
  }
  // exit() called from a completion runs on the worker itself, which then never returns to its
  // loop: there is nothing to wait for.
  if (IsWorkerThread()) return;
  _thread.join();
}

void TransferEngine::Submit(PendingRequestItemImpl* item) {
  std::lock_guard<std::mutex> lock(_mutex);
  if (_stopping) throw HttpException("The HTTP client has shut down: the process is exiting");
  _commands.push_back(Command{false, item});
  // Under the lock, so that the worker cannot have freed the multi handle meanwhile.
  curl_multi_wakeup(_multi);
}

void TransferEngine::Cancel(PendingRequestItemImpl* item) {
  std::lock_guard<std::mutex> lock(_mutex);
  if (_stopping) return;
  _commands.push_back(Command{true, item});
  curl_multi_wakeup(_multi);
}

void TransferEngine::Run() {
  tIsWorkerThread = true;
  for (;;) {
    std::vector<Command> commands;
    {
      std::lock_guard<std::mutex> lock(_mutex);
      if (_stopping) break;
      commands.swap(_commands);
    }
    for (const Command& command : commands) {
      if (command.cancel) {
        CancelOnWorker(command.item.get());
      } else {
        Begin(command.item);
      }
    }
    int running = 0;
    curl_multi_perform(_multi, &running);
    ReapFinished();
    curl_multi_poll(_multi, nullptr, 0, kIdleWaitMillis, nullptr);
  }
  AbandonAll();
}

void TransferEngine::Begin(const Ref<PendingRequestItemImpl>& item) {
  const UserAgentImpl* agent = &item->GetAgent();
  auto waiting = _waiting.find(agent);
  if (waiting != _waiting.end()) {
    waiting->second.push_back(item);
    return;
  }
  _waiting[agent];  // marks the agent busy
  StartTransfer(item);
}

void TransferEngine::StartTransfer(const Ref<PendingRequestItemImpl>& item) {
  std::unique_ptr<Transfer> transfer;
  try {
    transfer.reset(new Transfer(item));
    const CURLMcode added = curl_multi_add_handle(_multi, transfer->GetEasy());
    if (added != CURLM_OK) {
      throw InvalidStateException(std::string("libcurl could not start a transfer: ") + curl_multi_strerror(added));
    }
  } catch (const Exception& e) {
    transfer.reset();
    item->Finish(&e, nullptr);
    if (Ref<PendingRequestItemImpl> next = TakeNext(item->GetAgent())) StartTransfer(next);
    return;
  }
  CURL* easy = transfer->GetEasy();
  _running[easy] = std::move(transfer);
}

Ref<PendingRequestItemImpl> TransferEngine::TakeNext(const UserAgentImpl& agent) {
  auto waiting = _waiting.find(&agent);
  if (waiting->second.empty()) {
    _waiting.erase(waiting);
    return nullptr;
  }
  Ref<PendingRequestItemImpl> next = waiting->second.front();
  waiting->second.pop_front();
  return next;
}

void TransferEngine::ReapFinished() {
  int queued = 0;
  while (CURLMsg* message = curl_multi_info_read(_multi, &queued)) {
    if (message->msg == CURLMSG_DONE) EndTransfer(message->easy_handle, message->data.result, false);
  }
}

void TransferEngine::CancelOnWorker(PendingRequestItemImpl* item) {
  for (const auto& running : _running) {
    if (&running.second->GetItem() == item) return EndTransfer(running.first, CURLE_OK, true);
  }
  auto waiting = _waiting.find(&item->GetAgent());
  if (waiting == _waiting.end()) return;
  std::deque<Ref<PendingRequestItemImpl>>& queue = waiting->second;
  for (auto it = queue.begin(); it != queue.end(); ++it) {
    if (it->get() == item) {
      const Ref<PendingRequestItemImpl> cancelled = *it;
      queue.erase(it);
      const HttpException error(item->GetAgent().GetDescription() + " was cancelled");
      cancelled->Finish(&error, nullptr);
      return;
    }
  }
}

void TransferEngine::EndTransfer(CURL* easy, CURLcode result, bool cancelled) {
  auto running = _running.find(easy);
  std::unique_ptr<Transfer> transfer = std::move(running->second);
  _running.erase(running);
  curl_multi_remove_handle(_multi, easy);
  if (cancelled) {
    transfer->CompleteCancelled();
  } else {
    transfer->Complete(result);
  }

  // The agent's next request takes over the handle. The finished transfer goes first: it may
  // hold the last reference to the agent when nothing else waits.
  const Ref<PendingRequestItemImpl> next = TakeNext(transfer->GetItem().GetAgent());
  transfer.reset();
  if (next) StartTransfer(next);
}

void TransferEngine::AbandonAll() {
  const HttpException error("The HTTP client has shut down: the process is exiting");
  for (auto& running : _running) {
    curl_multi_remove_handle(_multi, running.first);
    running.second->GetItem().Abandon(error);
  }
  for (auto& waiting : _waiting) {
    for (const Ref<PendingRequestItemImpl>& item : waiting.second) item->Abandon(error);
  }
  {
    std::lock_guard<std::mutex> lock(_mutex);
    for (const Command& command : _commands) {
      if (!command.cancel) command.item->Abandon(error);
    }
    _commands.clear();
  }
  _running.clear();
  _waiting.clear();
  curl_multi_cleanup(_multi);
  _multi = nullptr;
}

}  // namespace Http
}  // namespace Tamber
