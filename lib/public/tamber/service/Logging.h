#ifndef TAMBER_SERVICE_LOGGING_H
#define TAMBER_SERVICE_LOGGING_H

#include <atomic>
#include <functional>
#include <string>

#include "tamber/MessageFormatter.h"
#include "tamber/Ref.h"

namespace Tamber {
namespace Service {

// Severity levels: a lower number is more severe. A logger emits a message when its current
// level is at least the message's level.
enum LogLevel {
  LOG_ERROR = 4,
  LOG_WARNING = 8,
  LOG_INFO = 16,
  LOG_VERBOSE = 32,
  LOG_TRACE = 64,
};

// Receives every emitted message: the logger's name, the message's level and its text.
using LogSink = std::function<void(const std::string& logger, int level, const std::string& message)>;

class LogManager;

// A named logger. Its level may be changed at any time from any thread.
class TAMBER_API Logger : public Object {
 public:
  const std::string& GetName() const { return _name; }
  // The most detailed level emitted now: messages of a higher number are dropped.
  int GetLevel() const { return _level.load(std::memory_order_relaxed); }
  void SetLevel(int level) { _level.store(level, std::memory_order_relaxed); }
  // The level of the component's most detailed tracing, given when the logger was first asked
  // for; EnableTracing raises the logger to it.
  int GetTraceLevel() const { return _traceLevel; }
  void EnableTracing() { SetLevel(_traceLevel); }

  // Hands the message to the manager's sink when the level allows it.
  void Emit(int level, const std::string& message) const;

  // Made by the log manager only; ask it for loggers with GetLogger.
  Logger(const LogManager* manager, const std::string& name, int level, int traceLevel);

 private:
  const LogManager* _manager;
  std::string _name;
  std::atomic<int> _level;
  int _traceLevel;
};

// Owns the loggers of the process, one per name, and the sink they write to. By default a new
// logger's level is LOG_INFO (so tracing at LOG_TRACE is off) and messages go to stderr as
// "<logger> [<level>] <message>".
class TAMBER_API LogManager : public Object {
 public:
  // The logger of that name, created at the default level on first request; `traceLevel` is
  // remembered for EnableTracing.
  virtual void GetLogger(const std::string& name, int traceLevel, Ref<Logger>& logger) = 0;
  // Installs the sink for every logger; an empty function restores stderr.
  virtual void SetSink(const LogSink& sink) = 0;
  // The installed sink; empty while messages go to stderr.
  virtual LogSink GetSink() const = 0;
  // The level given to loggers created from now on.
  virtual void SetDefaultLevel(int level) = 0;
  // Writes one message of `logger` to the current sink.
  virtual void Dispatch(const Logger& logger, int level, const std::string& message) const = 0;
};

// The process-wide application object.
class TAMBER_API App {
 public:
  // The log manager of the process; lives as long as the process.
  virtual LogManager* GetLogManager() = 0;

 protected:
  ~App() = default;
};

// The application object, created on first use and never destroyed; safe from any thread.
TAMBER_API App* GetApp();

// Formats and emits one message when the logger's level is at least `level`. Callers that pass
// costly arguments test the level first, so that nothing is formatted in vain.
template <class... Arguments>
void LogInternal(const Logger* logger, int level, const char* format, const Arguments&... arguments) {
  if (logger == nullptr || logger->GetLevel() < level) return;
  logger->Emit(level, MessageFormatter::ASPrint(format, arguments...));
}

}  // namespace Service
}  // namespace Tamber

#endif
