// Elements without markup: no string is ever parsed as HTML on this page.
import {appendText} from './text.js';

// element('p', {class: 'x', onclick: f}, 'text', child): attributes, and for functions listeners.
export function element(name, attributes = {}, ...children) {
  const made = document.createElement(name);
  for (const [key, value] of Object.entries(attributes)) {
    if (typeof value === 'function') made.addEventListener(key.slice(2), value);
    else if (value === true) made.setAttribute(key, '');
    else if (value !== false && value != null) made.setAttribute(key, value);
  }
  made.append(...children.filter((child) => child != null));
  return made;
}

// A text of the package: its direction of writing stays inside.
export function foreign(text, options) {
  return appendText(document.createElement('bdi'), text, options);
}
