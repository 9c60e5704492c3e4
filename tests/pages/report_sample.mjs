// Data documents of reports for the tests and the benchmark: a small hostile one, a large one, and the page that holds
// one.
import {readFileSync, writeFileSync} from 'node:fs';
import {fileURLToPath} from 'node:url';

const kStart = Date.UTC(2026, 0, 25, 6, 0, 0);
const kHour = 3600000;
const kDay = 24 * kHour;

export const kHostile = [
  '</script><script>globalThis.owned = 1</script>',
  '<img src=x onerror="globalThis.owned = 2">',
  '"><svg onload=globalThis.owned=3>',
  'javascript:globalThis.owned=4',
  '<!--<script>',
  'invoice\u202Egnp.exe',
  'bell\u0007 null\u0000 escape\u001b[31m',
  'zero\u200Bwidth \u2066isolated\u2069',
  '\u05e9\u05dc\u05d5\u05dd \u0645\u0631\u062d\u0628\u0627',
  '{{constructor.constructor("globalThis.owned=5")()}}',
  '__proto__',
];

// A stream of numbers that is the same at every run.
function numbers(seed) {
  let state = seed;
  return () => {
    state = (Math.imul(state, 1664525) + 1013904223) >>> 0;
    return state / 2 ** 32;
  };
}

const columns = (...list) => list.map(([id, title, type = 'text']) => ({id, title, type}));

function events(count, random) {
  const sources = [
    'Service Control Manager', 'Disk', 'DistributedCOM', 'Guard', 'Kernel-Power', 'DNS Client Events',
    'Application Error'
  ];
  const texts = [
    'The service entered the stopped state.', 'The device has a bad block.', 'Access denied while opening the file',
    'The update was installed.', 'Name resolution timed out after none of the configured servers responded.',
    'Faulting application guard.exe'
  ];
  const pick = (list) => list[Math.floor(random() * list.length)];
  const event = (index) => {
    const [chance, burst] = [random(), index % 9 === 0];
    const type = ['Critical', 'Error', 'Warning'][[0.01, burst ? 0.5 : 0.08, 0.25].findIndex((part) => chance < part)];
    const time = burst ? kStart + 4 * kDay + random() * 2 * kHour : kStart + random() * 6.5 * kDay;
    const place = `C:\\Program Files\\Guard\\module${index % 97}.dll`;
    return [
      Math.floor(time), type ?? 'Information', pick(['System', 'Application', 'Security']), pick(sources),
      Math.floor(random() * 11000), `${pick(texts)} Item ${index}: ${Math.floor(random() * 1e9).toString(16)} ${place}`
    ];
  };
  return {
    id: 'events',
    title: 'Event log',
    columns: columns(
        ['time', 'Time', 'time'], ['type', 'Type'], ['log', 'Log'], ['source', 'Source'], ['event', 'Event', 'number'],
        ['text', 'Text']),
    rows: Array.from({length: count}, (_, index) => event(index)).sort((a, b) => a[0] - b[0])
  };
}

function processes(count) {
  const names = ['svchost.exe', 'guard.exe', 'guardsvc.exe', 'explorer.exe', 'msedge.exe', 'lsass.exe', 'winlogon.exe'];
  const rows = Array.from(
      {length: count},
      (_, index) =>
          [index === 0 ? 'System' : names[index % names.length], 4 + index * 12,
           index === 0 ? null : Math.floor((index - 1) / 4),
           index % 3 === 0 ? 'NT AUTHORITY\\SYSTEM' : 'DESKTOP-7\\ana',
           index % 11 === 5 ? 'not signed' : 'valid: Example Works',
           `C:\\Windows\\System32\\${names[index % names.length]}`,
           `"C:\\Windows\\System32\\${names[index % names.length]}" -k group${index}`, (index * 7919 % 900) * 1048576]);
  return {
    id: 'processes',
    title: 'Processes',
    parent: 'parent',
    rows,
    columns: columns(
        ['name', 'Name'], ['pid', 'PID', 'number'], ['parent', 'Parent', 'number'], ['account', 'Account'],
        ['signature', 'Signature'], ['path', 'Path'], ['command', 'Command line'], ['memory', 'Memory', 'bytes'])
  };
}

function software() {
  const names = ['Guard Total', 'Editor', 'Archive Tool', 'Printer Suite', 'Runtime 14', 'Player'];
  return {
    id: 'software',
    title: 'Software',
    columns: columns(
        ['name', 'Name'], ['version', 'Version'], ['publisher', 'Publisher'], ['installed', 'Installed', 'time']),
    rows: names.map(
        (name, index) => [name, `${index + 1}.${index}.10`, 'Example Works', kStart - index * 40 * 24 * kHour])
  };
}

function services(count) {
  return {
    id: 'services',
    title: 'Services',
    columns: columns(
        ['name', 'Name'], ['state', 'State'], ['start', 'Start'], ['delayed', 'Delayed', 'flag'], ['path', 'Path']),
    rows: Array.from(
        {length: count},
        (_, index) =>
            [`Service${index}`, index % 4 === 0 ? 'Stopped' : 'Running', index % 3 === 0 ? 'Manual' : 'Automatic',
             index % 5 === 0, `C:\\Windows\\System32\\svc${index}.exe`])
  };
}

function registry() {
  const rows = [
    ['HKEY_LOCAL_MACHINE', null, '', '', ''], ['SOFTWARE', 0, '', '', ''], ['Guard', 1, '', '', ''],
    ['', 2, 'InstallPath', 'REG_SZ', 'C:\\Program Files\\Guard'], ['', 2, 'Enabled', 'REG_DWORD', '1'],
    ['Microsoft', 1, '', '', ''], ['Run', 5, 'Guard', 'REG_SZ', '"C:\\Program Files\\Guard\\guard.exe" /tray']
  ];
  return {
    id: 'registry',
    title: 'Registry',
    parent: 'parent',
    columns:
        columns(['key', 'Key'], ['parent', 'Parent', 'number'], ['value', 'Value'], ['type', 'Type'], ['data', 'Data']),
    rows
  };
}

function files(count) {
  return {
    id: 'files',
    title: 'Product files',
    columns: columns(
        ['path', 'Path'], ['version', 'Version'], ['size', 'Size', 'bytes'], ['modified', 'Modified', 'time'],
        ['signed', 'Signed', 'flag']),
    rows: Array.from(
        {length: count},
        (_, index) =>
            [`C:\\Program Files\\Guard\\module${index}.dll`, '7.2.10', (index * 104729) % 9000000,
             kStart - index * kHour, index % 17 !== 3])
  };
}

function hostileTable() {
  return {
    id: 'hostile',
    title: `Odd ${kHostile[0]}`,
    columns:
        [{id: '__proto__', title: kHostile[1], type: 'text'}, {id: 'constructor', title: 'a\u202Eb', type: 'text'}],
    rows: kHostile.map((text) => [text, text])
  };
}

function changes() {
  return {
    id: 'changes',
    title: 'Changes',
    columns: columns(
        ['kind', 'Kind'], ['table', 'Table'], ['item', 'Item'], ['field', 'Field'], ['before', 'Before'],
        ['after', 'After']),
    rows: [
      ['changed', 'Services', 'GuardSvc', 'State', 'Running', 'Stopped'],
      ['added', 'Software', 'Printer Suite', '', '', '4.3.10'], ['removed', 'Drivers', 'oldflt.sys', '', '1.0', ''],
      ['changed', 'Software', 'Guard Total', 'Version', '7.2.9', '7.2.10']
    ]
  };
}

const findings = [
  {
    id: 'service-stopped',
    severity: 'error',
    title: 'A service of the product is not running',
    count: 3,
    explanation: 'The product cannot protect without its services. Look for the reason, then start the service.',
    evidence: [
      {file: 'services.json', path: 'Services[8].State', text: 'Service8 is stopped', table: 'services', row: 8},
      {file: 'services.json', path: 'Services[12].State', text: 'Service12 is stopped', table: 'services', row: 12}
    ]
  },
  {
    id: 'product-process-unsigned',
    severity: 'error',
    title: 'A program of the product is running without a valid signature',
    count: 1,
    explanation:
        'Every program that ships is signed. The file was replaced or damaged: compare its MD5 with the release.',
    evidence: [{
      file: 'processes.json',
      path: 'Processes[16]',
      text: 'guardsvc.exe (196) is not signed',
      table: 'processes',
      row: 16
    }]
  },
  {
    id: 'disk-space-low',
    severity: 'warning',
    title: 'A drive is nearly full',
    count: 1,
    explanation: 'Updates need free space. Let the customer clean up.',
    evidence: [{
      file: 'storage.json',
      path: 'Partitions[0].Free Space',
      text: 'C: has 900 MiB free of 61440 MiB',
      table: null,
      row: null
    }]
  },
  {
    id: 'events-crash',
    severity: 'warning',
    title: 'Programs of the product crashed',
    count: 2,
    explanation: 'The event log names the faulting modules.',
    evidence: [{file: 'event_log.json', path: '[40]', text: 'Faulting application guard.exe', table: 'events', row: 40}]
  },
  {
    id: 'uptime-long',
    severity: 'info',
    title: 'The computer has been running for 31 days',
    count: 1,
    explanation: 'Updates may wait for a restart.',
    evidence: [{file: 'system_summary.json', path: 'Uptime', text: '31 days', table: null, row: null}]
  },
];

export function sample({eventCount = 3000, hostile = false, compared = false} = {}) {
  const random = numbers(7);
  const tables = [processes(60), events(eventCount, random), software(), services(160), registry(), files(400)];
  const odd = kHostile.join(' ');
  return {
    version: 1,
    tool: 'support_report 1.0.0',
    source:
        {name: hostile ? kHostile[5] : 'collected_2026-01-31.zip', bytes: 7340032, collectedAt: '2026-01-31T10:11:12Z'},
    machine: hostile ? odd : 'DESKTOP-7 · Windows 11 Pro 10.0.22631 · 8 cores, 16 GiB',
    product: hostile ? odd : 'Guard Total 7.2.10',
    user: [
      {label: 'Name', value: 'Ana Pop'}, {label: 'E-mail', value: 'ana.pop@example.com'},
      {label: 'Issue', value: 'Slow computer'}, {
        label: 'Description',
        value: hostile ?
            odd :
            'Since Thursday the computer hangs after each start.\nThe Guard icon is grey, a click on it does nothing.'
      }
    ],
    missing: [
      {what: 'event_log_security.json', why: 'access denied (5)'},
      {what: 'battery', why: hostile ? kHostile[6] : 'the machine has none'}
    ],
    findings: hostile ? [{
      ...findings[0],
      title: odd,
      explanation: odd,
      evidence: kHostile.map((text, row) => ({file: text, path: text, text, table: 'hostile', row}))
    }] :
                        findings,
    gauges: [
      {name: 'Memory', used: 11.2 * 2 ** 30, total: 16 * 2 ** 30, kind: 'memory'},
      {name: 'C:', used: 59.1 * 2 ** 30, total: 60 * 2 ** 30, kind: 'disk'},
      {name: 'D:', used: 380 * 2 ** 30, total: 931 * 2 ** 30, kind: 'disk'}
    ],
    timeline: {
      table: 'events',
      time: 'time',
      severity: 'type',
      from: kStart + 4 * 24 * kHour + 0.5 * kHour,
      to: kStart + 4 * 24 * kHour + 1.5 * kHour
    },
    tables: [...(compared ? [changes()] : []), ...tables, ...(hostile ? [hostileTable()] : [])],
    comparison: compared ?
        {with: {name: 'collected_2026-01-10.zip', bytes: 7000000, collectedAt: '2026-01-10T09:00:00Z'}, changes: 4} :
        null,
  };
}

const kEscapes = {
  '<': '\\u003c',
  '>': '\\u003e',
  '&': '\\u0026',
  '\u2028': '\\u2028',
  '\u2029': '\\u2029'
};

// The report as support_report.exe writes it.
export function writeReport(template, data, path) {
  const json = JSON.stringify(data).replace(/[<>&\u2028\u2029]/g, (character) => kEscapes[character]);
  writeFileSync(
      path,
      readFileSync(template, 'utf8')
          .split('<!--report-data-->')
          .join(`<script type="application/json" id="report-data">${json}</script>`));
}

// node report_sample.mjs TEMPLATE OUTPUT EVENTS
if (process.argv[1] === fileURLToPath(import.meta.url)) {
  const [template, output, count] = process.argv.slice(2);
  writeReport(template, sample({eventCount: Number(count)}), output);
}
