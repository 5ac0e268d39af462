// SPDX-License-Identifier: MIT
// Holds the place of the precompiled headers of the test programs, which CMakeLists.txt lists.
