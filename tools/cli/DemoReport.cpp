#include "DemoReport.h"

#include <chrono>
#include <iomanip>
#include <sstream>

#include "ExitCodes.h"

namespace Cli {
namespace {

void WriteIndented(std::ostream& out, const std::string& text) {
  std::istringstream lines(text);
  for (std::string line; std::getline(lines, line);) out << "      " << line << "\n";
}

}  // namespace

void DemoReport::Run(const std::string& name, const std::function<std::string()>& operation) {
  ++_runCount;
  std::string details;
  std::string failure;
  const auto start = std::chrono::steady_clock::now();
  try {
    details = operation();
  } catch (const std::exception& error) {
    failure = ClassNameOf(error) + ": " + error.what();
  }
  const std::chrono::duration<double, std::milli> elapsed = std::chrono::steady_clock::now() - start;

  _out << "  " << std::left << std::setw(44) << name << std::right << std::setw(9) << std::fixed << std::setprecision(1)
       << elapsed.count() << " ms  " << (failure.empty() ? "ok" : "FAILED") << "\n";
  if (failure.empty()) {
    WriteIndented(_out, details);
  } else {
    ++_failureCount;
    WriteIndented(_out, failure);
  }
  _out.flush();
}

}  // namespace Cli
