// SPDX-License-Identifier: MIT
// Characters of texts that come from plug-ins and of names of files, as reports have to look at them. Pure
// functions that ask for no locale.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace scanner {

/// The character at byte `at` of valid UTF-8, which must not be its end. Moves `at` behind it.
char32_t nextCharacter(std::string_view text, std::size_t& at);

/// C0 and C1 control characters and DEL, which terminals may obey.
bool isControl(char32_t character);

/// Whether it shows nothing, or changes how its neighbours are shown, such as their order: with it a name can
/// look like another one. Control characters above 0x7F are among them, those below are not.
bool isInvisible(char32_t character);

/// "[U+202E]": what stands for an invisible character.
std::string codeOf(char32_t character);

/// How many columns of a terminal it takes: 2 for ideographs, Hangul, wide forms and pictographs, 0 for marks
/// that are put on the character before, 1 for all others.
std::size_t widthOf(char32_t character);

}  // namespace scanner
