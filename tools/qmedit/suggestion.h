#pragma once

#include "platform/base/qx_string.h"

#include <span>

/// The known word that a misspelt one most likely stands for: the one that the fewest single letters, put in,
/// left out, changed or exchanged with their neighbour, make of it, in any case of letters. Empty when none
/// is near.
[[nodiscard]] String nearestWord(const String& word, std::span<const String> known);

/// What to say behind an error on a word that is not known: "; did you mean 'WORD'?" with the nearest one,
/// else `otherwise`.
[[nodiscard]] String didYouMean(const String& word, std::span<const String> known, const String& otherwise);
