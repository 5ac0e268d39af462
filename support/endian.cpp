#include "support/endian.h"

#include <algorithm>

namespace Endian {

void Swap(void* p, int n) {
  auto* bytes = static_cast<unsigned char*>(p);
  if (n > 1) std::reverse(bytes, bytes + n);
}

}  // namespace Endian
