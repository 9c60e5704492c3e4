// How many events of each severity there are over time. Pure functions; times in milliseconds.
import {kSeverities, severityOf} from './severity.js';

const [kSecond, kMinute, kHour, kDay] = [1000, 60000, 3600000, 86400000];
const kWidths = [1, 2, 5, 10, 30]
  .map((count) => count * kSecond)
  .concat(
    [1, 2, 5, 10, 30].map((count) => count * kMinute),
    [1, 2, 3, 6, 12].map((count) => count * kHour),
    [1, 7, 30, 365].map((count) => count * kDay),
  );
const kMostBins = 140;

// The events of a table in the order of time: {times, severities (indexes into kSeverities), from, to}; null without
// any.
export function readEvents(rows, timeColumn, severityColumn) {
  const order = [];
  rows.forEach((cells, row) => {
    if (Number.isFinite(cells[timeColumn])) order.push(row);
  });
  if (order.length === 0) return null;
  order.sort((a, b) => rows[a][timeColumn] - rows[b][timeColumn]);
  const times = Float64Array.from(order, (row) => rows[row][timeColumn]);
  const severities = Uint8Array.from(order, (row) => kSeverities.indexOf(severityOf(rows[row][severityColumn])));
  return {times, severities, from: times[0], to: times[times.length - 1]};
}

// The narrowest of the usual widths that needs no more than kMostBins bins.
export function binWidth(from, to) {
  return kWidths.find((width) => (to - from) / width <= kMostBins) ?? (to - from) / kMostBins;
}

// The bins between two times: {width, starts, counts: one array for each severity}.
export function countBins(events, from, to) {
  const width = binWidth(from, to);
  const first = Math.floor(from / width) * width;
  const bins = Math.floor((to - first) / width) + 1;
  const counts = kSeverities.map(() => new Uint32Array(bins));
  for (let i = lowerBound(events.times, first); i < events.times.length; ++i) {
    const bin = Math.floor((events.times[i] - first) / width);
    if (bin >= bins) break;
    ++counts[events.severities[i]][bin];
  }
  return {width, starts: Array.from({length: bins}, (_, bin) => first + bin * width), counts};
}

// The index of the first time that is not before `time`.
export function lowerBound(times, time) {
  let [low, high] = [0, times.length];
  while (low < high) {
    const middle = (low + high) >> 1;
    if (times[middle] < time) low = middle + 1;
    else high = middle;
  }
  return low;
}
