// SPDX-License-Identifier: MIT
// The page of `netfloor html` as somebody uses it, in headless Chromium. scripts/check-page.sh runs this.
//
//   NETFLOOR       the command
//   NODE_FOLDER    the folder with node_modules
//   CHROMIUM       the browser
import assert from 'node:assert/strict';
import { execFileSync, spawnSync } from 'node:child_process';
import { copyFileSync, mkdtempSync, readdirSync, readFileSync, rmSync, writeFileSync } from 'node:fs';
import { createRequire } from 'node:module';
import { tmpdir } from 'node:os';
import { join } from 'node:path';
import { after, before, test } from 'node:test';
import { fileURLToPath, pathToFileURL } from 'node:url';

const require = createRequire(join(process.env.NODE_FOLDER, 'index.js'));
const { chromium } = require('playwright-core');
const captures = fileURLToPath(new URL('../captures/', import.meta.url));
const files = readdirSync(captures).filter(file => !file.endsWith('.md')).map(file => join(captures, file));
const folder = mkdtempSync(join(tmpdir(), 'netfloor-page-'));
let browser;
let page;
let faults; // what the browser complains about, and what the page asks the network for

before(async () => {
    browser = await chromium.launch({ executablePath: process.env.CHROMIUM, args: ['--no-sandbox'] });
    page = await browser.newPage({ viewport: { width: 1280, height: 800 }, colorScheme: 'light' });
    page.setDefaultTimeout(8000);
    page.on('pageerror', error => faults.push(error.message));
    page.on('console', message => faults.push(message.text()));
    page.on('dialog', dialog => { faults.push('a dialog'); dialog.dismiss(); });
    page.on('request', request => {
        if (request.url() !== page.address) {
            faults.push(request.url());
        }
    });
});

after(async () => {
    await browser?.close();
    rmSync(folder, { recursive: true });
});

const pageOf = (...words) => spawnSync(process.env.NETFLOOR, ['html', ...words], { maxBuffer: 1 << 30 }).stdout;

async function openPage(html) {
    const file = join(folder, 'page.html');
    writeFileSync(file, html);
    page.address = pathToFileURL(file).href;
    faults = [];
    await page.goto(page.address);
    assert.deepEqual(faults, []);
}

const open = (...words) => openPage(pageOf(...words));
const chosenItem = () => page.getByRole('treeitem', { selected: true });
const litOctets = () => page.$$eval('#octets .octet.lit, #octets .octet.part', cells => cells.map(cell => Number(cell.dataset.octet)));
const focused = () => page.evaluate(() => document.activeElement.id);
const rowTexts = () => page.$$eval('#packets .rows .row', rows => rows.map(row => row.innerText.replace(/\s+/g, ' ')));

async function press(...keys) {
    for (const key of keys) {
        await page.keyboard.press(key);
    }
}

test('opens packets of every capture', async () => {
    await open(...files);
    const packets = Number((await page.locator('#total').innerText()).split(' ')[0]);
    assert.equal(await page.getByRole('grid', { name: 'Packets' }).getAttribute('aria-rowcount'), String(packets + 1));
    // A packet of each screen of the list: the row that is chosen, and the packet that the fields are of.
    const screens = await page.evaluate(() => {
        const list = document.getElementById('packets');
        const textOf = where => document.querySelector(where).innerText;
        const seen = [];
        for (let row = '', last = null; row !== last;) {
            last = row;
            row = textOf('#packets .active');
            seen.push([row.split(/\s+/), textOf('#tree [aria-selected="true"]').replace(/\D+/, '')]);
            list.dispatchEvent(new KeyboardEvent('keydown', { key: 'PageDown' }));
        }
        return seen;
    });
    const opened = new Set(screens.map(([[file]]) => file));
    screens.forEach(([row, number]) => assert.equal(number, row[1], row.join(' ')));
    assert.ok(opened.size > files.length / 3, `${opened.size}`);
    assert.deepEqual(faults, []);
});

test('says of packets what the summary says', async () => {
    await open(join(captures, 'icmp-types.pcapng'));
    const lines = execFileSync(process.env.NETFLOOR, ['summary', join(captures, 'icmp-types.pcapng')], { encoding: 'utf8' });
    const expected = lines.trim().split('\n').map(line => line.trim().replace(/\.\.\.$/, '').split(/[\s>]+/));
    const rows = await rowTexts();
    assert.ok(expected.length > 5 && rows.length >= 5);
    rows.forEach((row, i) => expected[i].forEach(word => assert.ok(row.includes(word), `${word} in ${row}`)));
});

test('links fields and octets both ways', async () => {
    await open(join(captures, 'icmp-types.pcapng'));
    const item = name => page.getByRole('treeitem', { name });
    const start = 14; // of the IP header, after Ethernet
    await item(/^Time to Live:/).click();
    assert.deepEqual(await litOctets(), [start + 8]);
    await item(/^Source Address:/).click();
    assert.deepEqual(await litOctets(), [start + 12, start + 13, start + 14, start + 15]);
    assert.match(await page.locator('#field').innerText(), /octets 12 to 15 of the IP packet, bits 97-128/);
    await item(/^Fragment Offset:/).click(); // 13 bits of two octets
    assert.deepEqual(await litOctets(), [start + 6, start + 7]);
    assert.equal(await page.locator('#digits .lit').count(), 13);

    await page.locator(`#octets .octet[data-octet="${start + 9}"]`).click();
    assert.match(await chosenItem().innerText(), /^\s*Protocol:\s*ICMP/);
    await page.locator(`#octets .octet[data-octet="${start}"]`).click(); // two fields, one after the other
    assert.match(await chosenItem().innerText(), /Version/);
    await page.locator(`#octets .octet[data-octet="${start}"]`).click();
    assert.match(await chosenItem().innerText(), /Internet Header Length/);
    await page.locator('#digits .digit').first().click();
    assert.match(await chosenItem().innerText(), /Version/);
    await page.locator('#octets .octet[data-octet="3"]').click();
    assert.match(await page.locator('#field').innerText(), /in no field: before the IP header/);
});

test('works by keyboard alone, and keeps the field from packet to packet', async () => {
    await open(join(captures, 'tcp-md5-bgp.pcap'));
    assert.equal(await focused(), 'packets');
    await press('Enter', 'End', 'Home', 'ArrowDown', 'ArrowDown');
    assert.equal(await focused(), 'tree');
    assert.match(await chosenItem().innerText(), /Length:/);
    await press('ArrowLeft', 'ArrowLeft'); // to the block, which closes
    assert.equal(await chosenItem().getAttribute('aria-expanded'), 'false');
    const shown = await page.getByRole('treeitem').count();
    await press('ArrowRight', 'ArrowRight');
    assert.ok(await page.getByRole('treeitem').count() >= shown);
    assert.match(await chosenItem().innerText(), /Time:/);
    await page.getByRole('treeitem', { name: /^Time to Live:/ }).click();
    const field = (await chosenItem().innerText()).split(':')[0];
    await press('Escape', 'ArrowDown');
    assert.equal(await focused(), 'packets');
    assert.equal((await chosenItem().innerText()).split(':')[0], field);
    await press('Tab', 'Tab', 'Control+Home', 'ArrowRight', 'ArrowDown');
    assert.equal(await focused(), 'octets');
    assert.equal(await page.locator('#octets .active').first().getAttribute('data-octet'), '17');
    await press('Tab', 'ArrowDown', 'Tab', 'ArrowLeft');
    assert.equal(await page.getByRole('separator', { name: 'Width of the fields' }).getAttribute('aria-valuenow'), '50');
    await press('?');
    assert.ok(await page.getByRole('dialog', { name: 'Keys' }).isVisible());
    await press('Escape', '/');
    assert.equal(await focused(), 'filter');
});

test('filters the list and says how many are left', async () => {
    await open(join(captures, 'ip4-options-mixed.pcap'), join(captures, 'tcp-urgent-loopback.pcap'));
    const all = (await page.getByRole('grid', { name: 'Packets' }).getAttribute('aria-rowcount')) - 1;
    await press('/');
    await page.keyboard.type('URGENT-loop !zzz damaged');
    const rows = await rowTexts();
    assert.ok(rows.length > 0 && rows.every(row => /tcp-urgent.*DAMAGED/.test(row)), rows[0]);
    const status = page.getByRole('status').first();
    assert.match(await status.innerText(), new RegExp(`^\\d+ of ${all} packets$`));
    await press('Enter', 'End');
    assert.equal(await focused(), 'packets');
    const wanted = (await page.locator('#packets .active').innerText()).replace(/\s+/g, ' ');
    await press('/');
    await page.keyboard.type(' nowhere');
    assert.equal((await rowTexts()).length, 0);
    await press('Escape');
    assert.equal(await status.innerText(), `${all} packets`);
    assert.equal((await page.locator('#packets .active').innerText()).replace(/\s+/g, ' '), wanted);
    assert.deepEqual(faults, []);
});

test('is accessible in light and dark', async () => {
    await open(join(captures, 'tcp-urgent-loopback.pcap'));
    await press('End'); // the damaged one
    const background = () => page.evaluate(() => getComputedStyle(document.body).backgroundColor);
    const look = { light: 'rgb(255, 255, 255)', dark: 'rgb(23, 25, 28)' };
    const check = async rules => {
        const { violations } = await page.evaluate(options => window.axe.run(options), { ...rules, resultTypes: ['violations'] });
        assert.deepEqual(violations.map(({ id, nodes }) => [id, nodes[0].html]), []);
    };
    // The page's policy refuses scripts of others: this one is given to the browser, not to the page.
    await page.evaluate(readFileSync(require.resolve('axe-core'), 'utf8'));
    assert.equal(await background(), look.light);
    await page.getByRole('treeitem', { name: /^DAMAGED:/ }).first().click();
    await check();
    await page.emulateMedia({ colorScheme: 'dark' });
    assert.equal(await background(), look.dark);
    await check({ runOnly: ['color-contrast'] }); // the rest is the same
    await page.getByLabel('Colours').selectOption('light');
    assert.equal(await background(), look.light);
    await page.reload();
    assert.equal(await background(), look.light); // kept
    await page.getByLabel('Colours').selectOption('');
    await page.emulateMedia({ colorScheme: 'light' });
});

test('gives a screen reader names, states and places', async () => {
    await open(join(captures, 'tcp-urgent-loopback.pcap'));
    const packets = Number(await page.locator('#packets').getAttribute('aria-rowcount')) - 1;
    await press('End', 'Enter', 'ArrowDown');
    const row = page.getByRole('row', { selected: true }).first();
    assert.equal(await page.locator('#packets').getAttribute('aria-activedescendant'), await row.getAttribute('id'));
    assert.equal(await row.getAttribute('aria-rowindex'), String(packets + 1));
    assert.equal(await row.getByRole('gridcell', { name: 'DAMAGED', exact: true }).count(), 1); // a word, not a colour
    const item = page.getByRole('treeitem', { name: /^Time: / });
    assert.equal(await page.locator('#tree').getAttribute('aria-activedescendant'), await item.getAttribute('id'));
    assert.deepEqual(await item.evaluate(one => ['level', 'posinset', 'setsize'].map(name => one.getAttribute(`aria-${name}`))),
        ['2', '1', await item.getAttribute('aria-setsize')]);
    await page.getByRole('treeitem', { name: /^Version: / }).click();
    assert.equal(await page.getByRole('grid', { name: 'Octets' }).getByRole('gridcell', { selected: true }).innerText(), '45');
});

test('shows hostile names as text', async () => {
    const name = '<img src=x onerror=alert(1)><!--<script>.pcap';
    const file = join(folder, name);
    copyFileSync(join(captures, 'tcp-urgent-loopback.pcap'), file);
    await open(file);
    assert.equal(await page.locator('h1').innerText(), name);
    assert.equal(await page.locator('img').count(), 0);
    assert.equal(await page.title(), `${name} - netfloor`);
});

test('opens where its writing was ended early', async () => {
    const html = pageOf(join(captures, 'tcp-urgent-loopback.pcap'));
    const third = html.indexOf('\np[3,');
    await openPage(html.subarray(0, third + 5));
    assert.equal((await rowTexts()).length, 2);
    assert.match(await page.locator('#remarks').innerText(), /ended early/);
    await openPage(html.subarray(0, html.indexOf('\nf{')));
    assert.deepEqual(faults, []);
    assert.match(await page.locator('#count').innerText(), /^0 packets/);
});

test('prints the list and the whole packet', async () => {
    await open(join(captures, 'udp-tcp-rawip.pcap'));
    const counts = () => page.evaluate(() => ['#packets .rows .row', '.item'].map(rows => document.querySelectorAll(rows).length));
    const before = await counts();
    await page.evaluate(() => dispatchEvent(new Event('beforeprint')));
    const printed = await counts();
    const inAll = Number(await page.locator('#packets').getAttribute('aria-rowcount')) - 1;
    assert.equal(printed[0], Math.min(500, inAll));
    assert.ok(printed[1] > before[1]);
    await page.evaluate(() => dispatchEvent(new Event('afterprint')));
    assert.deepEqual(await counts(), before);
});

test('is ready with 10,000 packets', async context => {
    const html = pageOf(...Array(200).fill(files).flat());
    const times = [];
    for (let i = 0; i < 3; ++i) {
        await openPage(html);
        times.push(await page.evaluate(() => performance.getEntriesByName('ready')[0].startTime));
    }
    assert.equal(await page.locator('#count').innerText(), '10,000 packets');
    assert.match(await page.locator('#remarks').innerText(), /first 10000 packets, and there are more/);
    assert.ok(await page.locator('#packets .rows .row').count() < 100);
    const started = performance.now();
    await page.locator('#filter').fill('sctp init');
    const filtered = performance.now() - started;
    await press('Enter', 'End');
    assert.match(await page.locator('#packets .active').innerText(), /INIT/);
    context.diagnostic(`ready after ${Math.round(Math.min(...times))} ms, filtered after ${Math.round(filtered)} ms, ` +
        `${Math.round(html.length / 10000)} octets a packet`);
    assert.ok(Math.min(...times) < 5000, `${times}`);
});
