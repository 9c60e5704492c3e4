// Texts of a package as they are shown. Whatever a package holds may have been made by an attacker: characters that are
// invisible, move the cursor or turn the direction of writing are replaced by a visible sign.

const kRanges = [
  '\\u0000-\\u001f\\u007f-\\u009f', // controls
  '\\u00ad\\u034f\\u115f\\u1160\\u17b4\\u17b5\\u180b-\\u180f\\u200b-\\u200d', // invisible
  '\\u2060-\\u2065\\u3164\\ufeff\\uffa0',
  '\\u061c\\u200e\\u200f\\u202a-\\u202e\\u2066-\\u206f', // turn the direction
  '\\u2028\\u2029', // end a line
  '\\ufff0-\\ufffb\\ud800-\\udfff\\u{e0000}-\\u{e0fff}', // no characters of their own
];
const kSpecial = new RegExp(`\\r\\n|[${kRanges.join('')}]`, 'gu');

export function hasSpecial(text) {
  kSpecial.lastIndex = 0;
  return kSpecial.test(text);
}

// Usual in a text, so that they need no attention.
const kQuiet = new Set(['\n', '\r\n', '\t']);

// Signs that most fonts have: an arrow for a line end and a tab, "U+202E" for the others.
export function sign(character) {
  if (character === '\n' || character === '\r\n') return '↵';
  if (character === '\t') return '⇥';
  return `U+${character.codePointAt(0).toString(16).toUpperCase().padStart(4, '0')}`;
}

// For places that hold a plain string only: attributes, titles, the canvas.
export function visible(text) {
  return String(text).replace(kSpecial, sign);
}

// Appends `text` to `element` as text, the special characters as marked signs. With `lines`, line ends and tabs stay.
export function appendText(element, text, {lines = false} = {}) {
  const source = lines ? String(text).replace(/\r\n?/g, '\n') : String(text);
  let end = 0;
  for (const match of source.matchAll(kSpecial)) {
    if (lines && (match[0] === '\n' || match[0] === '\t')) continue;
    element.append(source.slice(end, match.index), mark(match[0]));
    end = match.index + match[0].length;
  }
  element.append(source.slice(end));
  return element;
}

function mark(character) {
  const span = document.createElement('span');
  span.className = kQuiet.has(character) ? 'special quiet' : 'special';
  span.textContent = sign(character);
  return span;
}
