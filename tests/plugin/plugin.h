#ifndef SSOCLIENT_TESTS_PLUGIN_PLUGIN_H
#define SSOCLIENT_TESTS_PLUGIN_PLUGIN_H

#include <ssoclient/security_token_service.h>

/// The only function that the plug-in exports. Logs in at `url`, where nothing listens, and returns
/// whether the call failed as it should. With a callback, starts an asynchronous call instead. The
/// callback must be code of the host, since it returns after the plug-in may have been unloaded.
extern "C" SSOCLIENT_EXPORT bool RunFailingCall(
    const char* url, const SsoClient::SecurityTokenService::TokenCallback* callback);

#endif
