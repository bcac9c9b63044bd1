#ifndef TOOLS_CLI_DEMOREPORT_H
#define TOOLS_CLI_DEMOREPORT_H

#include <functional>
#include <ostream>
#include <string>

namespace Cli {

// The demo's report: one timed entry per operation with its outcome, and the tally.
class DemoReport {
 public:
  explicit DemoReport(std::ostream& out) : _out(out) {}

  // Runs `operation` and reports it under `name` with its time; the text it returns is shown
  // below, indented. A failure is reported and counted, not thrown.
  void Run(const std::string& name, const std::function<std::string()>& operation);

  int GetRunCount() const { return _runCount; }
  int GetFailureCount() const { return _failureCount; }

 private:
  std::ostream& _out;
  int _runCount = 0;
  int _failureCount = 0;
};

}  // namespace Cli

#endif
