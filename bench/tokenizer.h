#ifndef BENCH_TOKENIZER_H
#define BENCH_TOKENIZER_H

#include <string>

namespace Bench {

/// The lower bound of the cost of reading a text into a tree: Expat with handlers that only link
/// the nodes of a plain tree and copy names, values and texts. Resolves no namespaces, keeps no
/// positions and limits nothing. Returns whether `xml` is well-formed.
bool Tokenize(const std::string& xml);

}  // namespace Bench

#endif
