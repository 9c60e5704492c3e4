// The page of the HTML report in a browser, opened from disk. ST_REPORT_PAGE: the page without data, ST_OUTPUT: a
// folder for the reports and their pictures, ST_CHROMIUM: the browser.
import assert from 'node:assert/strict';
import {mkdirSync, readFileSync, writeFileSync} from 'node:fs';
import {test} from 'node:test';
import {pathToFileURL} from 'node:url';
import {kHostile, sample, writeReport} from './report_sample.mjs';
import {launch, violations} from './browser.mjs';

const [template, output] = [process.env.ST_REPORT_PAGE, process.env.ST_OUTPUT];
mkdirSync(output, {recursive: true});
const browser = await launch();
test.after(() => browser.close());

const reports = {
  small: sample(),
  hostile: sample({hostile: true, eventCount: 50}),
  compared: sample({compared: true}),
  large: sample({eventCount: 50000}),
  empty: {version: 1, tables: []},
};
for (const [name, data] of Object.entries(reports)) writeReport(template, data, `${output}/${name}.html`);
const tableOf = (name, id) => reports[name].tables.find((table) => table.id === id);

// What the page must never do, a request or a message on the console, is in page.problems.
async function open(name, {hash = '', ...options} = {}) {
  const page = await browser.newPage({viewport: {width: 1360, height: 860}, ...options});
  page.problems = [];
  const file = pathToFileURL(`${output}/${name}.html`).href;
  page.on('pageerror', (error) => page.problems.push(String(error)));
  page.on('console', (message) => page.problems.push(message.text()));
  page.on('request', (request) => {
    if (request.url() !== file && !request.url().startsWith('data:')) page.problems.push(request.url());
  });
  await page.goto(file + hash);
  return page;
}

async function close(page) {
  assert.deepEqual(page.problems, []);
  await page.close();
}

const view = '.view:not([hidden])';
const go = (page, hash) =>
  page
    .evaluate((to) => {
      location.hash = to;
    }, hash)
    .then(() => page.waitForSelector(`${view} .ag-row`));
const count = (page) => page.textContent(`${view} .heading .count`);
const navCount = (page, id) => page.textContent(`nav a[href="#${id}"] .count`);

// The texts of a column of the rows that are drawn, from the top down.
const column = (page, id) =>
  page.$$eval(
    `${view} .ag-row`,
    (rows, name) =>
      rows
        .sort((a, b) => a.ariaRowIndex - b.ariaRowIndex)
        .map((row) => row.querySelector(`[col-id="${name}"]`)?.textContent),
    id,
  );

async function search(page, text) {
  await page.fill('#search', text);
  await page.waitForSelector(text ? `:root[data-searched=${JSON.stringify(text)}]` : ':root[data-searched=""]');
}

async function eventually(get, expected) {
  let last;
  for (let i = 0; i < 100; ++i) {
    last = await get();
    if (last === expected) return;
    await new Promise((resolve) => {
      setTimeout(resolve, 20);
    });
  }
  assert.equal(last, expected);
}

test('a hostile package is shown as text: nothing runs, nothing turns, nothing is hidden', async () => {
  const page = await open('hostile');
  const hidden = /[\u0000-\u0008\u200b-\u200f\u202a-\u202e\u2066-\u2069]/;
  for (const hash of ['overview', 'hostile', 'hostile/5', 'events']) {
    await page.evaluate((to) => {
      location.hash = to;
    }, hash);
    await page.waitForTimeout(100);
    assert.doesNotMatch(await page.evaluate(() => document.body.innerText + document.title), hidden, hash);
    assert.equal(await page.evaluate(() => globalThis.owned), undefined, hash);
    if (hash === 'hostile') {
      const shown = await column(page, 'c0');
      assert.equal(shown[0], kHostile[0]);
      assert.equal(shown[5], 'invoiceU+202Egnp.exe');
      assert.equal(await page.$$eval(`${view} .ag-row .special`, (signs) => signs.length), 14);
    }
  }
  assert.equal(await page.$$eval('main img, main svg[onload], main script', (found) => found.length), 0);
  await close(page);
});

test('the policy lets no other script, style, frame or address in', async () => {
  const policy = /http-equiv="Content-Security-Policy" content="([^"]*)"/.exec(readFileSync(template, 'utf8'))[1];
  assert.match(
    policy,
    new RegExp(
      "^default-src 'none'; script-src 'sha256-[^' ]+'; style-src 'sha256-[^' ]+'; img-src data:; base-uri 'none'; " +
        "form-action 'none'; require-trusted-types-for 'script'; trusted-types default$",
    ),
  );
  const page = await open('small');
  const refused = await page.evaluate(async () => {
    const directives = [];
    addEventListener('securitypolicyviolation', (event) => directives.push(event.effectiveDirective));
    const add = (name, attributes) => document.body.append(Object.assign(document.createElement(name), attributes));
    add('style', {textContent: 'body { display: none }'});
    add('iframe', {src: 'data:text/html,x'});
    add('img', {src: 'file:///x.png'});
    const holder = document.createElement('div');
    document.body.append(holder);
    try {
      holder.innerHTML = '<b onclick="globalThis.owned = 2">x</b>';
    } catch {
      holder.append('refused');
    }
    holder.setAttribute('style', 'color: red');
    await fetch('http://localhost:9/').catch(() => {});
    await new Promise((resolve) => {
      setTimeout(resolve, 100);
    });
    return {
      directives: directives.sort(),
      owned: globalThis.owned,
      display: getComputedStyle(document.body).display,
      holder: holder.innerHTML,
    };
  });
  assert.deepEqual(refused, {
    directives: [
      'connect-src',
      'frame-src',
      'img-src',
      'require-trusted-types-for',
      'style-src-attr',
      'style-src-elem',
    ],
    owned: undefined,
    display: 'grid',
    holder: 'refused',
  });
  await page.close();

  // Even if the data ended its element, what follows would not run.
  writeFileSync(
    `${output}/broken.html`,
    readFileSync(template, 'utf8').replace(
      '<!--report-data-->',
      '<script>globalThis.owned = 3</script><b onclick="globalThis.owned = 4">x</b>',
    ),
  );
  const broken = await browser.newPage();
  await broken.goto(pathToFileURL(`${output}/broken.html`).href);
  await broken.evaluate(() => document.querySelector('b').click());
  assert.equal(await broken.evaluate(() => globalThis.owned), undefined);
  await broken.close();
});

test('the search counts every table, restricts the one in view, and Enter leads to the next match', async () => {
  const page = await open('small');
  const events = tableOf('small', 'events').rows;
  const matching = events.filter((row) => row[5].includes('Access denied')).length;
  await page.keyboard.press('/');
  assert.equal(await page.evaluate(() => document.activeElement.id), 'search');
  await search(page, '"access DENIED" item');
  assert.equal(await navCount(page, 'events'), matching.toLocaleString('en'));
  assert.equal(await navCount(page, 'processes'), '0');
  await page.press('#search', 'Enter');
  await eventually(() => page.evaluate(() => location.hash), '#events');
  await eventually(() => count(page), `${matching.toLocaleString('en')} of 3,000 rows`);
  assert.match((await column(page, 'c5'))[0], /^Access denied/);
  await search(page, 'no such words anywhere');
  assert.equal(await page.textContent('#search-result'), '0 matches');
  await eventually(() => count(page), '0 of 3,000 rows');
  await page.press('#search', 'Escape');
  await eventually(() => count(page), '3,000 rows');
  await search(page, 'grey');
  assert.equal(await navCount(page, 'overview'), '1');
  await search(page, '');
  await go(page, 'registry');
  await search(page, 'tray');
  await eventually(() => count(page), '4 of 7 rows');
  assert.deepEqual(await column(page, 'c0'), ['HKEY_LOCAL_MACHINE', 'SOFTWARE', 'Microsoft', 'Run']);
  await close(page);
});

test('tables sort by mouse and keyboard, filter by column, and a tree stays one', async () => {
  const page = await open('small', {hash: '#files'});
  await page.click(`${view} .ag-header-cell[col-id=c2]`);
  const sizes = tableOf('small', 'files')
    .rows.map((row) => row[2])
    .sort((a, b) => a - b);
  const shown = await column(page, 'c2');
  assert.equal(shown[0], `${sizes[0]} B`);
  assert.equal(await page.getAttribute(`${view} .ag-header-cell[col-id=c2]`, 'aria-sort'), 'ascending');
  await page.focus(`${view} .ag-header-cell[col-id=c2]`);
  await page.keyboard.press('Enter');
  assert.equal(await page.getAttribute(`${view} .ag-header-cell[col-id=c2]`, 'aria-sort'), 'descending');

  await go(page, 'services');
  await page.fill(`${view} .ag-floating-filter[aria-colindex="2"] input`, 'stop');
  await eventually(() => count(page), '40 of 160 rows');
  await page.fill(`${view} .ag-floating-filter[aria-colindex="4"] input`, 'yes');
  await eventually(() => count(page), '8 of 160 rows');
  await page.click(`${view} .chip`);
  await eventually(() => count(page), '160 rows');

  await go(page, 'processes');
  assert.deepEqual((await column(page, 'c1')).slice(0, 4), ['4', '16', '64', '256']);
  await page.click(`${view} .ag-header-cell[col-id=c1]`);
  await page.click(`${view} .ag-header-cell[col-id=c1]`);
  assert.deepEqual((await column(page, 'c1')).slice(0, 4), ['4', '52', '244', '232']);
  await page.click(`${view} .ag-row[row-index="0"] [col-id=c0]`);
  await page.keyboard.press('ArrowLeft');
  await eventually(() => count(page), '1 of 60 rows');
  await page.keyboard.press('ArrowRight');
  await eventually(() => count(page), '60 rows');
  await page.click(`${view} .ag-row[row-index="1"] .toggle`);
  await eventually(() => count(page), '56 of 60 rows');
  await close(page);
});

test('a click on the timeline filters the events to that time, and the buttons zoom', async () => {
  const page = await open('small');
  const range = () => page.textContent('.timeline .range');
  const whole = await range();
  await page.click('.timeline button:text-is("Reproduction")');
  assert.equal(await range(), '2026-01-29 06:15:00 to 2026-01-29 07:45:00');
  const legend = await page.textContent('.legend');
  const events = tableOf('small', 'events').rows;
  await page.click('.timeline button:text-is("Zoom out")');
  assert.equal(await range(), '2026-01-29 05:30:00 to 2026-01-29 08:30:00');
  assert.notEqual(await page.textContent('.legend'), legend);
  const canvas = await page.locator('.chart canvas').first();
  const box = await canvas.boundingBox();
  await canvas.click({position: {x: box.width / 2, y: box.height - 80}});
  await eventually(() => page.evaluate(() => location.hash), '#events');
  const [from, to] = (await page.textContent(`${view} .chip`))
    .replace(' ✕', '')
    .split(' to ')
    .map((time) => Date.parse(`${time.replace(' ', 'T')}Z`));
  assert.ok(from >= Date.UTC(2026, 0, 29, 6, 45) && to - from <= 120000, `${from} to ${to}`);
  const inside = events.filter((row) => row[0] >= from && row[0] < to).length;
  assert.ok(inside > 0);
  await eventually(() => count(page), `${inside} of 3,000 rows`);
  await page.click(`${view} .chip`);
  await eventually(() => count(page), '3,000 rows');
  const slider = await page.locator('.chart canvas').first().boundingBox();
  await page.mouse.move(slider.x + slider.width / 2, slider.y + 60);
  await page.keyboard.down('Control');
  await page.mouse.wheel(0, -300);
  await page.keyboard.up('Control');
  await eventually(async () => (await range()) !== '2026-01-29 05:30:00 to 2026-01-29 08:30:00', true);
  await page.click('.timeline button:text-is("All")');
  assert.equal(await range(), whole);
  await close(page);
});

test('the evidence of a finding leads to its row, which is marked, in view and shown in full', async () => {
  const page = await open('small');
  await search(page, 'signature');
  await page.click('.evidence a[href="#processes/16"]');
  await page.waitForSelector(`${view} .ag-row.marked`);
  assert.equal(await page.textContent(`${view} .ag-row.marked [col-id=c1]`), '196');
  assert.ok(await page.locator(`${view} .ag-row.marked`).isVisible());
  assert.match(await page.textContent(`${view} .details`), /Evidence of: A program of the product.*guardsvc\.exe/s);
  await page.click(`${view} .details .close`);
  assert.equal(await page.isVisible(`${view} .details`), false);
  await page.click(`${view} .ag-row.marked [col-id=c1]`);
  await page.keyboard.press('ArrowUp');
  await eventually(() => page.textContent(`${view} .details`).then((text) => text.includes('PID184')), true);
  await page.goBack();
  await page.waitForSelector('.overview:not([hidden])');
  await search(page, '');
  await page.click('.evidence a[href="#events/40"]');
  await page.waitForSelector(`${view} .ag-row.marked`);
  const top = await page.locator(`${view} .ag-row.marked`).boundingBox();
  assert.ok(top.y > 300 && top.y < 860);
  await search(page, 'no such words');
  await page.evaluate(() => {
    location.hash = 'services/8';
  });
  await page.waitForSelector(`${view} .ag-row.marked`);
  assert.equal(await page.inputValue('#search'), '');
  assert.equal(await page.$$eval('.evidence a', (links) => links.length), 4);
  await close(page);
});

for (const [name, hashes, options] of [
  ['light', ['overview', 'events/40', 'changes'], {}],
  ['dark', ['overview', 'events/40'], {colorScheme: 'dark'}],
  ['narrow', ['overview', 'processes'], {viewport: {width: 360, height: 700}}],
  ['forced', ['overview'], {forcedColors: 'active'}],
]) {
  test(`${name}: no violation of the rules of accessibility, no sideways scrolling`, async () => {
    const page = await open('compared', options);
    for (const hash of hashes) {
      await page.evaluate((to) => {
        location.hash = to;
      }, hash);
      await page.waitForSelector(hash === 'overview' ? '.overview:not([hidden])' : `${view} .ag-row`);
      assert.deepEqual(await violations(page), [], hash);
      assert.ok(await page.evaluate(() => document.documentElement.scrollWidth <= innerWidth), hash);
      await page.screenshot({path: `${output}/${name}-${hash.replace('/', '-')}.png`});
    }
    await close(page);
  });
}

test('the button turns light into dark, tables and timeline too', async () => {
  const page = await open('small', {hash: '#events'});
  const looks = () =>
    page.evaluate(() =>
      ['body', '.ag-cell', '.ag-header-cell', 'nav a']
        .map((name) => getComputedStyle(document.querySelector(name)).color)
        .concat(document.querySelector('.chart canvas').toDataURL()),
    );
  await page.waitForSelector(`${view} .ag-row`);
  const light = await looks();
  await page.click('#theme');
  const dark = await looks();
  light.forEach((look, index) => assert.notEqual(dark[index], look));
  await page.click('#theme');
  assert.deepEqual(await looks(), light);
  await close(page);
});

test('what is printed are plain tables of 200 rows at most, and the rest is said', async () => {
  const page = await open('small', {hash: '#events', colorScheme: 'dark'});
  await page.waitForSelector(`${view} .ag-row`);
  await page.evaluate(() => dispatchEvent(new Event('beforeprint')));
  assert.ok(await page.locator('.overview .chart canvas').first().isVisible());
  assert.equal(await page.$$eval('.finding:not([open])', (closed) => closed.length), 0);
  assert.match(await page.textContent('#print-view'), /The first 200 of 3,000 rows are printed/);
  assert.equal(await page.$$eval('#print-view table', (tables) => tables.length), 6);
  assert.equal(await page.$$eval('#print-view tbody tr', (rows) => rows.length), 60 + 200 + 6 + 160 + 7 + 200);
  await page.emulateMedia({media: 'print'});
  assert.equal(
    await page.evaluate(() => getComputedStyle(document.querySelector('#print-view td')).color),
    'rgb(28, 33, 41)',
  );
  await page.evaluate(() => dispatchEvent(new Event('afterprint')));
  assert.equal(await page.$$eval('#print-view *', (nodes) => nodes.length), 0);
  assert.equal(await page.$$eval(`${view} .above .chart`, (charts) => charts.length), 1);
  await page.pdf({path: `${output}/small.pdf`, format: 'A4', printBackground: true});
  assert.ok(readFileSync(`${output}/small.pdf`).length > 50000);
  await close(page);
});

test('a comparison stands first and leads to its table', async () => {
  const page = await open('compared');
  assert.match(await page.textContent('.comparison'), /4 changes since.*collected_2026-01-10\.zip/);
  assert.equal(await page.getAttribute('nav li:nth-child(2) a', 'href'), '#changes');
  await page.click('.comparison a');
  await page.waitForSelector(`${view} .ag-row`);
  assert.deepEqual(await column(page, 'c0'), ['changed', 'added', 'removed', 'changed']);
  await close(page);
});

test('50,000 events: few rows are drawn, all are reached, found, sorted', async () => {
  const page = await open('large', {hash: '#events'});
  await page.waitForSelector(`${view} .ag-row`);
  assert.ok((await page.$$eval('.ag-row', (rows) => rows.length)) < 120);
  await page.click(`${view} .ag-row[row-index="0"] [col-id=c0]`);
  await page.keyboard.press('Control+End');
  await page.waitForSelector(`${view} .ag-row[row-index="49999"]`);
  const last = tableOf('large', 'events').rows.at(-1)[5];
  assert.equal((await column(page, 'c5')).at(-1), last);
  await search(page, '"item 4999"');
  await eventually(() => count(page), '11 of 50,000 rows');
  await search(page, '');
  await page.click(`${view} .ag-header-cell[col-id=c5]`);
  await eventually(() => column(page, 'c5').then((texts) => texts[0]?.startsWith('Access denied')), true);
  await page.screenshot({path: `${output}/large.png`});
  await close(page);
});

test('without data the page says so, with little data it stands', async () => {
  const bare = await browser.newPage();
  await bare.goto(pathToFileURL(template).href);
  assert.match(await bare.textContent('#problem'), /holds no data/);
  await bare.close();
  const page = await open('empty');
  assert.match(await page.textContent('#main'), /No rule found anything/);
  assert.deepEqual(await violations(page), []);
  await close(page);
});
