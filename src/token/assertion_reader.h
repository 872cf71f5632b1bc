#ifndef SSOCLIENT_TOKEN_ASSERTION_READER_H
#define SSOCLIENT_TOKEN_ASSERTION_READER_H

#include <tarnik/xml/element_node.h>

#include "token/parsed_assertion.h"

namespace SsoClient {

/// Reads one SAML 2.0 assertion (SAML 2.0 core, section 2.3.3) in the one layout that this library
/// accepts; anything unexpected is an error. Does not check times or the signature's value. A null
/// `assertion` is an error like any node that is not an Assertion.
///
/// Throws `ParseException` at the first fault in document order.
ParsedAssertion ReadAssertion(Tarnik::Xml::ElementNode* assertion);

}  // namespace SsoClient

#endif
