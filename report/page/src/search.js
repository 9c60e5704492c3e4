// The search over everything: which rows of which table hold all the words. The texts that are searched are made once,
// lower case, in idle time; the tables are looked through in slices, so that typing is never held up.
import {formatCell} from './format.js';

const kSlice = 8; // milliseconds of work at a time
const kRowsBetweenClocks = 512;

// "error  \"access denied\"" -> ['error', 'access denied']
export function wordsOf(query) {
  return Array.from(query.toLowerCase().matchAll(/"([^"]*)"?|[^\s"]+/g), (match) => match[1] ?? match[0]).filter(
    Boolean,
  );
}

export class Search {
  #parts;
  #onResult;
  #run = 0;

  // `onResult(table, matches, count)` is called for each table when it was looked through; matches: a byte for each
  // row, or null when there are no words.
  constructor(tables, onResult) {
    this.#parts = tables.map((table) => ({table, texts: [], types: table.columns.map((column) => column.type)}));
    this.#onResult = onResult;
  }

  // Makes the texts ahead of the first search, as long as nothing else is to do.
  prepare() {
    const idle = globalThis.requestIdleCallback ?? ((call) => setTimeout(call, 50));
    const part = this.#parts.find((one) => one.texts.length < one.table.rows.length);
    if (part)
      idle(() => {
        this.#makeTexts(part, performance.now() + kSlice);
        this.prepare();
      });
  }

  // Looks through all tables, `first` before the others. A later call ends an earlier one. Resolves when all is done or
  // ended.
  async run(query, first) {
    const run = ++this.#run;
    const words = wordsOf(query);
    const parts = [...this.#parts].sort((a, b) => (b.table === first) - (a.table === first));
    let end = performance.now() + 5 * kSlice; // the table in view is best shown at once
    for (const part of parts) {
      if (words.length === 0) {
        this.#onResult(part.table, null, part.table.rows.length);
        continue;
      }
      const matches = new Uint8Array(part.table.rows.length);
      let [row, count] = [0, 0];
      while (row < matches.length) {
        if (performance.now() >= end) {
          await new Promise((resolve) => {
            setTimeout(resolve);
          });
          if (run !== this.#run) return false;
          end = performance.now() + kSlice;
        }
        const stop = Math.min(row + kRowsBetweenClocks, matches.length);
        this.#makeTexts(part, Infinity, stop);
        for (; row < stop; ++row) {
          if (words.every((word) => part.texts[row].includes(word))) {
            matches[row] = 1;
            ++count;
          }
        }
      }
      this.#onResult(part.table, matches, count);
    }
    return true;
  }

  #makeTexts({table, texts, types}, end, stop = table.rows.length) {
    while (texts.length < stop) {
      if (texts.length % kRowsBetweenClocks === 0 && performance.now() >= end) return;
      texts.push(
        table.rows[texts.length]
          .map((cell, column) => formatCell(cell, types[column]))
          .join('\n')
          .toLowerCase(),
      );
    }
  }
}
