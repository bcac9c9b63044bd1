#ifndef SSOCLIENT_SSOCLIENT_H
#define SSOCLIENT_SSOCLIENT_H

// Umbrella header of the single sign-on client library.
#include "ssoClient/Exceptions.h"
#include "ssoClient/GssNegotiationContext.h"
#include "ssoClient/Logger.h"
#include "ssoClient/NegotiationHandler.h"
#include "ssoClient/PrincipalId.h"
#include "ssoClient/SamlToken.h"
#include "ssoClient/SecurityTokenService.h"
#include "ssoClient/TokenSpec.h"

#endif
