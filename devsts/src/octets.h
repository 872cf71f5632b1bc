#ifndef DEVSTS_OCTETS_H
#define DEVSTS_OCTETS_H

#include <vector>

namespace DevSts {

using Octets = std::vector<unsigned char>;

}  // namespace DevSts

#endif
