// The order of a column's values, worked out once: comparing ranks is what keeps sorting fast.
const collator = new Intl.Collator('en', {numeric: true, sensitivity: 'base'});

function compare(a, b) {
  if (typeof a === 'number' && typeof b === 'number') return a - b;
  return collator.compare(String(a), String(b));
}

// A rank for each row; equal values have equal ranks, missing ones the lowest.
export function ranksOf(rows, column) {
  const missing = (value) => value == null || value === '';
  const values = [...new Set(rows.map((cells) => cells[column]))].filter((value) => !missing(value)).sort(compare);
  const rankOf = new Map(values.map((value, rank) => [value, rank + 1]));
  return Uint32Array.from(rows, (cells) => rankOf.get(cells[column]) ?? 0);
}
