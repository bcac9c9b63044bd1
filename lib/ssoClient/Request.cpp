#include "ssoClient/Request.h"

#include "ssoClient/WireConstants.h"

namespace SsoClient {

const char* const Request::ISSUE = Wire::kActionIssue;
const char* const Request::RENEW = Wire::kActionRenew;
const char* const Request::VALIDATE = Wire::kActionValidate;
const char* const Request::CHALLANGE = Wire::kActionChallenge;

}  // namespace SsoClient
