// The printed report: plain tables in the place of the grids, which hold only the rows in view.
import {element, foreign} from './dom.js';
import {formatCell, formatCount, plural} from './format.js';

const kMostRows = 200; // of a table
const kMostText = 500; // characters of a cell

// `before` and `after` are called around the printing, when the colours are those of paper and when they are back.
export function startPrinting(views, host, before, after) {
  let closed = [];
  addEventListener('beforeprint', () => {
    host.replaceChildren(...views.map(printed));
    closed = [...document.querySelectorAll('.finding:not([open])')];
    for (const finding of closed) finding.open = true;
    document.documentElement.classList.add('printing');
    before();
  });
  addEventListener('afterprint', () => {
    host.replaceChildren();
    for (const finding of closed) finding.open = false;
    document.documentElement.classList.remove('printing');
    after();
  });
}

function printed(view) {
  const {columns, rows, title, id, tree, parent} = view.table;
  const {rows: shown, count} = view.printed(kMostRows);
  const kept = columns.map((column, index) => ({...column, index})).filter(({index}) => index !== parent || !tree);
  const cell = (text) => foreign(text.length > kMostText ? `${text.slice(0, kMostText)}…` : text);
  const body = shown.map((row) =>
    element(
      'tr',
      {},
      ...kept.map(({index, type}, at) => {
        const made = element(
          'td',
          {class: ['number', 'bytes', 'time'].includes(type) ? 'short' : null},
          cell(formatCell(rows[row][index], type)),
        );
        if (tree && at === 0) made.style.paddingInlineStart = `${4 + Math.min(tree.depth[row], 24) * 6}pt`;
        return made;
      }),
    ),
  );
  return element(
    'section',
    {},
    element('h2', {}, foreign(title ?? id)),
    element('p', {class: 'quiet'}, describe(shown.length, count, rows.length)),
    element(
      'table',
      {},
      element(
        'thead',
        {},
        element('tr', {}, ...kept.map((column) => element('th', {scope: 'col'}, foreign(column.title ?? column.id)))),
      ),
      element('tbody', {}, ...body),
    ),
  );
}

function describe(shown, count, all) {
  const chosen = count === all ? '' : ` that match, of ${formatCount(all)}`;
  if (shown === count) return `${plural(count, 'row')}${chosen}`;
  const rows = `The first ${formatCount(shown)} of ${plural(count, 'row')}${chosen}`;
  return `${rows} are printed; the report on the screen holds the rest.`;
}
