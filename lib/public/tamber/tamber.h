#ifndef TAMBER_TAMBER_H
#define TAMBER_TAMBER_H

// Umbrella header of the core layer.
#include "tamber/Exception.h"
#include "tamber/Functor.h"
#include "tamber/MessageFormatter.h"
#include "tamber/Panic.h"
#include "tamber/Ref.h"
#include "tamber/Stream.h"
#include "tamber/StringUtil.h"
#include "tamber/crypto/Certificate.h"
#include "tamber/crypto/PrivateKey.h"
#include "tamber/http/ClientResponse.h"
#include "tamber/http/ConnectionSpec.h"
#include "tamber/http/CookieStore.h"
#include "tamber/http/HttpException.h"
#include "tamber/http/HttpRequest.h"
#include "tamber/http/Url.h"
#include "tamber/http/UserAgent.h"
#include "tamber/service/Logging.h"
#include "tamber/ssl/SSLContext.h"
#include "tamber/system/DateTime.h"
#include "tamber/system/ScheduledItem.h"
#include "tamber/system/ThreadPool.h"
#include "tamber/xml/Dom.h"
#include "tamber/xml/Parser.h"
#include "tamber/xml/QName.h"
#include "tamber/xml/security/Canonicalizer.h"
#include "tamber/xml/security/Signature.h"

#endif
