// The rules of the page that need no browser.
import assert from 'node:assert/strict';
import {test} from 'node:test';

import {complete} from './data.js';
import {formatBytes, formatCell, formatTime} from './format.js';
import {binWidth, countBins, lowerBound, readEvents} from './histogram.js';
import {readHash} from './navigation.js';
import {ranksOf} from './ranks.js';
import {Search, wordsOf} from './search.js';
import {severityOf} from './severity.js';
import {hasSpecial, visible} from './text.js';
import {layOut, openRows, regroup, withAncestors} from './tree.js';

test('characters that hide, control or turn are shown as signs, all others as they are', () => {
  for (const [text, shown] of [
           ['a\u0000b', 'aU+0000b'], ['\u001b[31m', 'U+001B[31m'], ['\u0085', 'U+0085'],
           ['x\u202Egnp.exe', 'xU+202Egnp.exe'], ['\u2066\u2069', 'U+2066U+2069'], ['\u200b\ufeff', 'U+200BU+FEFF'],
           ['\u{e0041}', 'U+E0041'], ['\ud800', 'U+D800'], ['one\ntwo\t', 'one↵two⇥'], ['a\r\nb\rc', 'a↵bU+000Dc'],
           ['\u2028', 'U+2028']]) {
    assert.equal(visible(text), shown);
    assert.equal(hasSpecial(text), true, shown);
  }
  for (const text of ['', 'plain', 'șțăâî', 'שלום', '日本', '😀', '</script>', 'a\u00a0b']) {
    assert.equal(visible(text), text);
    assert.equal(hasSpecial(text), false, text);
  }
});

test('cells read as their column says, and as they are when they are of another type', () => {
  for (const [value, type, text] of [
           [null, 'text', ''], [undefined, 'text', ''], [true, 'flag', 'yes'], [false, 'flag', 'no'],
           [12345, 'number', '12345'], [0, 'number', '0'], [0, 'bytes', '0 B'],
           [Date.UTC(2026, 0, 31, 10, 11, 12), 'time', '2026-01-31 10:11:12'], ['later', 'time', 'later'],
           [1e300, 'time', '1e+300'], [-1, 'time', '1969-12-31 23:59:59'], ['many', 'bytes', 'many'],
           [{a: 1}, 'text', '{"a":1}']])
    assert.equal(formatCell(value, type), text);
  assert.equal(formatTime(NaN), 'NaN');
  for (const [bytes, text] of [
           [1023, '1023 B'], [1024, '1.00 KiB'], [10 * 1024, '10.0 KiB'], [2 ** 60, '1024.0 PiB'], [-2048, '-2.00 KiB'],
           [Infinity, 'Infinity']]) {
    assert.equal(formatBytes(bytes), text);
  }
});

test('a tree stands depth first; parents that do not exist or run in a circle make roots', () => {
  for (const [parents, order, depths] of [
           [[null, 0, 0, 1], [0, 1, 3, 2], [0, 1, 1, 2]],
           [[2, 0, null], [2, 0, 1], [1, 2, 0]],
           [[5, -1, 'x', 1.5, NaN], [0, 1, 2, 3, 4], [0, 0, 0, 0, 0]],
           [[0], [0], [0]],
           [[], [], []],
  ]) {
    const tree = layOut(parents);
    assert.deepEqual(tree.order, order);
    assert.deepEqual([...tree.depth], depths);
  }
  const circle = layOut([1, 2, 0, 0]);
  assert.equal(circle.order.length, 4);
  assert.deepEqual([...circle.order].sort(), [0, 1, 2, 3]);
  assert.equal(layOut(Array.from({length: 20000}, (_, row) => row - 1)).depth[19999], 19999);
});

test('a closed row hides what is below it, a match is shown with what is above it', () => {
  const tree = layOut([null, 0, 1, null]);
  assert.deepEqual([...openRows(tree, new Set([1]))], [1, 1, 0, 1]);
  assert.deepEqual([...openRows(tree, new Set([0, 2]))], [1, 0, 0, 1]);
  assert.deepEqual([...withAncestors(tree, Uint8Array.of(0, 0, 1, 0))], [1, 1, 1, 0]);
});

test('sorted rows come back below their parents in the order of the sorting', () => {
  const tree = layOut([null, 0, 0, null, 3]);
  assert.deepEqual(regroup(tree, [4, 2, 3, 1, 0]), [3, 4, 0, 2, 1]);
  assert.deepEqual(regroup(tree, [4, 2]), [4, 2]);
});

test('values sort as people count, missing ones first, equal ones alike', () => {
  const rows = [['item 10'], ['item 9'], [null], ['Item 9'], [''], ['zebra']];
  const ranks = [...ranksOf(rows, 0)];
  assert.ok(ranks[1] < ranks[0] && ranks[0] < ranks[5]);
  assert.deepEqual([ranks[2], ranks[4]], [0, 0]);
  assert.deepEqual([...ranksOf([[10], [9], [-1]], 0)], [3, 2, 1]);
});

test('events are counted in bins of a usual width, none lost and none twice', () => {
  assert.deepEqual(
      [[0, 60e3], [0, 3600e3], [0, 7 * 86400e3], [0, 1e14]].map(([from, to]) => binWidth(from, to)),
      [1000, 30e3, 2 * 3600e3, 1e14 / 140]);
  const rows =
      [[5000, 'Error'], [1000, 'Warning'], [null, 'Error'], [1999, 'error'], ['odd', 'Error'], [2000, 'Verbose']];
  const events = readEvents(rows, 0, 1);
  assert.deepEqual([...events.times], [1000, 1999, 2000, 5000]);
  const {starts, counts} = countBins(events, 1000, 5000);
  assert.deepEqual(starts, [1000, 2000, 3000, 4000, 5000]);
  assert.deepEqual(
      counts.map((bins) => [...bins]),
      [[0, 0, 0, 0, 0], [1, 0, 0, 0, 1], [1, 0, 0, 0, 0], [0, 0, 0, 0, 0], [0, 1, 0, 0, 0]]);
  assert.equal(readEvents([[null]], 0, 1), null);
  assert.deepEqual([0, 1, 1.5, 4].map((time) => lowerBound([1, 1, 2, 3], time)), [0, 0, 2, 4]);
});

test('words of a search, severities, addresses', () => {
  for (const [query, words] of [
           ['', []], ['  Disk  Full ', ['disk', 'full']], ['"Access denied" x', ['access denied', 'x']],
           ['"open', ['open']], ['""', []]]) {
    assert.deepEqual(wordsOf(query), words);
  }
  for (const [text, severity] of [
           ['ERROR', 'error'], [' Info ', 'information'], ['Audit Failure', 'error'], ['constructor', 'other'],
           [null, 'other'], [3, 'other']]) {
    assert.equal(severityOf(text), severity);
  }
  for (const [hash, id, row] of [
           ['', 'overview', null], ['#events', 'events', null], ['#events/12', 'events', 12], ['#a%20b/0', 'a b', 0],
           ['#%', 'overview', null], ['#x/y/1', 'overview', null]]) {
    assert.deepEqual(readHash(hash), {id, row});
  }
});

test('a search looks through all tables, the one in view first, and a later one ends it', async () => {
  const table = (id, rows) => ({id, columns: [{type: 'text'}, {type: 'bytes'}], rows});
  const tables = [
    table('one', [['Alpha', 1024], ['beta', null]]),
    table('two', Array.from({length: 5000}, (_, row) => [`Row ${row}`, row]))
  ];
  const results = [];
  const search =
      new Search(tables, ({id}, matches, count) => results.push([id, count, matches && [...matches].indexOf(1)]));
  assert.equal(await search.run('row 4999', tables[1]), true);
  assert.deepEqual(results.splice(0), [['two', 1, 4999], ['one', 0, -1]]);
  await search.run('1.00 kib alp', null);
  assert.deepEqual(results.splice(0)[0], ['one', 1, 0]);
  await search.run('', null);
  assert.deepEqual(results.splice(0), [['one', 2, null], ['two', 5000, null]]);
});

test('a data document that lacks everything makes an empty report, not an error', () => {
  for (const data
           of [{}, {tables: null, findings: 3, timeline: {table: 'none'}},
               {tables: [{id: 'x', columns: [], rows: [null, 1]}], timeline: {table: 'x', time: 'no'}}]) {
    const report = complete(data);
    assert.deepEqual([report.user, report.findings, report.timeline], [[], [], null]);
  }
});
