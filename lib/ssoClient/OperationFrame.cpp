#include "ssoClient/OperationFrame.h"

#include "ssoClient/Log.h"
#include "tamber/StringUtil.h"

namespace SsoClient {

OperationFrame::OperationFrame(const std::string& operationName)
    : opId(Tamber::StringUtil::GenerateUuid()), operationName(operationName) {
  SSOCLIENT_LOG(Tamber::Service::LOG_TRACE, "opId=%1 START operation SecurityTokenServiceImpl::%2", opId,
                operationName);
}

OperationFrame::~OperationFrame() {
  // Runs while the operation's exception may be propagating: a log sink that throws must not end
  // the process.
  try {
    SSOCLIENT_LOG(Tamber::Service::LOG_TRACE, "opId=%1 END operation SecurityTokenServiceImpl::%2", opId,
                  operationName);
  } catch (...) {
  }
}

}  // namespace SsoClient
