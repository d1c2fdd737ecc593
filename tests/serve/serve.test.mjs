// korrin-sim serve in Debian's chromium, driven by playwright-core: the demo
// served as `layout` draws it, an install from the panel, a drag into a
// folder, and an edit the layout refuses.
import { test, before, after } from 'node:test';
import assert from 'node:assert/strict';
import { spawn, execFileSync } from 'node:child_process';
import { readFileSync, writeFileSync } from 'node:fs';
import { chromium } from 'playwright-core';

const { KORRIN_SIM, DEMO_SCRIPT, ARTEFACTS, CHROMIUM = '/usr/bin/chromium' } = process.env;
let server, browser, page;

before(async () => {
  server = spawn(KORRIN_SIM, ['serve', '--port', '0', '--script', DEMO_SCRIPT],
                 { stdio: ['ignore', 'pipe', 'inherit'] });
  const url = await new Promise((resolve, reject) => {
    let out = '';
    server.stdout.on('data', d => (out += d).match(/http:\/\/127\.0\.0\.1:\d+\//) && resolve(RegExp.lastMatch));
    server.on('exit', code => reject(new Error(`korrin-sim serve ended with ${code}`)));
  });
  browser = await chromium.launch({ executablePath: CHROMIUM });
  page = await browser.newPage({ viewport: { width: 1100, height: 800 } });
  await page.goto(url);
  await page.waitForSelector('#screen .box');  // drawn from the state, not the legend's samples
});
after(async () => { await browser?.close(); server?.kill(); });

const state = () => page.evaluate(() => fetch('/api/state').then(r => r.json()));
const boxNamed = label => page.locator('#screen .box', { has: page.locator(`.label:text-is("${label}")`) });
const cells = () => page.$$eval('#screen .cell[data-row]', all => all.filter(c => c.querySelector('.box'))
    .map(c => ({ row: +c.dataset.row, col: +c.dataset.col, label: c.querySelector('.label').textContent })));

// Menu 1's first page as `layout` prints it at the end of the demo.
function layoutCells() {
  writeFileSync(`${ARTEFACTS}/demo-layout.ksim`, readFileSync(DEMO_SCRIPT, 'utf8') + '\nlayout\n');
  const printed = execFileSync(KORRIN_SIM, ['run', `${ARTEFACTS}/demo-layout.ksim`], { encoding: 'utf8' });
  const grid = printed.slice(printed.lastIndexOf('menu 1 ')).split('\n').filter(l => /^ *\d+ \| /.test(l));
  return grid.filter(l => !l.startsWith('    ')).flatMap(line => {
    const [row, ...labels] = line.split(' | ').map(s => s.trim());
    return labels.map((label, i) => ({ row: +row, col: i + 1, label })).filter(c => c.label);
  });
}

test('the demo served shows the boxes `layout` prints, in the same cells', async () => {
  const shown = await cells();
  const printed = layoutCells();
  assert.equal(shown.length, printed.length);
  for (const cell of printed) {
    const label = cell.label.replace(/^\[(.*)\]$/, '$1');
    const match = shown.find(s => s.row === cell.row && s.col === cell.col);
    assert.ok(match && (label.endsWith('~') ? match.label.startsWith(label.slice(0, -1)) : match.label === label),
              `row ${cell.row} col ${cell.col}: ${cell.label} printed, ${match?.label} shown`);
  }
  await page.screenshot({ path: `${ARTEFACTS}/home.png` });
});

test('an install from the panel appears without a reload', async () => {
  await page.fill('form[data-command=install] [name=appId]', 'com.acme.lighthouse');
  await page.fill('form[data-command=install] [name=label]', "Keeper's Lighthouse");
  await page.click('form[data-command=install] button');
  await boxNamed("Keeper's Lighthouse").waitFor();
});

test('a box dragged onto a folder goes into it, in the database', async () => {
  await boxNamed('Sky Harbor').dragTo(boxNamed('Puzzles'));
  await page.waitForFunction(() => !document.querySelector('#message.error') &&
                                   document.querySelector('#message').textContent.includes('into'));
  const { folders, menus } = await state();
  const folder = menus[0].pages[0].boxes.find(b => b.label === 'Puzzles');
  assert.ok(folders[folder.id].some(p => p.boxes.some(b => b.label === 'Sky Harbor')));
});

test('an edit the layout cannot take is refused with its message, and nothing changes', async () => {
  const before = await state();
  await boxNamed('Mossback Rally').dragTo(boxNamed('Nightjar Lanes'));
  await page.locator('#message.error').waitFor();
  const after = await state();
  assert.deepEqual(after.menus, before.menus);
  assert.equal(after.version, before.version);
});
