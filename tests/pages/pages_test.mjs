// The pages alone, in a browser, with a program that the test plays. ST_PAGES: their folder, ST_CHROMIUM: the browser.
import assert from 'node:assert/strict';
import {test} from 'node:test';
import {pathToFileURL} from 'node:url';
import {launch, violations} from './browser.mjs';

const folder = process.env.ST_PAGES;
const browser = await launch();
test.after(() => browser.close());

// The program as the page sees it in either engine; what was called stands in `calls`.
function program(later) {
  globalThis.calls = [];
  globalThis.answers = {};
  const answer = (name) => globalThis.answers[name] ?? {success: true, product_name: 'Guard'};
  const call = (name, request, done) => {
    globalThis.calls.push([name, request]);
    if (done) setTimeout(() => done(answer(name)), 10);
    return done ? undefined : answer(name);
  };
  if (later) globalThis.Window.this = {xcall: call};
  else globalThis.view = new Proxy({}, {get: (_, name) => (...args) => call(name, ...args)});
}

async function open(language, {later = false, ...options} = {}) {
  const page = await browser.newPage({viewport: {width: 880, height: 720}, ...options});
  page.problems = [];
  page.on('pageerror', (error) => page.problems.push(String(error)));
  page.on('request', (request) => {
    if (!request.url().startsWith(pathToFileURL(folder).href)) page.problems.push(request.url());
  });
  await page.addInitScript(program, later);
  await page.goto(pathToFileURL(`${folder}/support_tool_${language}.html`).href);
  return page;
}

const section = (page) => page.evaluate(() => document.querySelector('main > section:not([hidden])').id);
const focused = (page) => page.evaluate(() => document.activeElement.id);
const notify = (page, ...args) => page.evaluate((a) => globalThis.on_api_notif(...a), args);

// Tab until the element has the focus, as somebody without a mouse does.
async function tabTo(page, id) {
  for (let i = 0; i < 40; ++i) {
    if (await focused(page) === id) return;
    await page.keyboard.press('Tab');
  }
  assert.fail(`${id} is not reached by the keyboard`);
}

async function throughDetails(page) {
  await tabTo(page, 'name');
  await page.keyboard.type(' Ana Pop ');
  await page.keyboard.press('Tab');
  await page.keyboard.type('ana.pop@example.com');
  await page.keyboard.press('Tab');
  await page.keyboard.press('Space');
  await page.keyboard.press('Enter');
}

async function throughIssue(page) {
  await page.keyboard.press('Tab');
  await page.keyboard.press('Space');
  await page.keyboard.press('ArrowDown');
  await page.keyboard.press('Tab');
  await page.keyboard.type('It is <b>slow</b>.');
  await page.keyboard.press('Tab');
  await page.keyboard.press('Tab');
  await page.keyboard.press('Enter');
}

for (const [language, later] of [['en', false], ['ro', true]]) {
  test(`${language}: the whole report by keyboard, each step without a violation`, async () => {
    const page = await open(language, {later});
    const check = async (name) => {
      assert.equal(await section(page), name);
      assert.equal(await focused(page), `${name}-title`);
      assert.deepEqual(await violations(page), [], name);
    };
    await check('details');
    await throughDetails(page);
    await check('issue');
    await throughIssue(page);
    await check('reproduce');
    await tabTo(page, 'reproduce-toggle');
    await page.keyboard.press('Enter');
    await page.waitForFunction(() => document.getElementById('timer').textContent === '00:01');
    assert.equal(await page.isDisabled('#reproduce-next'), true);
    assert.deepEqual(await violations(page), []);
    await page.keyboard.press('Enter');
    await page.waitForSelector('#reproduce-next:not([disabled])');
    await tabTo(page, 'reproduce-next');
    await page.keyboard.press('Enter');
    await check('send');
    assert.equal(await page.textContent('#send-description'), 'It is <b>slow</b>.');
    await tabTo(page, 'send-button');
    await page.keyboard.press('Enter');
    await check('progress');
    await notify(page, 'on_submit_progress', {step: 60, steps: 100});
    assert.equal(await page.getAttribute('#bar', 'value'), '60');
    assert.equal(await page.isDisabled('#cancel'), true);
    await notify(page, 'on_finished', {});
    await check('success');
    assert.match(await page.textContent('#success-next'), /ana\.pop@example\.com/);
    assert.deepEqual((await page.evaluate(() => globalThis.calls)).filter(([name]) => name !== 'get_state'), [
      ['validate_user_details', {user_name: 'Ana Pop', user_email: 'ana.pop@example.com', agreed_licence: true}],
      ['select_issue', {issue: 'detection', description: 'It is <b>slow</b>.'}],
      ['start_issue_reproduction', null],
      ['stop_issue_reproduction', null],
      ['submit', {issue_reproduced: true}]]);
    assert.deepEqual(page.problems, []);
    await page.close();
  });
}

test('errors stand at their fields, the first of them gets the focus', async () => {
  const page = await open('en');
  await page.click('#details button[type=submit]');
  assert.equal(await focused(page), 'name');
  for (const id of ['name', 'email', 'consent']) {
    assert.equal(await page.getAttribute(`#${id}`, 'aria-invalid'), 'true');
    assert.equal(await page.isVisible(`#${id}-error`), true);
  }
  assert.deepEqual(await violations(page), []);
  await page.fill('#name', 'Ana');
  assert.equal(await page.isVisible('#name-error'), false); // mended
  assert.equal(await page.getAttribute('#name', 'aria-invalid'), null);
  await page.fill('#email', 'Ana@example.com');
  await page.click('#details button[type=submit]');
  assert.equal(await focused(page), 'email');
  assert.equal(await page.isVisible('#name-error'), false);
  await page.fill('#email', 'ana@example.com');
  await page.check('#consent');
  await page.evaluate(() => { globalThis.answers.validate_user_details = {success: false}; });
  await page.click('#details button[type=submit]');
  assert.equal(await section(page), 'details');
  assert.equal(await page.isVisible('#details-message'), true);
  await page.evaluate(() => { globalThis.answers = {}; });
  await page.click('#details button[type=submit]');
  await page.click('#issue button[type=submit]');
  assert.equal(await page.isVisible('#issue-error'), true);
  assert.equal(await page.isVisible('#description-error'), true);
  assert.deepEqual(await violations(page), []);
  await page.check('input[value=other]');
  assert.equal(await page.isVisible('#issue-error'), false);
  await page.close();
});

test('a failure says what to do, where the package lies, and can be tried again', async () => {
  const page = await open('en');
  await throughDetails(page);
  await throughIssue(page);
  await page.evaluate(() => { globalThis.answers.start_issue_reproduction = {success: false}; });
  await page.click('#reproduce-toggle');
  await page.waitForSelector('#reproduce-message:visible');
  await page.click('#reproduce-next');
  await page.click('#send-button');
  for (const [code, kept, says] of [
    ['submission_failed', true, /was kept/], ['submission_failed', false, /set up to keep/],
    ['collect_canceled', false, /^Nothing/], ['unknown', false, /^Nothing/], ['something new', false, /^Nothing/],
    [{odd: 1}, false, /^Nothing/]]) {
    await page.evaluate((k) => { globalThis.answers.get_state = k ? {package: 'C:\\x\\collected.zip'} : {}; }, kept);
    await notify(page, 'on_error', code);
    assert.equal(await section(page), 'failure');
    assert.notEqual(await page.textContent('#failure-help'), '');
    assert.match(await page.textContent('#failure-package'), says);
    assert.equal(await page.textContent('#failure-path'), kept ? 'C:\\x\\collected.zip' : '');
    assert.deepEqual(await violations(page), []);
    await page.click('#retry');
    assert.equal(await section(page), 'progress');
  }
  await page.click('#cancel');
  assert.deepEqual((await page.evaluate(() => globalThis.calls)).at(-1), ['cancel', undefined]);
  assert.deepEqual(page.problems, []);
  await page.close();
});

test('dark colours, a narrow window and high magnification hold the rules too', async () => {
  for (const options of [{colorScheme: 'dark'}, {viewport: {width: 320, height: 480}}, {forcedColors: 'active'}]) {
    const page = await open('ro', options);
    assert.deepEqual(await violations(page), []);
    const overflow = await page.evaluate(() => document.documentElement.scrollWidth - window.innerWidth);
    assert.ok(overflow <= 0, `the page is ${overflow} pixels too wide`);
    await page.close();
  }
});

test('every page fits into the window, with all that can be wrong on it', async () => {
  for (const language of ['en', 'ro']) {
    const page = await open(language, {viewport: {width: 900, height: 720}});
    const heights = await page.evaluate(() => Array.from(document.querySelectorAll('main > section'), (section) => {
      for (const other of document.querySelectorAll('main > section')) other.hidden = other !== section;
      const fields = section.querySelectorAll('.field .error, fieldset .error');
      for (const error of fields) error.hidden = false;
      const main = document.getElementById('main');
      return [section.id, main.scrollHeight - main.clientHeight];
    }));
    assert.deepEqual(heights.filter(([, tooHigh]) => tooHigh > 0), [], language);
    await page.close();
  }
});

test('outside the support tool the page says so', async () => {
  const page = await browser.newPage();
  await page.goto(pathToFileURL(`${folder}/support_tool_en.html`).href);
  assert.equal(await page.isVisible('#outside'), true);
  await page.close();
});
