// The home screen of the simulated phone, drawn from /api/state. Everything
// the page does is a korrin-sim command line posted to /api/command.
'use strict';

const screen = document.getElementById('screen');
const dots = document.getElementById('dots');
const message = document.getElementById('message');
let state = null;
let view = 'home';
let pageIndex = 0;
let openFolder = null;

// ---- Talking to the session.

// A word as korrin-sim reads it: bare when plain, else in single quotes.
function quote(word) {
  word = String(word);
  return /^[A-Za-z0-9._:\/@%+=,-]+$/.test(word) ? word : "'" + word.replace(/'/g, "'\\''") + "'";
}

async function run(line) {
  const response = await fetch('/api/command', {
    method: 'POST', headers: {'Content-Type': 'application/json'}, body: JSON.stringify({line}),
  });
  const body = await response.json();
  message.textContent = response.ok ? '$ ' + line : body.error;
  message.className = response.ok ? '' : 'error';
  return response.ok;
}

// The state now, for the view just chosen; the long poll goes on alongside.
async function refresh() {
  const response = await fetch('/api/state?view=' + view);
  state = await response.json();
  render();
}

async function poll() {
  for (;;) {
    try {
      const since = state ? '&since=' + state.version : '';
      const response = await fetch('/api/state?view=' + view + since);
      const next = await response.json();
      if (!next.unchanged) {
        state = next;
        render();
      }
      document.getElementById('status').textContent = 'live, version ' + next.version;
    } catch (e) {
      document.getElementById('status').textContent = 'server gone; retrying';
      await new Promise(resolve => setTimeout(resolve, 1000));
    }
  }
}

// ---- Drawing.

function escape(text) {
  return String(text).replace(/[&<>"']/g, c => ({'&': '&amp;', '<': '&lt;', '>': '&gt;', '"': '&quot;', "'": '&#39;'})[c]);
}

// A colour of its own for each id, and the label's initials.
function hue(id) {
  let h = 0;
  for (const c of id) h = (h * 31 + c.codePointAt(0)) % 360;
  return h;
}

function initials(label) {
  const words = label.split(/\s+/).filter(Boolean);
  return escape(words.slice(0, 2).map(w => [...w][0]).join('').toUpperCase() || '?');
}

function folderIcon(box) {
  const pages = state.folders[box.id] || [];
  const inside = pages.length ? pages[0].boxes.slice(0, 9) : [];
  return inside.map(b => `<i style="background:hsl(${hue(b.appId || b.label)},55%,50%)"></i>`).join('');
}

function boxHtml(box, offGrid, editable) {
  const classes = ['box'];
  if (box.folder) classes.push('folder');
  if (box.shortcut) classes.push('shortcut');
  if (box.noIcon) classes.push('no-icon');
  if (box.disabled) classes.push('disabled');
  if (box.deactivated) classes.push('deactivated');
  if (offGrid) classes.push('off-grid');
  const icon = box.folder ? folderIcon(box) : initials(box.label);
  const drag = editable ? ' draggable="true"' : '';
  const del = editable && box.shortcut ? '<button class="delete" title="delete shortcut">×</button>' : '';
  const appId = box.appId || '';
  return `<div class="${classes.join(' ')}" data-id="${box.id}"${drag} title="#${box.id} ${escape(appId)}">` +
      `<span class="icon" style="background:hsl(${hue(appId || box.label)},55%,45%)">${icon}</span>` +
      `<span class="label">${escape(box.label)}</span>${del}</div>`;
}

// One page as a grid of |columns|: every cell, a box or empty, so that a box
// can be dropped anywhere; boxes outside the grid or on a taken cell below it.
// Returned as blocks of HTML, so that a long page can be drawn a part at a time.
function pageBlocks(page, columns, editable) {
  const cells = new Map();
  const off = [];
  let rows = 1;
  for (const box of page.boxes) {
    const key = box.row + ':' + box.col;
    if (box.col < 1 || box.col > columns || box.row < 1 || cells.has(key)) {
      off.push(box);
    } else {
      cells.set(key, box);
      rows = Math.max(rows, box.row);
    }
  }
  if (editable) rows += 1;  // a free row to drop into
  // Rows in blocks of 16, each a grid the browser may skip drawing while it
  // is off screen: a menu of 10,000 boxes scrolls without stalling.
  const html = [];
  for (let first = 1; first <= rows; first += 16) {
    const block = [`<div class="grid${columns === 3 ? ' folder-grid' : ''}">`];
    for (let row = first; row <= Math.min(rows, first + 15); ++row) {
      for (let col = 1; col <= columns; ++col) {
        const box = cells.get(row + ':' + col);
        block.push(`<div class="cell" data-page="${page.id}" data-col="${col}" data-row="${row}">` +
                   (box ? boxHtml(box, false, editable) : '') + '</div>');
      }
    }
    block.push('</div>');
    html.push(block.join(''));
  }
  if (off.length) {
    html.push('<div class="off-grid-list"><div class="page-title">off the grid</div><div class="grid">' +
              off.map(box => `<div class="cell">${boxHtml(box, true, editable)}</div>`).join('') +
              '</div></div>');
  }
  return html;
}

function pageHtml(page, columns, editable) {
  return pageBlocks(page, columns, editable).join('');
}

function pagesOfView() {
  if (view === 'home') return state.menus.flatMap(m => m.pages.map(p => ({...p, title: `${m.name} · page ${p.no}`})));
  const pages = state.view || [];
  return pages.map(p => ({...p, title: `${view} · page ${p.no} (#${p.id})`}));
}

// The first screenful at once, the rest of a long page in later tasks, so
// that the first paint does not wait for ten thousand boxes. A newer drawing
// stops an older one.
let drawing = 0;
function drawScreen(blocks) {
  const mine = ++drawing;
  const scroll = screen.scrollTop;
  screen.innerHTML = blocks.slice(0, 8).join('');
  screen.scrollTop = scroll;
  let next = 8;
  (function more() {
    if (mine !== drawing || next >= blocks.length) return;
    screen.insertAdjacentHTML('beforeend', blocks.slice(next, next + 40).join(''));
    next += 40;
    screen.scrollTop = scroll;
    setTimeout(more, 0);
  })();
}

function render() {
  const pages = pagesOfView();
  pageIndex = Math.min(pageIndex, Math.max(0, pages.length - 1));
  const page = pages[pageIndex];
  drawScreen(!state.started && view !== 'home' ? ['<p class="page-title">start the engine to see its views</p>']
      : page ? [`<div class="page-title">${escape(page.title)}</div>`, ...pageBlocks(page, 4, view === 'home')]
      : ['<p class="page-title">no pages</p>']);
  dots.innerHTML = pages.length > 1 ? pages.map((p, i) =>
      `<button class="${i === pageIndex ? 'current' : ''}" data-index="${i}" title="${escape(p.title)}"></button>`).join('') : '';
  if (openFolder !== null) showFolder(openFolder);
  const packages = [...new Set(state.apps.map(a => a.pkgId))];
  for (const select of document.querySelectorAll('select.packages')) {
    const chosen = select.value;
    select.innerHTML = packages.map(p => `<option>${escape(p)}</option>`).join('');
    if (packages.includes(chosen)) select.value = chosen;
  }
  const calls = document.getElementById('calls');
  if (!calls.childElementCount) calls.innerHTML = state.calls.map(c => `<option value="${escape(c)}">`).join('');
  document.getElementById('commands').textContent = state.commands.join('\n');
  document.getElementById('changes').textContent = state.changes;
  const log = document.getElementById('log');
  log.innerHTML = state.log.map(l =>
      `<span class="${l.failure ? 'failure' : l.priority >= 6 ? 'error' : ''}">${escape(l.text)}</span>`).join('\n');
  log.scrollTop = log.scrollHeight;  // the newest lines
}

function findBox(id) {
  for (const menu of state.menus) for (const page of menu.pages) for (const box of page.boxes) if (box.id === id) return box;
  for (const pages of Object.values(state.folders)) for (const page of pages) for (const box of page.boxes) if (box.id === id) return box;
  return null;
}

function showFolder(id) {
  const box = findBox(id);
  if (!box) return closeFolder();
  openFolder = id;
  document.getElementById('folder-name').textContent = box.label;
  document.getElementById('folder-pages').innerHTML = (state.folders[id] || []).map(p =>
      `<div class="page-title">page ${p.no}</div>` + pageHtml(p, 3, true)).join('') || '<p class="page-title">no pages</p>';
  document.getElementById('folder').hidden = false;
}

function closeFolder() {
  openFolder = null;
  document.getElementById('folder').hidden = true;
}

// ---- Edits, as the launcher makes them.

let dragged = null;
document.addEventListener('dragstart', e => {
  const box = e.target.closest && e.target.closest('.box');
  if (!box) return;
  dragged = Number(box.dataset.id);
  e.dataTransfer.setData('text/plain', String(dragged));
});
document.addEventListener('dragover', e => {
  if (dragged !== null && e.target.closest('.cell[data-page], .box.folder')) e.preventDefault();
});
document.addEventListener('drop', e => {
  const target = e.target.closest('.box.folder, .cell[data-page]');
  if (dragged === null || !target) return;
  e.preventDefault();
  const box = dragged;
  dragged = null;
  if (target.classList.contains('box')) {
    const folder = Number(target.dataset.id);
    if (folder !== box) run(`move ${box} into ${folder}`);
  } else {
    run(`move ${box} to ${target.dataset.page} ${target.dataset.col} ${target.dataset.row}`);
  }
});
screen.addEventListener('click', e => {
  const del = e.target.closest('.delete');
  if (del) return run(`remove-box ${del.closest('.box').dataset.id}`);
  const folder = e.target.closest('.box.folder');
  if (folder) showFolder(Number(folder.dataset.id));
});
document.getElementById('folder-pages').addEventListener('click', e => {
  const del = e.target.closest('.delete');
  if (del) run(`remove-box ${del.closest('.box').dataset.id}`);
});
document.getElementById('folder-close').addEventListener('click', closeFolder);
document.getElementById('folder-rename').addEventListener('click', () => {
  const name = prompt('Folder name', document.getElementById('folder-name').textContent);
  if (name !== null) run(`rename ${openFolder} ${quote(name)}`);
});
dots.addEventListener('click', e => {
  if (e.target.dataset.index === undefined) return;
  pageIndex = Number(e.target.dataset.index);
  render();
});
document.getElementById('tabs').addEventListener('click', e => {
  if (!e.target.dataset.view) return;
  view = e.target.dataset.view;
  pageIndex = 0;
  state.view = null;
  refresh();
  for (const tab of document.querySelectorAll('#tabs button')) tab.setAttribute('aria-selected', tab === e.target);
  render();
});

// ---- The device panel.

for (const form of document.querySelectorAll('form[data-command]')) {
  form.addEventListener('submit', e => {
    e.preventDefault();
    const f = Object.fromEntries(new FormData(form));
    const command = form.dataset.command;
    const lines = {
      install: () => `install ${quote(f.appId)}` + (f.label ? ' ' + quote(f.label) : ''),
      update: () => `update ${quote(f.pkgId)}` + (f.label ? ' ' + quote(f.label) : ''),
      uninstall: () => `uninstall ${quote(f.pkgId)}`,
      fail: () => `fail ${quote(f.call)} ${f.error ? quote(f.error) : ''} ${f.when}`.replace(/\s+/g, ' '),
      event: () => `event ${f.type} ${f.state} ${quote(f.pkgId)}`,
      raw: () => f.line,
    };
    run(lines[command]());
  });
}
for (const button of document.querySelectorAll('button[data-line]')) {
  button.addEventListener('click', () => run(button.dataset.line));
}

poll();
