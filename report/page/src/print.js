// The printed report: plain tables in the place of the grids, which hold only the rows in view.
import {element, foreign} from './dom.js';
import {formatCell, formatCount, plural} from './format.js';

const kMostRows = 200;   // of a table
const kMostText = 500;   // characters of a cell

export function startPrinting(views, host, onColours) {
  addEventListener('beforeprint', () => {
    host.replaceChildren(...views.map(printed));
    document.documentElement.classList.add('printing');
    onColours();
  });
  addEventListener('afterprint', () => {
    host.replaceChildren();
    document.documentElement.classList.remove('printing');
    onColours();
  });
}

function printed(view) {
  const {columns, rows, title, id, tree, parent} = view.table;
  const {rows: shown, count} = view.printed(kMostRows);
  const kept = columns.map((column, index) => ({...column, index})).filter(({index}) => index !== parent || !tree);
  const cell = (text) => foreign(text.length > kMostText ? `${text.slice(0, kMostText)}…` : text);
  const body = shown.map((row) => element('tr', {}, ...kept.map(({index, type}) => element('td', {}, cell(formatCell(rows[row][index], type))))));
  return element('section', {}, element('h2', {}, foreign(title ?? id)),
    element('p', {class: 'quiet'}, describe(shown.length, count, rows.length)),
    element('table', {}, element('thead', {}, element('tr', {}, ...kept.map((column) => element('th', {scope: 'col'}, foreign(column.title ?? column.id))))),
      element('tbody', {}, ...body)));
}

function describe(shown, count, all) {
  const chosen = count === all ? '' : ` that match, of ${formatCount(all)}`;
  if (shown === count) return `${plural(count, 'row')}${chosen}`;
  return `The first ${formatCount(shown)} of ${plural(count, 'row')}${chosen} are printed; the report on the screen holds the rest.`;
}
