// The looks of the tables. The grid writes <style> elements, which the page's policy forbids; it is given a container
// outside the document for them, and their texts become constructed style sheets, which the policy allows.
import {createGrid, themeQuartz} from 'ag-grid-community';

const container = document.createElement('div');
let adopted = false;

export const themeOptions = {
  theme: themeQuartz.withParams({
    accentColor: 'var(--accent)',
    backgroundColor: 'var(--surface)',
    foregroundColor: 'var(--text)',
    borderColor: 'var(--line)',
    headerBackgroundColor: 'var(--raised)',
    headerTextColor: 'var(--text)',
    textColor: 'var(--text)',
    browserColorScheme: 'inherit',
    fontFamily: 'inherit',
    fontSize: 13,
    headerFontSize: 12.5,
    headerFontWeight: 600,
    spacing: 4,
    cellHorizontalPaddingScale: 1.2,
    rowHeight: 27,
    headerHeight: 32,
    wrapperBorder: false,
    wrapperBorderRadius: 0,
    columnBorder: false,
    iconSize: 13,
  }),
  themeStyleContainer: container,
};

// To be called before the first grid is made, which measures its parts at once: an empty one, never shown, writes the
// styles.
export function adoptGridStyles() {
  if (adopted) return;
  adopted = true;
  createGrid(document.createElement('div'), {...themeOptions, columnDefs: [], rowData: []});
  for (const style of container.querySelectorAll('style')) {
    const sheet = new CSSStyleSheet();
    sheet.replaceSync(style.textContent);
    document.adoptedStyleSheets.push(sheet);
  }
}
