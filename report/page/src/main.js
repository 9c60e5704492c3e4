// The report: reads its data, makes the parts, and leads from one to the next.
import './no_markup.js';
import {Navigation, readHash} from './navigation.js';
import {searchOverview, showOverview} from './overview.js';
import {Search} from './search.js';
import {TableView} from './table_view.js';
import {Timeline} from './timeline.js';
import {element, foreign} from './dom.js';
import {plural} from './format.js';
import {readReport} from './data.js';
import {startPrinting} from './print.js';
import {startTheme} from './theme.js';
import {visible} from './text.js';

const at = (id) => document.getElementById(id);

class Report {
  #report;
  #views = new Map(); // id of a table -> TableView
  #counts = new Map(); // id of a part -> number of matches
  #navigation;
  #overview = element('section', {class: 'view overview', 'aria-label': 'Overview', hidden: true});
  #timeline = null;
  #timelineHost = null;
  #search;
  #query = '';
  #current = null; // id of the part in view

  constructor(report) {
    this.#report = report;
    document.title = visible(['Support report', report.machine].filter(Boolean).join(' – '));
    at('subtitle').append(foreign([report.machine, report.product].filter(Boolean).join(' · ')));
    this.#navigation = new Navigation(at('nav'), report.tables);
    at('main').append(this.#overview);
    for (const table of report.tables) this.#addTable(table);
    this.#startOverview();
    this.#search = new Search(report.tables, (table, matches, count) => this.#showMatches(table, matches, count));
    this.#startSearchField();
    startTheme(at('theme'), () => this.#timeline?.redraw());
    startPrinting(
      [...this.#views.values()],
      at('print-view'),
      () => {
        this.#overview.hidden = false;
        this.#showTimeline('overview');
      },
      () => {
        this.#overview.hidden = this.#current !== 'overview';
        this.#showTimeline(this.#current);
      },
    );
    at('print').addEventListener('click', () => print());
    addEventListener('hashchange', () => this.#go());
    this.#go();
    this.#search.prepare();
  }

  #addTable(table) {
    const findings = new Map();
    for (const {title, evidence} of this.#report.findings) {
      for (const one of evidence) {
        if (one.table === table.id && Number.isInteger(one.row))
          findings.set(one.row, [...(findings.get(one.row) ?? []), title]);
      }
    }
    const host = element('section', {
      class: 'view table',
      'aria-label': visible(table.title ?? table.id),
      hidden: true,
    });
    at('main').append(host);
    const severity = this.#report.timeline?.table === table ? this.#report.timeline.severity : -1;
    this.#views.set(
      table.id,
      new TableView(table, host, {findings, severity, onClearSearch: () => this.#setQuery('')}),
    );
    this.#navigation.setCount(table.id, table.rows.length);
  }

  #startOverview() {
    const {timeline} = this.#report;
    if (timeline) {
      this.#timelineHost = element(
        'section',
        {class: 'card', id: 'timeline', 'aria-label': 'Events over time'},
        element('h2', {}, 'Events over time'),
      );
      this.#timeline = new Timeline(timeline, (from, to) => {
        this.#views.get(timeline.table.id).setInterval({column: timeline.time, from, to});
        location.hash = encodeURIComponent(timeline.table.id);
      });
    }
    const linkOf = ({table, row}) => {
      if (!this.#views.has(table)) return null;
      const exists = row >= 0 && row < this.#views.get(table).table.rows.length;
      return `#${encodeURIComponent(table)}${exists ? `/${row}` : ''}`;
    };
    showOverview(this.#report, this.#overview, {timelineHost: this.#timelineHost, linkOf});
    this.#navigation.setCount('overview', null);
  }

  // Shows the part that the address names.
  #go() {
    const {id, row} = readHash(location.hash);
    const name = this.#views.has(id) ? id : 'overview';
    if (name !== this.#current) {
      this.#current = name;
      this.#overview.hidden = name !== 'overview';
      for (const [other, view] of this.#views) if (other !== name) view.hide();
      this.#views.get(name)?.show();
      this.#navigation.setCurrent(name);
      at('main').scrollTop = 0;
    }
    this.#showTimeline(name);
    const view = this.#views.get(name);
    if (view && row !== null && row < view.table.rows.length) view.reveal(row);
  }

  // There is one timeline: it stands in the overview and above the events, wherever the reader is.
  #showTimeline(name) {
    if (name === 'overview') this.#timeline?.showIn(this.#timelineHost);
    else if (name === this.#report.timeline?.table.id) this.#timeline.showIn(this.#views.get(name).top);
  }

  #startSearchField() {
    const field = at('search');
    field.addEventListener('input', () => this.#setQuery(field.value, false));
    field.addEventListener('keydown', (event) => {
      if (event.key === 'Enter') this.#goToMatches(event.shiftKey ? -1 : 1);
      if (event.key === 'Escape') this.#setQuery('');
    });
    addEventListener('keydown', (event) => {
      const typing = event.target.closest?.('input, textarea, select');
      const asked = event.key === '/' && !typing && !event.ctrlKey && !event.metaKey && !event.altKey;
      const find = event.key === 'f' && (event.ctrlKey || event.metaKey) && event.target !== field;
      if (!asked && !find) return;
      event.preventDefault();
      field.focus();
      field.select();
    });
  }

  async #setQuery(query, fill = true) {
    if (fill) at('search').value = query;
    this.#query = query.trim();
    const found = searchOverview(this.#query);
    this.#counts.set('overview', found);
    this.#navigation.setCount('overview', this.#query ? found : null);
    const done = await this.#search.run(this.#query, this.#views.get(this.#current)?.table);
    if (!done) return;
    const matches = [...this.#counts.values()].reduce((sum, count) => sum + count, 0);
    at('search-result').textContent = this.#query ? `${plural(matches, 'match').replace(/chs$/, 'ches')}` : '';
    document.documentElement.dataset.searched = this.#query;
  }

  #showMatches(table, matches, count) {
    this.#counts.set(table.id, count);
    this.#navigation.setCount(table.id, count, matches ? table.rows.length : null);
    this.#views.get(table.id).setMatches(matches);
  }

  // To the next (1) or previous (-1) part that holds matches.
  #goToMatches(direction) {
    if (!this.#query) return;
    const ids = ['overview', ...this.#views.keys()];
    const start = ids.indexOf(this.#current);
    for (let step = 1; step <= ids.length; ++step) {
      const id = ids[(start + direction * step + ids.length * step) % ids.length];
      if (this.#counts.get(id) > 0) {
        location.hash = encodeURIComponent(id);
        return;
      }
    }
  }
}

function start() {
  const problem = (text) => {
    at('problem').textContent = text;
    at('problem').hidden = false;
  };
  let report;
  try {
    report = readReport();
  } catch (error) {
    problem(`The data of this report cannot be read: ${visible(error.message)}`);
    return;
  }
  if (!report) problem('This page holds no data. support_report.exe writes reports.');
  else new Report(report);
}

start();
