// Light and dark: as the system says, until the button says otherwise. The choice is kept where the browser lets a file
// keep one.
const kKey = 'support-report-theme';
const dark = matchMedia('(prefers-color-scheme: dark)');

function kept() {
  try {
    return localStorage.getItem(kKey);
  } catch {
    return null;
  }
}

function keep(theme) {
  try {
    localStorage.setItem(kKey, theme);
  } catch {
    // A file that is opened from disk may have no storage.
  }
}

// Calls `onChange` after each change of the colours.
export function startTheme(button, onChange) {
  const root = document.documentElement;
  const show = (theme) => {
    root.dataset.theme = theme;
    button.textContent = theme === 'dark' ? 'Light' : 'Dark';
    button.setAttribute('aria-label', theme === 'dark' ? 'Use light colours' : 'Use dark colours');
  };
  show(['dark', 'light'].includes(kept()) ? kept() : dark.matches ? 'dark' : 'light');
  button.addEventListener('click', () => {
    show(root.dataset.theme === 'dark' ? 'light' : 'dark');
    keep(root.dataset.theme);
    onChange();
  });
  dark.addEventListener('change', () => {
    if (kept()) return;
    show(dark.matches ? 'dark' : 'light');
    onChange();
  });
}

// The colours of the style sheet, for what is drawn on a canvas.
export function colours(names) {
  const probe = document.body.appendChild(document.createElement('i'));
  const found = Object.fromEntries(
    names.map((name) => {
      probe.style.color = `var(--${name})`;
      return [name, getComputedStyle(probe).color];
    }),
  );
  probe.remove();
  return found;
}
