#include "core/edit_distance.h"

#include <algorithm>
#include <numeric>
#include <vector>

#include "core/ascii.h"

size_t EditDistance(std::wstring_view from, std::wstring_view to) {
  const auto same = [&](size_t i, size_t j) { return LowerAscii(from[i]) == LowerAscii(to[j]); };
  std::vector<size_t> beforeLast(to.size() + 1);
  std::vector<size_t> last(to.size() + 1);
  std::vector<size_t> row(to.size() + 1);  // row[j]: from i characters to j
  std::iota(row.begin(), row.end(), size_t{0});
  for (size_t i = 1; i <= from.size(); ++i) {
    beforeLast.swap(last);
    last.swap(row);
    row[0] = i;
    for (size_t j = 1; j <= to.size(); ++j) {
      const bool isSame = same(i - 1, j - 1);
      row[j] = std::min({last[j - 1] + (isSame ? 0 : 1), row[j - 1] + 1, last[j] + 1});
      const bool isSwap = i > 1 && j > 1 && same(i - 1, j - 2) && same(i - 2, j - 1);
      if (isSwap) row[j] = std::min(row[j], beforeLast[j - 2] + 1);
    }
  }
  return row.back();
}
