#ifndef DEVSTS_PROGRAM_TLS_NAMES_H
#define DEVSTS_PROGRAM_TLS_NAMES_H

#include "devsts/server.h"
#include "vocabulary.h"

namespace DevSts::Program {

// The names of --tls and of the command tls.
const Vocabulary<TlsOptions>& TlsNames();

}  // namespace DevSts::Program

#endif
