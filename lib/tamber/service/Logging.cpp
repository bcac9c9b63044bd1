#include "tamber/service/Logging.h"

#include <cstdio>
#include <memory>
#include <mutex>
#include <unordered_map>

namespace Tamber {
namespace Service {

namespace {

void WriteToStderr(const std::string& logger, int level, const std::string& message) {
  // One write per line, so that lines of concurrent threads do not interleave.
  const std::string line = logger + " [" + std::to_string(level) + "] " + message + "\n";
  std::fwrite(line.data(), 1, line.size(), stderr);
}

class LogManagerImpl : public LogManager {
 public:
  void GetLogger(const std::string& name, int traceLevel, Ref<Logger>& logger) override {
    std::lock_guard<std::mutex> lock(_mutex);
    Ref<Logger>& entry = _loggers[name];
    if (!entry) entry = new Logger(this, name, _defaultLevel.load(std::memory_order_relaxed), traceLevel);
    logger = entry;
  }

  void SetSink(const LogSink& sink) override {
    auto installed = sink ? std::make_shared<const LogSink>(sink) : nullptr;
    std::lock_guard<std::mutex> lock(_mutex);
    _sink.swap(installed);
  }

  LogSink GetSink() const override {
    std::lock_guard<std::mutex> lock(_mutex);
    return _sink ? *_sink : LogSink();
  }

  void SetDefaultLevel(int level) override { _defaultLevel.store(level, std::memory_order_relaxed); }

  void Dispatch(const Logger& logger, int level, const std::string& message) const override {
    std::shared_ptr<const LogSink> sink;
    {
      std::lock_guard<std::mutex> lock(_mutex);
      sink = _sink;
    }
    // The sink runs outside the lock, so that it may log or replace itself.
    if (sink) {
      (*sink)(logger.GetName(), level, message);
    } else {
      WriteToStderr(logger.GetName(), level, message);
    }
  }

 private:
  mutable std::mutex _mutex;
  std::unordered_map<std::string, Ref<Logger>> _loggers;
  std::shared_ptr<const LogSink> _sink;
  std::atomic<int> _defaultLevel{LOG_INFO};
};

class AppImpl : public App {
 public:
  LogManager* GetLogManager() override { return _logManager.get(); }

 private:
  Ref<LogManager> _logManager{new LogManagerImpl()};
};

}  // namespace

Logger::Logger(const LogManager* manager, const std::string& name, int level, int traceLevel)
    : _manager(manager), _name(name), _level(level), _traceLevel(traceLevel) {}

void Logger::Emit(int level, const std::string& message) const {
  if (GetLevel() < level) return;
  _manager->Dispatch(*this, level, message);
}

App* GetApp() {
  // Never destroyed: loggers stay usable from static destructors and threads still running at exit.
  static AppImpl* const app = new AppImpl();
  return app;
}

}  // namespace Service
}  // namespace Tamber
