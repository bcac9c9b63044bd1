#include "support/LogCapture.h"

namespace TestSupport {

using Tamber::Service::GetApp;

LogCapture::LogCapture(const std::string& loggerName, int level) {
  Tamber::Service::LogManager* manager = GetApp()->GetLogManager();
  manager->GetLogger(loggerName, Tamber::Service::LOG_TRACE, _logger);
  _previousLevel = _logger->GetLevel();
  _previousSink = manager->GetSink();
  manager->SetSink([this](const std::string& logger, int messageLevel, const std::string& message) {
    std::lock_guard<std::mutex> lock(_mutex);
    _entries.push_back({logger, messageLevel, message});
  });
  _logger->SetLevel(level);
}

LogCapture::~LogCapture() {
  _logger->SetLevel(_previousLevel);
  GetApp()->GetLogManager()->SetSink(_previousSink);
}

std::vector<LogCapture::Entry> LogCapture::GetEntries() const {
  std::lock_guard<std::mutex> lock(_mutex);
  return _entries;
}

std::vector<std::string> LogCapture::GetMessages() const {
  std::vector<std::string> messages;
  for (const Entry& entry : GetEntries()) messages.push_back(entry.message);
  return messages;
}

bool LogCapture::Contains(const std::string& fragment) const {
  for (const Entry& entry : GetEntries()) {
    if (entry.message.find(fragment) != std::string::npos) return true;
  }
  return false;
}

void LogCapture::Clear() {
  std::lock_guard<std::mutex> lock(_mutex);
  _entries.clear();
}

}  // namespace TestSupport
