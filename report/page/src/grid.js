// One table of the report in a grid that draws only the rows in view.
import {
  CellStyleModule,
  ClientSideRowModelApiModule,
  ClientSideRowModelModule,
  ColumnApiModule,
  DateFilterModule,
  EventApiModule,
  ExternalFilterModule,
  LocaleModule,
  ModuleRegistry,
  NumberFilterModule,
  RenderApiModule,
  RowApiModule,
  RowStyleModule,
  ScrollApiModule,
  TextFilterModule,
  createGrid,
} from 'ag-grid-community';
import {appendText, hasSpecial, visible} from './text.js';
import {adoptGridStyles, themeOptions} from './grid_theme.js';
import {formatCell} from './format.js';
import {openRows, regroup, withAncestors} from './tree.js';
import {ranksOf} from './ranks.js';
import {severityOf} from './severity.js';

ModuleRegistry.registerModules([
  CellStyleModule,
  ClientSideRowModelApiModule,
  ClientSideRowModelModule,
  ColumnApiModule,
  DateFilterModule,
  EventApiModule,
  ExternalFilterModule,
  LocaleModule,
  NumberFilterModule,
  RenderApiModule,
  RowApiModule,
  RowStyleModule,
  ScrollApiModule,
  TextFilterModule,
]);

const kByDate = ['software', 'updates']; // tables that open with what came last at the top
const kSampleRows = 300;
const kIndent = 2.3; // letters
const [kLetter, kPadding, kNarrowest, kNarrowestTime, kWidest] = [7.1, 30, 96, 178, 420]; // pixels

export class Grid {
  #table;
  #severity;
  #api;
  #matches = null; // of the search, a byte for each row, or null: all
  #interval = null; // {column, from, to}: rows with a time in it only
  #collapsed = new Set();
  #open = null; // of a tree with collapsed rows: a byte for each row
  #marked = -1;

  // `onRow(index, chosen)` is called when a row gets the focus, `chosen` by a click or Enter; `onShown(count)` when the
  // rows that are shown have changed. severity: the index of the column that holds one, or -1.
  constructor(table, host, {cited, severity, onRow, onShown}) {
    adoptGridStyles();
    this.#table = table;
    this.#severity = severity;
    const order = table.tree?.order ?? table.rows.keys();
    this.#api = createGrid(host, {
      ...themeOptions,
      columnDefs: table.columns.map((column, index) => this.#column(column, index)),
      rowData: Array.from(order, (index) => ({index, cells: table.rows[index]})),
      defaultColDef: {
        sortable: true,
        resizable: true,
        filter: true,
        floatingFilter: true,
        suppressHeaderMenuButton: true,
      },
      suppressFieldDotNotation: true,
      suppressDragLeaveHidesColumns: true,
      suppressCellFocus: false,
      animateRows: false,
      rowBuffer: 6,
      enableCellTextSelection: true,
      ensureDomOrder: true,
      isExternalFilterPresent: () => this.#matches !== null || this.#interval !== null || this.#open !== null,
      doesExternalFilterPass: ({data}) => this.#passes(data),
      postSortRows: table.tree ? ({nodes}) => this.#regroup(nodes) : undefined,
      rowClassRules: {
        cited: ({data}) => cited.has(data.index),
        marked: ({data}) => data.index === this.#marked,
      },
      localeText: {noRowsToShow: 'The package holds none', noMatchingRows: 'No row matches'},
      onModelUpdated: () => onShown(this.shown),
      onCellFocused: ({rowIndex}) => {
        const node = rowIndex == null ? null : this.#api.getDisplayedRowAtIndex(rowIndex);
        if (node) onRow(node.data.index, false);
      },
      onCellClicked: ({data}) => onRow(data.index, true),
      onCellKeyDown: ({data, event}) => {
        if (event.key === 'Enter') onRow(data.index, true);
      },
    });
  }

  get shown() {
    return this.#api ? this.#api.getDisplayedRowCount() : 0;
  }

  get filtered() {
    return this.#api !== undefined && Object.keys(this.#api.getFilterModel()).length > 0;
  }

  clearFilters() {
    this.#api.setFilterModel(null);
  }

  // The indexes of the rows that are shown, in their order, at most `limit`.
  rows(limit) {
    return Array.from(
      {length: Math.min(limit, this.shown)},
      (_, at) => this.#api.getDisplayedRowAtIndex(at).data.index,
    );
  }

  setMatches(matches) {
    this.#matches = matches && this.#table.tree ? withAncestors(this.#table.tree, matches) : matches;
    this.#api.onFilterChanged();
  }

  setInterval(interval) {
    this.#interval = interval;
    this.#api.onFilterChanged();
  }

  // Scrolls to a row and marks it; what hides it is cleared, but for the search and the interval, which the caller
  // owns.
  reveal(index) {
    if (this.filtered) this.clearFilters();
    for (let above = this.#table.tree?.parent[index] ?? -1; above >= 0; above = this.#table.tree.parent[above]) {
      this.#collapsed.delete(above);
    }
    this.#filterTree();
    this.#marked = index;
    let found = null;
    this.#api.forEachNodeAfterFilterAndSort((node) => {
      if (node.data.index === index) found = node;
    });
    this.#api.redrawRows();
    if (!found) return;
    this.#api.ensureNodeVisible(found, 'middle');
    this.#api.setFocusedCell(found.rowIndex, this.#api.getAllDisplayedColumns()[0]);
  }

  #passes({index, cells}) {
    if (this.#matches !== null && !this.#matches[index]) return false;
    if (this.#interval !== null) {
      const time = cells[this.#interval.column];
      if (!(time >= this.#interval.from && time < this.#interval.to)) return false;
    }
    return this.#open === null || this.#matches !== null || this.#open[index] === 1;
  }

  #filterTree() {
    this.#open = this.#collapsed.size > 0 ? openRows(this.#table.tree, this.#collapsed) : null;
    this.#api.onFilterChanged();
  }

  #regroup(nodes) {
    const byIndex = new Map(nodes.map((node) => [node.data.index, node]));
    regroup(this.#table.tree, [...byIndex.keys()]).forEach((index, at) => {
      nodes[at] = byIndex.get(index);
    });
  }

  #column(column, index) {
    const {rows, tree, parent} = this.#table;
    let ranks = null;
    const isNumber = ['number', 'bytes'].includes(column.type);
    const isText = !isNumber && column.type !== 'time';
    const definition = {
      colId: `c${index}`,
      headerName: visible(column.title ?? column.id),
      hide: tree !== null && index === parent,
      valueGetter: ({data}) => data.cells[index],
      valueFormatter: ({value}) => formatCell(value, column.type),
      filterValueGetter: isText ? ({data}) => formatCell(data.cells[index], column.type) : undefined,
      filter:
        {number: 'agNumberColumnFilter', bytes: 'agNumberColumnFilter', time: 'agDateColumnFilter'}[column.type] ??
        'agTextColumnFilter',
      filterParams: {debounceMs: 120, comparator: column.type === 'time' ? compareDay : undefined},
      comparator: (a, b, one, other) => {
        ranks ??= ranksOf(rows, index);
        return ranks[one.data.index] - ranks[other.data.index];
      },
      cellClass: isNumber ? 'number' : undefined,
      headerClass: isNumber ? 'ag-right-aligned-header' : undefined,
      cellRendererSelector: ({value}) =>
        typeof value === 'string' && hasSpecial(value) ? {component: specialCell} : undefined,
      initialWidth: this.#width(column, index),
    };
    if (kByDate.includes(this.#table.id) && this.#table.columns.findIndex(({type}) => type === 'time') === index)
      definition.initialSort = 'desc';
    if (index === this.#severity) definition.cellClass = ({value}) => `severity ${severityOf(value)}`;
    if (column.id === 'signed') definition.cellClass = ({value}) => (value === false ? 'severity warning' : undefined);
    if (column.id === 'kind') definition.cellClass = ({value}) => `kind-${/^[a-z]+$/.test(value) ? value : 'other'}`;
    if (tree && index === 0) {
      definition.cellRendererSelector = undefined;
      definition.cellRenderer = (params) => this.#treeCell(params);
      definition.suppressKeyboardEvent = (params) => this.#treeKey(params);
    }
    const last = this.#table.columns.length - (tree && parent === this.#table.columns.length - 1 ? 2 : 1);
    if (index === last) Object.assign(definition, {flex: 1, minWidth: definition.initialWidth});
    return definition;
  }

  // By the texts of the first rows: most fit, a few long ones do not widen the column.
  #width(column, index) {
    const tree = index === 0 ? this.#table.tree : null;
    const lengths = this.#table.rows
      .slice(0, kSampleRows)
      .map((cells, row) => formatCell(cells[index], column.type).length + (tree ? (tree.depth[row] + 1) * kIndent : 0))
      .sort((a, b) => a - b);
    const usual = lengths[tree ? lengths.length - 1 : Math.floor(lengths.length * 0.9)] ?? 0;
    const dot = index === this.#severity ? 16 : 0;
    const width = Math.max(usual, (column.title ?? column.id).length + 3) * kLetter + kPadding + dot;
    return Math.round(Math.min(Math.max(width, column.type === 'time' ? kNarrowestTime : kNarrowest), kWidest));
  }

  #treeCell({data, value}) {
    const {tree} = this.#table;
    const cell = document.createElement('span');
    cell.className = 'tree-cell';
    cell.style.paddingInlineStart = `${Math.min(tree.depth[data.index], 24) * 16}px`;
    const toggle = document.createElement('span');
    toggle.className = 'toggle';
    if (tree.hasChildren[data.index]) {
      toggle.classList.add(this.#collapsed.has(data.index) ? 'closed' : 'open');
      toggle.addEventListener('click', () => this.#toggle(data.index));
    }
    const text = document.createElement('bdi');
    cell.append(toggle, appendText(text, formatCell(value)));
    return cell;
  }

  #toggle(index, open = this.#collapsed.has(index)) {
    if (open) this.#collapsed.delete(index);
    else this.#collapsed.add(index);
    this.#filterTree();
    this.#api.refreshCells({force: true, columns: ['c0']});
  }

  // Right opens and left closes, as long as there is something to open or close.
  #treeKey({event, data}) {
    const {tree} = this.#table;
    const closed = this.#collapsed.has(data.index);
    if (event.type !== 'keydown' || !tree.hasChildren[data.index]) return false;
    if ((event.key === 'ArrowRight' && closed) || (event.key === 'ArrowLeft' && !closed)) {
      this.#toggle(data.index);
      return true;
    }
    return false;
  }
}

function specialCell({value}) {
  return appendText(document.createElement('bdi'), value);
}

// The filter's day is one of the reader's own clock, the cell's that of the customer's: both by what a calendar shows.
function compareDay(day, cell) {
  if (cell == null) return -1;
  const from = Date.UTC(day.getFullYear(), day.getMonth(), day.getDate());
  return cell < from ? -1 : cell < from + 86400000 ? 0 : 1;
}
