// SPDX-License-Identifier: MIT
// Where a virtual operation stands in its class's table.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

/// The operation's place in the table, from 0. Both C++ ABIs in use keep the offset in the pointer to member,
/// one of them with 1 added in its first word, the other in its second.
template <typename Operation>
std::size_t virtualSlot(Operation operation) {
  std::uintptr_t offset = 0;
  static_assert(sizeof operation == 2 * sizeof offset, "a pointer to member is an offset and an adjustment");
  std::memcpy(&offset, &operation, sizeof offset);
  return (offset & ~std::uintptr_t{1}) / sizeof(void*);
}
