// The top of the report: the machine and product, the user's own words, what is missing, the gauges and the findings.
import {element, foreign} from './dom.js';
import {formatBytes, formatCount, plural} from './format.js';
import {visible} from './text.js';
import {wordsOf} from './search.js';

const kFull = 0.9;
const kSeverityNames = {error: 'Error', warning: 'Warning', info: 'Information'};

// The parts that the search hides when they do not match, each with its text.
let searched = [];

// `timelineHost` is put in its place; linkOf(evidence) is the address of its row, or else its table, or null.
export function showOverview(report, host, {timelineHost, linkOf}) {
  searched = [];
  host.append(
    ...[
      report.comparison && comparison(report.comparison, report.tables),
      machine(report),
      element('div', {class: 'columns'}, words(report.user), missing(report.missing)),
      findings(report.findings, linkOf),
      timelineHost,
      gauges(report.gauges),
    ].filter(Boolean),
  );
}

// Hides what does not hold all the words; the number of parts that do.
export function searchOverview(query) {
  const queried = wordsOf(query);
  let count = 0;
  for (const {node, text} of searched) {
    const matches = queried.every((word) => text.includes(word));
    node.hidden = !matches;
    if (matches) ++count;
  }
  return count;
}

function searchable(node, ...texts) {
  searched.push({node, text: texts.join('\n').toLowerCase()});
  return node;
}

function section(id, title, ...children) {
  return element(
    'section',
    {id, class: 'card', 'aria-labelledby': `${id}-title`},
    element('h2', {id: `${id}-title`}, title),
    ...children,
  );
}

function describe(source) {
  const parts = [
    visible(source.name ?? 'unnamed package'),
    Number.isFinite(source.bytes) ? formatBytes(source.bytes) : null,
    source.collectedAt ? `collected ${readable(source.collectedAt)}` : 'time of collection unknown',
  ];
  return parts.filter(Boolean).join(' · ');
}

// 2026-01-31T10:11:12Z, of the whole report the only time that is not the customer's clock.
function readable(time) {
  return visible(String(time).replace(/^(\d{4}-\d\d-\d\d)T(\d\d:\d\d(:\d\d)?)(\.\d+)?Z$/, '$1 $2 UTC'));
}

function machine({machine: text, product, source, tool}) {
  return element(
    'section',
    {class: 'machine', 'aria-label': 'Machine and product'},
    element(
      'dl',
      {},
      element('dt', {}, 'Machine'),
      element('dd', {}, foreign(text || 'unknown')),
      element('dt', {}, 'Product'),
      element('dd', {}, foreign(product || 'unknown')),
      element('dt', {}, 'Package'),
      element('dd', {}, describe(source)),
      element('dt', {}, 'Report by'),
      element('dd', {}, foreign(tool ?? '')),
    ),
  );
}

function comparison({with: other, changes}, tables) {
  const table = tables.find(({id}) => id === 'changes');
  const text = `${plural(changes, 'change')} since`;
  return element(
    'section',
    {class: 'comparison', 'aria-label': 'Comparison'},
    table ? element('a', {href: '#changes'}, text) : element('span', {}, text),
    element('span', {}, describe(other ?? {})),
  );
}

function words(user) {
  const entries = user.map(({label, value}) =>
    searchable(
      element(
        'div',
        {},
        element('dt', {}, foreign(label)),
        element('dd', {class: 'words'}, foreign(value, {lines: true})),
      ),
      label,
      value,
    ),
  );
  return section(
    'words',
    'In the user’s own words',
    entries.length > 0
      ? element('dl', {}, ...entries)
      : element('p', {class: 'quiet'}, 'The package holds no words of the user.'),
  );
}

function missing(list) {
  const entries = list.map(({what, why}) =>
    searchable(
      element('li', {}, element('b', {}, foreign(what)), element('span', {class: 'place'}, foreign(why))),
      what,
      why,
    ),
  );
  return section(
    'missing',
    `Missing${list.length > 0 ? ` (${list.length})` : ''}`,
    entries.length > 0
      ? element('ul', {class: 'missing'}, ...entries)
      : element('p', {class: 'quiet'}, 'Nothing: all that was to be collected is in the package.'),
  );
}

function findings(list, linkOf) {
  const count = (severity) => list.filter((finding) => finding.severity === severity).length;
  const summary = Object.entries(kSeverityNames)
    .filter(([severity]) => count(severity) > 0)
    .map(([severity, name]) => element('span', {class: `badge ${severity}`}, `${name} ${count(severity)}`));
  return section(
    'findings',
    'Findings',
    list.length > 0
      ? element('p', {class: 'summary'}, ...summary)
      : element('p', {class: 'quiet'}, 'No rule found anything.'),
    ...list.map((finding) => showFinding(finding, linkOf)),
  );
}

function showFinding({id, severity, title, explanation, count, evidence}, linkOf) {
  const known = kSeverityNames[severity] ? severity : 'info';
  const more = count - evidence.length;
  const details = element(
    'details',
    {class: `finding ${known}`, 'data-id': id, open: known !== 'info'},
    element(
      'summary',
      {},
      element('span', {class: `badge ${known}`}, kSeverityNames[known]),
      element('span', {class: 'name'}, foreign(title)),
      element('span', {class: 'quiet'}, plural(count ?? evidence.length, 'place')),
    ),
    element('p', {}, foreign(explanation)),
    element('ul', {class: 'evidence'}, ...evidence.map((one) => showEvidence(one, linkOf))),
    more > 0 ? element('p', {class: 'quiet'}, `and ${formatCount(more)} more`) : null,
  );
  return searchable(details, title, explanation, ...evidence.flatMap(({file, path, text}) => [file, path, text]));
}

function showEvidence(evidence, linkOf) {
  const text = foreign(evidence.text || evidence.path || evidence.file);
  const path = [evidence.file, evidence.path].filter(Boolean).join(' › ');
  const place = element('span', {class: 'place'}, foreign(path));
  const href = linkOf(evidence);
  return element('li', {}, href ? element('a', {href}, text) : text, ' ', place);
}

function gauges(list) {
  if (list.length === 0) return null;
  return section(
    'gauges',
    'Memory and disks',
    element(
      'div',
      {class: 'gauges'},
      ...list.map(({name, used, total, kind}) => {
        const part = total > 0 ? Math.min(Math.max(used / total, 0), 1) : 0;
        return element(
          'div',
          {class: `gauge ${kind === 'memory' ? 'memory' : 'disk'}`},
          element('span', {class: 'name'}, foreign(name)),
          element('meter', {
            min: 0,
            max: 1,
            low: kFull - 0.15,
            high: kFull,
            optimum: 0,
            value: part,
            'aria-label': `${visible(name)} used`,
          }),
          element(
            'span',
            {class: part >= kFull ? 'full' : 'quiet'},
            `${formatBytes(used)} of ${formatBytes(total)} used (${Math.round(part * 100)} %), ` +
              `${formatBytes(total - used)} free`,
          ),
        );
      }),
    ),
  );
}
