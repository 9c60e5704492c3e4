// Put at the head of every document, so that it runs before the page's own script: gives the page `view.name(...)` and `Window.this.xcall("name", ...)`,
// and runs page functions for native code. Values travel in the wire form of value_json.h.
//
// A call into native code is a synchronous request that native code answers. While the page waits in one, native code
// may want a function of the page run: the answer is then {"run": ...}, and its outcome is the next request.
(() => {
  'use strict';
  document.currentScript.remove();
  if (globalThis !== globalThis.top) return;

  const Request = XMLHttpRequest;
  const address = location.origin + '/.native-call';
  const functions = new Map();                // those that native code holds
  let nextFunction = Date.now() * 4096;       // no two documents give out the same number
  const deepest = 200;

  const notify = (notice) => {
    const request = new Request();
    request.open('POST', address);
    request.send(JSON.stringify({notice}));
  };
  const hex = (bytes) => Array.from(bytes, (byte) => byte.toString(16).padStart(2, '0')).join('');
  const wellFormed = (text) => (text.toWellFormed ? text.toWellFormed() : text);

  function encode(value, depth = 0) {
    if (depth > deepest) throw new TypeError('a value that is nested too deeply, or contains itself, cannot leave the page');
    switch (typeof value) {
      case 'boolean': return value;
      case 'number':
        if (Object.is(value, -0)) return {n: '-0'};
        return Number.isFinite(value) ? value : {n: String(value)};
      case 'bigint': return encode(Number(value), depth);
      case 'string': return wellFormed(value);
      case 'function': functions.set(++nextFunction, value); return {f: nextFunction};
      case 'object': break;
      default: return {u: 0};
    }
    if (value === null) return null;
    if (Array.isArray(value)) return Array.from(value, (element) => encode(element, depth + 1));
    if (value instanceof Date) return {d: value.getTime()};
    if (value instanceof Error) return {e: wellFormed(String(value))};
    if (value instanceof ArrayBuffer) return {b: hex(new Uint8Array(value))};
    if (ArrayBuffer.isView(value)) return {b: hex(new Uint8Array(value.buffer, value.byteOffset, value.byteLength))};
    const entries = value instanceof Map ? value : Object.entries(value);
    const members = [];
    for (const [key, member] of entries) members.push(wellFormed(String(key)), encode(member, depth + 1));
    return {m: members};
  }

  function decode(wire) {
    if (wire === null || typeof wire !== 'object') return wire;
    if (Array.isArray(wire)) return wire.map(decode);
    const tag = Object.keys(wire)[0];
    const content = wire[tag];
    switch (tag) {
      case 'm': {
        const object = {};
        for (let i = 0; i + 1 < content.length; i += 2) {
          // Not by assignment: "__proto__" is a key like any other.
          Object.defineProperty(object, content[i],
            {value: decode(content[i + 1]), writable: true, enumerable: true, configurable: true});
        }
        return object;
      }
      case 'n': return Number(content);
      case 'd': return new Date(content);
      case 'f': return functions.get(content);
      case 'e': return new Error(content);
      case 'b': return Uint8Array.from(content.match(/../g) || [], (pair) => parseInt(pair, 16));
      default: return undefined;
    }
  }

  // --- Native code runs a function of the page

  const boxes = (element) => {
    const style = getComputedStyle(element);
    const sum = (rect, name, sign) => {
      const at = (side) => sign * (parseFloat(style[name.replace('*', side)]) || 0);
      return [rect[0] - at('Left'), rect[1] - at('Top'), rect[2] + at('Right'), rect[3] + at('Bottom')];
    };
    const rect = element.getBoundingClientRect();
    const border = [rect.left, rect.top, rect.right, rect.bottom];
    const padding = sum(border, 'border*Width', -1);
    return {content: sum(padding, 'padding*', -1), padding, border, margin: sum(border, 'margin*', 1)};
  };
  // What `measure` says while the root element has another size for a moment.
  const sized = (width, height, measure) => {
    const root = document.documentElement;
    const before = root.getAttribute('style');
    root.style.setProperty('width', width, 'important');
    if (height) root.style.setProperty('height', height, 'important');
    const result = measure(root);
    if (before === null) root.removeAttribute('style'); else root.setAttribute('style', before);
    return result;
  };
  const pixels = (length) => Math.ceil(length * devicePixelRatio);
  const widthAs = (keyword) => sized(keyword, '', (root) => pixels(root.getBoundingClientRect().width));

  const ownFunctions = {
    rootBox: (box) => boxes(document.documentElement)[box].map((edge) => Math.round(edge * devicePixelRatio)),
    widths: () => [widthAs('min-content'), widthAs('max-content')],
    heightAt: (width) => sized(width / devicePixelRatio + 'px', 'auto', (root) =>
      pixels(Math.max(root.getBoundingClientRect().height, root.scrollHeight))),
    selection: (cut) => {
      const field = document.activeElement;
      const text = field && typeof field.selectionStart === 'number'
        ? field.value.substring(field.selectionStart, field.selectionEnd) : String(getSelection());
      if (cut && text) document.execCommand('delete');
      return text;
    },
  };

  function lookUp(job) {
    if (job.own) return ownFunctions[job.own];
    if (job.id) return functions.get(job.id);
    if (!/^[\p{L}_$][\p{L}\p{N}_$.]*$/u.test(job.name)) return undefined;
    let found = globalThis;
    for (const part of job.name.split('.')) found = found === undefined || found === null ? undefined : found[part];
    // What `const` and `let` declare is no member of the global object.
    return found === undefined ? (0, eval)(`typeof ${job.name} === 'function' ? ${job.name} : undefined`) : found;
  }

  function perform(job) {
    try {
      const target = lookUp(job);
      if (typeof target !== 'function') return {threw: `the page has no function "${job.name || job.own || job.id}"`};
      return {returned: encode(target(...job.args.map(decode)))};
    } catch (error) {
      return {threw: wellFormed(String(error))};
    }
  }

  // --- The page calls native code

  function exchange(message) {
    for (;;) {
      const request = new Request();
      request.open('POST', address, false);
      try {
        request.send(JSON.stringify(message));
      } catch (error) {
        throw new Error('native code does not answer: the window is closed');
      }
      const reply = JSON.parse(request.responseText);
      if (!reply.run) return reply;
      message = perform(reply.run);
    }
  }

  function callNative(name, args) {
    const reply = exchange({call: String(name), args: encode(args)});
    if (reply.error !== undefined) throw new Error(reply.error);
    return decode(reply.value);
  }

  const close = () => notify({close: true});
  const ownMembers = {close, xcall: (name, ...args) => callNative(name, args)};
  globalThis.view = new Proxy(ownMembers, {
    get: (members, name) => {
      if (typeof name !== 'string' || name === 'then') return undefined;
      return Object.hasOwn(members, name) ? members[name] : (...args) => callNative(name, args);
    },
  });
  Object.defineProperty(Window, 'this', {value: ownMembers});
  Object.defineProperty(globalThis, 'stEngine', {value: Object.freeze({
    perform,
    release: (ids) => ids.forEach((id) => functions.delete(id)),
  })});

  // --- The window

  globalThis.close = close;
  globalThis.open = () => {
    console.error('window.open: a page cannot open windows');
    return null;
  };
  // The browser would stop the page until the engine has dismissed its dialog, which it refuses to a page that is being left.
  const dismissed = (result) => (message = '') => {
    console.warn('a dialog was not shown: ' + message);
    return result;
  };
  globalThis.alert = dismissed(undefined);
  globalThis.confirm = dismissed(false);
  globalThis.prompt = dismissed(null);
  const within = (event, role) => event.target instanceof Element && event.target.closest(`[role~="${role}"]`);
  addEventListener('mousedown', (event) => {
    const isControl = event.target instanceof Element && event.target.closest('a, button, input, select, textarea');
    if (event.button === 0 && !isControl && within(event, 'window-caption')) notify({drag: true});
  }, true);
  addEventListener('click', (event) => {
    if (within(event, 'window-close')) close();
    if (within(event, 'window-minimize')) notify({minimize: true});
  });
  let cursor = '';
  addEventListener('mouseover', (event) => {
    if (!(event.target instanceof Element)) return;
    let now = getComputedStyle(event.target).cursor;
    if (now === 'auto') now = event.target.matches('textarea, input:not([type]), input[type=text], input[type=email]') ? 'text' : 'default';
    if (now !== cursor) notify({cursor: cursor = now});
  }, true);
})();
