// Reads the data document that stands in the page. What it lacks is filled in, so that the rest of the page need not
// ask.
import {layOut} from './tree.js';

const list = (value) => (Array.isArray(value) ? value : []);

// null when the page holds no data.
export function readReport() {
  const holder = document.getElementById('report-data');
  if (!holder) return null;
  const report = JSON.parse(holder.textContent);
  holder.remove(); // the text is as large as the package
  return complete(report);
}

export function complete(report) {
  const tables = list(report.tables).map(completeTable);
  return {
    ...report,
    source: report.source ?? {},
    user: list(report.user),
    missing: list(report.missing),
    gauges: list(report.gauges),
    tables,
    findings: list(report.findings).map((finding) => ({...finding, evidence: list(finding.evidence)})),
    timeline: completeTimeline(report.timeline, tables),
  };
}

function completeTable(table) {
  const columns = list(table.columns);
  const rows = list(table.rows).map(list);
  const parent = columns.findIndex((column) => column.id === table.parent);
  return {
    ...table,
    id: String(table.id),
    columns,
    rows,
    tree: table.parent != null && parent >= 0 ? layOut(rows.map((cells) => cells[parent])) : null,
    parent,
  };
}

// With the table and the columns' indexes in the place of their ids; null when one of them is not there.
function completeTimeline(timeline, tables) {
  const table = tables.find((one) => one.id === timeline?.table);
  const columnOf = (id) => table.columns.findIndex((column) => column.id === id);
  if (!table || columnOf(timeline.time) < 0) return null;
  const interval =
    Number.isFinite(timeline.from) && Number.isFinite(timeline.to) ? {from: timeline.from, to: timeline.to} : null;
  return {table, time: columnOf(timeline.time), severity: columnOf(timeline.severity), interval};
}
