#ifndef SSOCLIENT_OPERATIONFRAME_H
#define SSOCLIENT_OPERATIONFRAME_H

#include <string>

namespace SsoClient {

// Traces one operation of the token service: "START" when made, "END" when destroyed, whether
// the operation returns or an exception passes through it, both under one fresh operation id.
// Lives on the operation's stack from its first statement.
struct OperationFrame {
  explicit OperationFrame(const std::string& operationName);
  ~OperationFrame();
  OperationFrame(const OperationFrame&) = delete;
  OperationFrame& operator=(const OperationFrame&) = delete;

  const std::string opId;
  // As logged, e.g. "AcquireToken".
  const std::string operationName;
};

}  // namespace SsoClient

#endif
