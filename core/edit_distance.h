// How far a mistyped word is from the one that was probably meant. No Windows header.
#pragma once

#include <cstddef>
#include <string_view>

// Insertions, deletions, replacements and swaps of neighbours that turn one text into the other, ASCII case aside. No
// part is edited twice (optimal string alignment). Time and memory grow with the product and the sum of the lengths:
// text from outside is cut first.
size_t EditDistance(std::wstring_view from, std::wstring_view to);
