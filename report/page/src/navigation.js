// The list of the report's parts with their counts, and the way from one to the next.
import {element, foreign} from './dom.js';
import {formatCount} from './format.js';

export class Navigation {
  #links = new Map(); // id -> {link, count}

  constructor(host, tables) {
    const list = element('ul', {});
    const add = (id, title, apart = false) => {
      const count = element('span', {class: 'count'});
      const link = element('a', {href: `#${encodeURIComponent(id)}`}, foreign(title), count);
      list.append(element('li', {class: apart ? 'apart' : null}, link));
      this.#links.set(id, {link, count});
    };
    add('overview', 'Overview');
    const isOther = ({id}) => id.startsWith('doc-'); // documents that have no table of their own
    tables.forEach((table, index) =>
      add(table.id, table.title ?? table.id, isOther(table) && !(index > 0 && isOther(tables[index - 1]))),
    );
    host.append(list);
  }

  // `all` is null outside a search.
  setCount(id, count, all = null) {
    const entry = this.#links.get(id);
    entry.count.textContent = count === null ? '' : formatCount(count);
    entry.link.classList.toggle('found', all !== null && count > 0);
    entry.link.classList.toggle('empty', count === 0);
    if (all === null) entry.link.removeAttribute('title');
    else entry.link.title = `${formatCount(count)} of ${formatCount(all)} match`;
  }

  setCurrent(id) {
    for (const [other, {link}] of this.#links) {
      if (other === id) link.setAttribute('aria-current', 'page');
      else link.removeAttribute('aria-current');
    }
    this.#links.get(id)?.link.scrollIntoView({block: 'nearest', inline: 'nearest'});
  }
}

// "#events/12" -> {id: 'events', row: 12}
export function readHash(hash) {
  const [, id, row] = /^#([^/]*)(?:\/(\d+))?$/.exec(hash) ?? [];
  try {
    return {id: decodeURIComponent(id ?? '') || 'overview', row: row === undefined ? null : Number(row)};
  } catch {
    return {id: 'overview', row: null};
  }
}
