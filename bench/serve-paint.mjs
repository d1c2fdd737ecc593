// How `korrin-sim serve` copes with a big home screen: a phone of N games
// (default 10,000) after first launch, opened in Debian's chromium. Prints the
// time from navigation to the first paint of the boxes, and the frame gaps
// while the screen is scrolled from top to bottom. A measurement, not a test.
//
//   node bench/serve-paint.mjs KORRIN_SIM [N]
// (playwright-core comes from tests/serve, where scripts/dev.sh installs it)
import { spawn } from 'node:child_process';
import { mkdtempSync, writeFileSync } from 'node:fs';
import { tmpdir } from 'node:os';

const { chromium } = await import(new URL('../tests/serve/node_modules/playwright-core/index.mjs', import.meta.url));
const [korrinSim, count = '10000'] = process.argv.slice(2);
const dir = mkdtempSync(`${tmpdir()}/serve-paint-`);
const lines = Array.from({ length: +count }, (_, i) => `game com.bench.g${i} "Game ${i}"`);
writeFileSync(`${dir}/phone.ksim`, lines.join('\n') + '\nstart\n');

const server = spawn(korrinSim, ['serve', '--port', '0', '--root', dir, '--script', `${dir}/phone.ksim`],
                     { stdio: ['ignore', 'pipe', 'inherit'] });
const url = await new Promise(resolve => {
  let out = '';
  server.stdout.on('data', d => (out += d).match(/http:\/\/127\.0\.0\.1:\d+\//) && resolve(RegExp.lastMatch));
});
const browser = await chromium.launch({ executablePath: process.env.CHROMIUM || '/usr/bin/chromium' });
const page = await browser.newPage({ viewport: { width: 1100, height: 800 } });
// The first frame after the first box reaches the page: its first paint.
await page.addInitScript(() => {
  new MutationObserver((records, observer) => {
    if (!document.querySelector('#screen .box')) return;
    observer.disconnect();
    requestAnimationFrame(() => (window.firstPaint = performance.now()));
  }).observe(document, { childList: true, subtree: true });
});
await page.goto(url);
await page.waitForFunction(n => document.querySelectorAll('#screen .box').length >= n, +count, { timeout: 60000 });
const all = await page.evaluate(() => performance.now());
const paint = await page.evaluate(() => window.firstPaint);
const gaps = await page.evaluate(() => new Promise(resolve => {
  const screen = document.getElementById('screen');
  const gaps = [];
  let last = performance.now();
  function step(now) {
    gaps.push(now - last);
    last = now;
    screen.scrollTop += 600;
    if (screen.scrollTop + screen.clientHeight < screen.scrollHeight) requestAnimationFrame(step);
    else resolve(gaps);
  }
  requestAnimationFrame(step);
}));
gaps.sort((a, b) => a - b);
const at = q => gaps[Math.min(gaps.length - 1, Math.floor(q * gaps.length))].toFixed(1);
console.log(`${count} boxes: first paint ${paint.toFixed(0)} ms after navigation, all drawn by ${all.toFixed(0)} ms; ` +
            `scrolling ${gaps.length} frames, median ${at(0.5)} ms, p95 ${at(0.95)} ms, max ${at(1)} ms`);
await browser.close();
server.kill();
