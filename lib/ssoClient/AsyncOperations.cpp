#include "ssoClient/AsyncOperations.h"

#include <boost/function.hpp>
#include <boost/none.hpp>

#include "ssoClient/SecurityTokenServiceImpl.h"

namespace SsoClient {

namespace {

typedef boost::function<boost::shared_ptr<const SamlToken>()> TokenCall;
typedef boost::function<bool()> ValidateCall;

}  // namespace

// Each twin binds the synchronous operation of a private copy of the service, reached through the
// interface, to copies of its arguments; the work item owns them all until it is destroyed.

void SecurityTokenServiceImpl::AcquireTokenAsync(const std::string& user, const std::string& password,
                                                 const TokenSpec& spec, const TokenCallback& callback) const {
  const TokenCall call = boost::bind(&SecurityTokenService::AcquireToken, CopyForWorkItem(), user, password, spec);
  SyncToAsyncCall(call, callback);
}

void SecurityTokenServiceImpl::AcquireTokenByGssAsync(const TokenSpec& spec,
                                                      const boost::shared_ptr<NegotiationHandler>& handler,
                                                      const TokenCallback& callback) const {
  const boost::shared_ptr<const SecurityTokenService> service = CopyForWorkItem();
  const PassByRefHelper<NegotiationHandler> handlerRef(handler);
  const TokenCall call = boost::bind(&SecurityTokenService::AcquireTokenByGSS, service, spec, handlerRef);
  SyncToAsyncCall(call, callback);
}

void SecurityTokenServiceImpl::AcquireTokenByCertificateAsync(const TokenSpec& spec,
                                                              const TokenCallback& callback) const {
  const TokenCall call = boost::bind(&SecurityTokenService::AcquireTokenByCertificate, CopyForWorkItem(), spec);
  SyncToAsyncCall(call, callback);
}

void SecurityTokenServiceImpl::AcquireTokenByTokenAsync(const boost::shared_ptr<const SamlToken>& token,
                                                        const TokenSpec& spec, const TokenCallback& callback) const {
  const boost::shared_ptr<const SecurityTokenService> service = CopyForWorkItem();
  const PassByRefHelper<const SamlToken> tokenRef(token);
  const TokenCall call = boost::bind(&SecurityTokenService::AcquireTokenByToken, service, tokenRef, spec);
  SyncToAsyncCall(call, callback);
}

void SecurityTokenServiceImpl::ValidateSubjectAsync(const boost::shared_ptr<const SamlToken>& token,
                                                    const ValidateCallback& callback) const {
  const boost::shared_ptr<const SecurityTokenService> service = CopyForWorkItem();
  const PassByRefHelper<const SamlToken> tokenRef(token);
  const ValidateCall call = boost::bind(&SecurityTokenService::ValidateSubject, service, tokenRef);
  SyncToAsyncCall(call, callback, boost::none);
}

void SecurityTokenServiceImpl::RenewTokenAsync(const boost::shared_ptr<const SamlToken>& token, long long lifetimeSec,
                                               const TokenCallback& callback) const {
  const boost::shared_ptr<const SecurityTokenService> service = CopyForWorkItem();
  const PassByRefHelper<const SamlToken> tokenRef(token);
  const TokenCall call = boost::bind(&SecurityTokenService::RenewToken, service, tokenRef, lifetimeSec);
  SyncToAsyncCall(call, callback);
}

boost::shared_ptr<const SecurityTokenService> SecurityTokenServiceImpl::CopyForWorkItem() const {
  return boost::shared_ptr<const SecurityTokenService>(new SecurityTokenServiceImpl(*this));
}

}  // namespace SsoClient
