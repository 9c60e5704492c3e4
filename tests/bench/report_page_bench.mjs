// How fast a report of 50,000 events is in a browser: node report_page_bench.mjs REPORT BROWSER ROUNDS. Prints the
// median time from the call for the page until the table stands drawn, and that of a keystroke until the rows it leaves
// are drawn.
import {pathToFileURL} from 'node:url';
import {chromium} from '../pages/node_modules/playwright-core/index.mjs';

const [report, browserPath, rounds] = process.argv.slice(2);
const kTyped = 'access denied item 12';

// Runs in the page: resolves when the search is done and the browser has drawn what it left.
function typed(character) {
  const field = document.getElementById('search');
  const drawn = () =>
    new Promise((resolve) => {
      requestAnimationFrame(() => {
        setTimeout(resolve);
      });
    });
  return new Promise((resolve) => {
    const begin = performance.now();
    const observer = new MutationObserver(async () => {
      observer.disconnect();
      await drawn();
      resolve(performance.now() - begin);
    });
    observer.observe(document.documentElement, {attributeFilter: ['data-searched']});
    field.value += character;
    field.dispatchEvent(new Event('input'));
  });
}

async function round(browser) {
  const page = await browser.newPage({viewport: {width: 1360, height: 860}});
  await page.addInitScript(() => {
    new MutationObserver((_, observer) => {
      if (!document.querySelector('.ag-row')) return;
      observer.disconnect();
      requestAnimationFrame(() => {
        setTimeout(() => {
          globalThis.opened = performance.now();
        });
      });
    }).observe(document, {childList: true, subtree: true});
  });
  await page.goto(`${pathToFileURL(report).href}#events`);
  let opened;
  while (!(opened = await page.evaluate(() => globalThis.opened))) await page.waitForTimeout(20);
  await page.waitForTimeout(2000); // a person's time to look before typing
  const keystrokes = [];
  for (const character of kTyped) keystrokes.push(await page.evaluate(typed, character));
  await page.close();
  return {opened, keystrokes};
}

const median = (values) => [...values].sort((a, b) => a - b)[Math.floor(values.length / 2)];
const browser = await chromium.launch({
  executablePath: browserPath,
  args: process.getuid() === 0 ? ['--no-sandbox'] : [],
});
const results = [];
for (let i = 0; i < Number(rounds); ++i) results.push(await round(browser));
await browser.close();
const keystrokes = results.flatMap((result) => result.keystrokes);
const slowest = [...kTyped].map((_, at) => median(results.map((result) => result.keystrokes[at])));
const figures = {
  open_ms: median(results.map((result) => result.opened)),
  keystroke_ms: median(keystrokes),
  slowest_keystroke_ms: Math.max(...slowest),
};
for (const [name, value] of Object.entries(figures)) console.log(`${name}=${value.toFixed(1)}`);
