// Values as people read them. Times are the wall clock of the customer's machine, held as if it were UTC.

const two = (number) => String(number).padStart(2, '0');
const kUnits = ['B', 'KiB', 'MiB', 'GiB', 'TiB', 'PiB'];
const kMaximumTime = 8.64e15;

export function formatTime(milliseconds) {
  if (!(Math.abs(milliseconds) <= kMaximumTime)) return String(milliseconds);
  const time = new Date(milliseconds);
  const clock = [time.getUTCHours(), time.getUTCMinutes(), time.getUTCSeconds()].map(two).join(':');
  return `${formatDay(milliseconds)} ${clock}`;
}

export function formatDay(milliseconds) {
  const time = new Date(milliseconds);
  return `${time.getUTCFullYear()}-${two(time.getUTCMonth() + 1)}-${two(time.getUTCDate())}`;
}

export function formatBytes(bytes) {
  if (!Number.isFinite(bytes)) return String(bytes);
  let [value, unit] = [bytes, 0];
  while (Math.abs(value) >= 1024 && unit + 1 < kUnits.length) [value, unit] = [value / 1024, unit + 1];
  return `${unit === 0 ? value : value.toFixed(value < 10 ? 2 : 1)} ${kUnits[unit]}`;
}

export function formatCount(number) {
  return number.toLocaleString('en');
}

// "1 row", "2 rows".
export function plural(number, word) {
  return `${formatCount(number)} ${word}${number === 1 ? '' : 's'}`;
}

// The text of a table's cell. A cell that is not of its column's type is shown as it is.
export function formatCell(value, type) {
  if (value == null) return '';
  if (typeof value === 'boolean') return value ? 'yes' : 'no';
  if (typeof value === 'object') return JSON.stringify(value);
  if (typeof value === 'number' && type === 'time') return formatTime(value);
  if (typeof value === 'number' && type === 'bytes') return formatBytes(value);
  return String(value);
}
