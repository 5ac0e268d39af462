// SPDX-License-Identifier: MIT
// Names for the rows of a table of tests.
#pragma once

#include <string>

#include "gtest/gtest.h"

namespace host_tests {

/// The last argument of INSTANTIATE_TEST_SUITE_P where a row has a `name`.
template <typename Case>
std::string nameOfCase(const testing::TestParamInfo<Case>& row) {
  return row.param.name;
}

}  // namespace host_tests
