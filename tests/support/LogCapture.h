#ifndef TESTS_SUPPORT_LOGCAPTURE_H
#define TESTS_SUPPORT_LOGCAPTURE_H

#include <mutex>
#include <string>
#include <vector>

#include "tamber/service/Logging.h"

namespace TestSupport {

// Records every message sent to GetApp()'s log manager while it lives, and raises the logger
// `loggerName` to `level` meanwhile. Destruction puts back the previous sink and level.
class LogCapture {
 public:
  struct Entry {
    std::string logger;
    int level;
    std::string message;
  };

  explicit LogCapture(const std::string& loggerName = "SsoClient", int level = Tamber::Service::LOG_TRACE);
  ~LogCapture();
  LogCapture(const LogCapture&) = delete;
  LogCapture& operator=(const LogCapture&) = delete;

  std::vector<Entry> GetEntries() const;
  std::vector<std::string> GetMessages() const;
  // Whether some recorded message contains `fragment`.
  bool Contains(const std::string& fragment) const;
  void Clear();

 private:
  mutable std::mutex _mutex;
  std::vector<Entry> _entries;
  Tamber::Ref<Tamber::Service::Logger> _logger;
  int _previousLevel;
  Tamber::Service::LogSink _previousSink;
};

}  // namespace TestSupport

#endif
