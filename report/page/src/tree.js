// Tables that are trees: a column holds the index of the parent's row. Pure functions over those indexes.

// The rows depth first, children below their parent, with depth and whether there are children. A parent that does not
// exist, or that is its own ancestor, makes a root.
export function layOut(parents) {
  const children = Array.from(parents, () => []);
  const isRow = (index) => Number.isInteger(index) && index >= 0 && index < parents.length;
  const tree = {
    parent: Int32Array.from(parents, (parent, row) => (isRow(parent) && parent !== row ? parent : -1)),
    depth: new Uint32Array(parents.length),
    order: [],
    hasChildren: new Uint8Array(parents.length),
  };
  breakCycles(tree.parent);
  tree.parent.forEach((parent, row) => {
    if (parent >= 0) children[parent].push(row);
  });
  const pending = [];
  for (let row = parents.length - 1; row >= 0; --row) if (tree.parent[row] < 0) pending.push(row);
  while (pending.length > 0) {
    const row = pending.pop();
    tree.order.push(row);
    tree.hasChildren[row] = children[row].length > 0 ? 1 : 0;
    for (let i = children[row].length - 1; i >= 0; --i) {
      tree.depth[children[row][i]] = tree.depth[row] + 1;
      pending.push(children[row][i]);
    }
  }
  return tree;
}

function breakCycles(parent) {
  const state = new Uint8Array(parent.length); // 1: on the present path, 2: known to end at a root
  for (let start = 0; start < parent.length; ++start) {
    const path = [];
    let row = start;
    while (row >= 0 && state[row] === 0) {
      state[row] = 1;
      path.push(row);
      row = parent[row];
    }
    if (row >= 0 && state[row] === 1) parent[row] = -1;
    for (const visited of path) state[visited] = 2;
  }
}

// A byte for each row: whether all its ancestors are open.
export function openRows(tree, collapsed) {
  const open = new Uint8Array(tree.parent.length);
  for (const row of tree.order) {
    const parent = tree.parent[row];
    open[row] = parent < 0 || (open[parent] && !collapsed.has(parent)) ? 1 : 0;
  }
  return open;
}

// Adds to the matches (one byte a row) all their ancestors, so that a match is seen in its place.
export function withAncestors(tree, matches) {
  const shown = Uint8Array.from(matches);
  for (let row = 0; row < matches.length; ++row) {
    if (!matches[row]) continue;
    for (let above = tree.parent[row]; above >= 0 && !shown[above]; above = tree.parent[above]) shown[above] = 1;
  }
  return shown;
}

// Sorted rows brought back into the shape of the tree: siblings keep their order, below the nearest ancestor among the
// rows.
export function regroup(tree, sorted) {
  const present = new Uint8Array(tree.parent.length);
  for (const row of sorted) present[row] = 1;
  const nearest = new Int32Array(tree.parent.length);
  for (const row of tree.order) {
    const parent = tree.parent[row];
    nearest[row] = parent < 0 || present[parent] ? parent : nearest[parent];
  }
  const children = new Map([[-1, []]]);
  for (const row of sorted) {
    if (!children.has(nearest[row])) children.set(nearest[row], []);
    children.get(nearest[row]).push(row);
  }
  const [result, pending] = [[], children.get(-1).reverse()];
  while (pending.length > 0) {
    const row = pending.pop();
    result.push(row);
    for (const child of (children.get(row) ?? []).reverse()) pending.push(child);
  }
  return result;
}
