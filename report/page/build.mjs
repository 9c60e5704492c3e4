// Bundles the page into one file that loads nothing: node build.mjs OUTPUT. Its policy allows only this script and
// style, by hash.
import {createHash} from 'node:crypto';
import {readFileSync, readdirSync, renameSync, statSync, writeFileSync} from 'node:fs';
import {dirname, join} from 'node:path';
import {fileURLToPath} from 'node:url';
import {build} from 'esbuild';

const folder = dirname(fileURLToPath(import.meta.url));
const read = (name) => readFileSync(join(folder, name), 'utf8');

async function bundle(name) {
  const {outputFiles, metafile} = await build({
    entryPoints: [join(folder, name)],
    absWorkingDir: folder,
    bundle: true,
    minify: true,
    write: false,
    metafile: true,
    format: 'iife',
    target: ['chrome123', 'firefox120', 'safari17.5'],
    charset: 'utf8',
    legalComments: 'inline',
    logLevel: 'warning',
  });
  return {text: outputFiles[0].text.trim(), inputs: Object.keys(metafile.inputs)};
}

// The licence files of all packages that went into the bundle.
function licences(inputs) {
  const packages = new Set(
    inputs.map((input) => /.*node_modules\/((?:@[^/]+\/)?[^/]+)/.exec(input)?.[0]).filter(Boolean),
  );
  return [...packages]
    .sort()
    .map((path) => {
      const {name, version, license} = JSON.parse(read(`${path}/package.json`));
      const files = readdirSync(join(folder, path), {recursive: true})
        .map((file) => file.replaceAll('\\', '/'))
        .filter(
          (file) =>
            /^(licen[cs]es\/.+|(licen[cs]e|notice|copying)[^/]*)$/i.test(file) &&
            !statSync(join(folder, path, file)).isDirectory(),
        )
        .sort();
      if (files.length === 0) throw new Error(`${name} has no licence file`);
      return [`${name} ${version} (${license})`, ...files.map((file) => read(`${path}/${file}`).trim())].join('\n\n');
    })
    .join(`\n\n${'='.repeat(60)}\n\n`);
}

const hash = (text) => `'sha256-${createHash('sha256').update(text).digest('base64')}'`;

function policy(script, style) {
  return [
    `default-src 'none'`,
    `script-src ${hash(script)}`,
    `style-src ${hash(style)}`,
    'img-src data:',
    `base-uri 'none'`,
    `form-action 'none'`,
    `require-trusted-types-for 'script'`,
    'trusted-types default',
  ].join('; ');
}

function fill(page, parts) {
  return Object.entries(parts).reduce((text, [name, part]) => {
    const pieces = text.split(`<!--${name}-->`);
    if (pieces.length !== 2) throw new Error(`the page has ${pieces.length - 1} places for ${name}`);
    return pieces.join(part);
  }, page);
}

const [script, style] = [await bundle('src/main.js'), await bundle('styles.css')];
if (/<\/script|<!--/i.test(script.text) || /<\/style/i.test(style.text))
  throw new Error('the bundle holds what ends its element');
const notices = licences([...script.inputs, ...style.inputs]);
const page = fill(read('page.html'), {
  'content-security-policy': `<meta http-equiv="Content-Security-Policy" content="${policy(script.text, style.text)}">`,
  style: `<style>${style.text}</style>`,
  script: `<script>${script.text}</script>`,
  licences: `<!--\nThis page holds the following libraries.\n\n${notices.replaceAll('--', '- -')}\n-->`,
});
if (page.split('<!--report-data-->').length !== 2) throw new Error('the page needs exactly one place for its data');
const output = process.argv[2];
writeFileSync(`${output}.part`, page);
renameSync(`${output}.part`, output);
