#ifndef SSOCLIENT_SSOCLIENT_H
#define SSOCLIENT_SSOCLIENT_H

// Includes the whole public interface, with the exceptions of the platform that leave it.

#include <ssoclient/advice.h>
#include <ssoclient/confirmation_type.h>
#include <ssoclient/delegate.h>
#include <ssoclient/exceptions.h>
#include <ssoclient/gss_negotiation_context.h>
#include <ssoclient/holder_of_key_config.h>
#include <ssoclient/negotiation_handler.h>
#include <ssoclient/principal_id.h>
#include <ssoclient/saml_token.h>
#include <ssoclient/saml_token_factory.h>
#include <ssoclient/security_token_service.h>
#include <ssoclient/security_token_service_config.h>
#include <ssoclient/token_spec.h>
#include <tarnik/core/exception.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/http/http_exception.h>
#include <tarnik/ssl/ssl_exception.h>
#include <tarnik/xml/security/xml_security_exception.h>
#include <tarnik/xml/xml_parse_exception.h>

#endif
