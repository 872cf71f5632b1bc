#ifndef SSOCLIENT_SSOCLIENT_H
#define SSOCLIENT_SSOCLIENT_H

// Everything that the library offers.

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

#endif
