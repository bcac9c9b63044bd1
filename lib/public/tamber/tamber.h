#ifndef TAMBER_TAMBER_H
#define TAMBER_TAMBER_H

// Umbrella header of the core layer.
#include "tamber/Exception.h"
#include "tamber/MessageFormatter.h"
#include "tamber/Panic.h"
#include "tamber/Ref.h"
#include "tamber/Stream.h"
#include "tamber/StringUtil.h"
#include "tamber/crypto/Certificate.h"
#include "tamber/crypto/PrivateKey.h"
#include "tamber/service/Logging.h"
#include "tamber/system/DateTime.h"
#include "tamber/xml/Dom.h"
#include "tamber/xml/Parser.h"
#include "tamber/xml/QName.h"
#include "tamber/xml/security/Canonicalizer.h"
#include "tamber/xml/security/Signature.h"

#endif
