// The browser of the page tests. ST_CHROMIUM: its program.
import {readFileSync} from 'node:fs';
import {createRequire} from 'node:module';
import {chromium} from 'playwright-core';

const axe = readFileSync(createRequire(import.meta.url).resolve('axe-core/axe.min.js'), 'utf8');

// Its sandbox does not work for root, as whom containers run tests.
export function launch() {
  return chromium.launch({
    executablePath: process.env.ST_CHROMIUM,
    args: process.getuid() === 0 ? ['--no-sandbox'] : [],
  });
}

// The broken rules of accessibility, each with the elements that break it.
export async function violations(page) {
  if (await page.evaluate(() => !globalThis.axe)) await page.evaluate(axe);
  const result = await page.evaluate(() =>
    globalThis.axe.run(document, {
      runOnly: ['wcag2a', 'wcag2aa', 'wcag21a', 'wcag21aa', 'wcag22aa', 'best-practice'],
    }),
  );
  return result.violations.map((v) => `${v.id}: ${v.nodes.map((n) => n.html).join(' | ')}`);
}
