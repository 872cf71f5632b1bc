#ifndef SSOCLIENT_XML_OWN_IDS_H
#define SSOCLIENT_XML_OWN_IDS_H

#include <tarnik/xml/element_node.h>

namespace SsoClient {

/// Looks for the ids of a request's own certificate and signature inside of the tokens that it
/// carries: a service that found two elements of one id would refuse the request, or take the wrong
/// one. `envelope` has its certificate, if it is to have one, but not its signature. Throws
/// `Tarnik::InvalidArgumentException`.
void RequireOwnIds(const Tarnik::Xml::ElementNode& envelope);

}  // namespace SsoClient

#endif
