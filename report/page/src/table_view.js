// One table of the report with its heading, what restricts it, its grid and the details of one row.
import {element, foreign} from './dom.js';
import {Grid} from './grid.js';
import {formatCell, formatCount, formatTime, plural} from './format.js';

export class TableView {
  #table;
  #findings; // row index -> titles of the findings that rest on it
  #host;
  #severity;
  #onClearSearch;
  #grid = null;
  #matches = null;
  #interval = null;
  #count = element('span', {class: 'count', role: 'status'});
  #limits = element('span', {class: 'limits'});
  #details = element('aside', {class: 'details', 'aria-label': 'Details of the row', tabindex: '0', hidden: true});
  #gridHost = element('div', {class: 'grid'});

  constructor(table, host, {findings, severity, onClearSearch}) {
    this.#table = table;
    this.#host = host;
    this.#findings = findings;
    this.#severity = severity;
    this.#onClearSearch = onClearSearch;
    this.top = element('div', {class: 'above'});
  }

  get table() {
    return this.#table;
  }

  show() {
    this.#host.hidden = false;
    if (this.#grid) return;
    this.#host.append(
      element(
        'div',
        {class: 'heading'},
        element('h2', {}, foreign(this.#table.title ?? this.#table.id)),
        this.#count,
        this.#limits,
      ),
      this.top,
      element('div', {class: 'body'}, this.#gridHost, this.#details),
    );
    this.#grid = new Grid(this.#table, this.#gridHost, {
      cited: this.#findings,
      severity: this.#severity,
      onRow: (index, chosen) => {
        if (chosen || !this.#details.hidden) this.#showDetails(index);
      },
      onShown: (shown) => this.#describe(shown),
    });
    if (this.#matches) this.#grid.setMatches(this.#matches);
    if (this.#interval) this.#grid.setInterval(this.#interval);
    this.#describe(this.#grid.shown);
  }

  hide() {
    this.#host.hidden = true;
  }

  setMatches(matches) {
    if (matches === null && this.#matches === null) return;
    this.#matches = matches;
    this.#grid?.setMatches(matches);
  }

  // {column, from, to} or null.
  setInterval(interval) {
    this.#interval = interval;
    this.#grid?.setInterval(interval);
    this.#describe(this.#grid?.shown ?? 0);
  }

  reveal(index) {
    if (this.#matches && !this.#matches[index]) this.#onClearSearch();
    if (this.#interval) this.setInterval(null);
    this.#grid.reveal(index);
    this.#showDetails(index);
  }

  // What is to be printed: row indexes, and how many there are.
  printed(limit) {
    if (this.#grid) return {rows: this.#grid.rows(limit), count: this.#grid.shown};
    const rows = [];
    let count = 0;
    for (const index of this.#table.tree?.order ?? this.#table.rows.keys()) {
      if (this.#matches && !this.#matches[index]) continue;
      if (rows.length < limit) rows.push(index);
      ++count;
    }
    return {rows, count};
  }

  #describe(shown) {
    const all = this.#table.rows.length;
    this.#count.textContent = shown === all ? plural(all, 'row') : `${formatCount(shown)} of ${plural(all, 'row')}`;
    const chip = (text, remove) =>
      element('button', {type: 'button', class: 'chip', title: 'Remove this limit', onclick: remove}, `${text} ✕`);
    this.#limits.replaceChildren(
      ...[
        this.#interval &&
          chip(`${formatTime(this.#interval.from)} to ${formatTime(this.#interval.to)}`, () => this.setInterval(null)),
        this.#grid?.filtered && chip('Column filters', () => this.#grid.clearFilters()),
      ].filter(Boolean),
    );
  }

  #showDetails(index) {
    const cells = this.#table.rows[index];
    const entries = this.#table.columns.flatMap((column, at) => {
      const text = formatCell(cells[at], column.type);
      return text === '' || at === this.#table.parent
        ? []
        : [element('dt', {}, foreign(column.title ?? column.id)), element('dd', {}, foreign(text, {lines: true}))];
    });
    const titles = this.#findings.get(index) ?? [];
    const close = element(
      'button',
      {
        type: 'button',
        class: 'close',
        'aria-label': 'Close the details',
        onclick: () => {
          this.#details.hidden = true;
        },
      },
      '✕',
    );
    this.#details.replaceChildren(
      close,
      element('h3', {}, `Row ${formatCount(index + 1)}`),
      ...titles.map((title) => element('p', {class: 'finding-title'}, 'Evidence of: ', foreign(title))),
      element('dl', {}, ...entries),
    );
    this.#details.hidden = false;
  }
}
