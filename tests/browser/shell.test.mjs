// The pelta shell in a real browser: Debian's Chromium, headless, driven by
// playwright-core. Run through scripts/browser-test.sh (which builds what it
// needs) or with PELTA_BUILD_DIR and PELTA_WEB_DIR set:
//   node --test tests/browser/shell.test.mjs
//
// Two servers are driven:
//  * `pelta serve` on a demo database it creates in a temporary data folder:
//    the library's lists as navigation (those the library cannot make yet
//    say so), the currency-rate list and its detail form over the real
//    framework and service — a rate entered, saved and found in the list,
//    Yes/No questions answered, an item's barcode preview following the
//    chosen barcode row and saved as a download, and a closed tab's screens
//    terminated; and
//    the partners' list and editor — a partner found with the quick filter,
//    opened, changed and saved, a new one refused once and then saved; an
//    item's producer chosen in the partners' list shown as a modal selector;
//  * the shell over its fixture screens (shell_fixture_server): a list of a
//    million rows paged from the server, sorting, shortcuts, a detail form
//    with its validation message, questions and input boxes as modal dialogs,
//    and the release of a closed tab's session.
import { after, afterEach, before, describe, test } from 'node:test';
import assert from 'node:assert/strict';
import { spawn } from 'node:child_process';
import { mkdtempSync, mkdirSync, readFileSync, rmSync } from 'node:fs';
import { tmpdir } from 'node:os';
import path from 'node:path';
import { fileURLToPath } from 'node:url';
import { chromium } from 'playwright-core';

const here = path.dirname(fileURLToPath(import.meta.url));
const root = path.resolve(here, '../..');
const buildDir = process.env.PELTA_BUILD_DIR ?? path.join(root, 'build/debug');
const webDir = process.env.PELTA_WEB_DIR ?? path.join(root, 'shell/web/dist');
const shotDir = process.env.PELTA_SCREENSHOTS ?? path.join(buildDir, 'screenshots');
mkdirSync(shotDir, { recursive: true });

const CHROMIUM_ARGS = [
  '--headless',
  '--no-sandbox',
  '--disable-gpu',
  '--disable-quic',
  '--no-first-run',
  '--disable-background-networking',
  '--disable-component-update',
  '--disable-sync',
];

// Starts a server that prints "serving on http://...", answers its address and process.
function startServer(program, args, env) {
  return new Promise((resolve, reject) => {
    const child = spawn(program, args, { env: { ...process.env, ...env }, stdio: ['ignore', 'pipe', 'pipe'] });
    let out = '';
    let err = '';
    const timer = setTimeout(() => reject(new Error(`${program} did not start:\n${out}\n${err}`)), 30000);
    child.stdout.on('data', (d) => {
      out += d;
      const m = out.match(/serving on (http:\/\/\S+)/);
      if (m) {
        clearTimeout(timer);
        resolve({ url: m[1], child, output: () => out, errors: () => err });
      }
    });
    child.stderr.on('data', (d) => (err += d));
    child.on('exit', (code) => {
      clearTimeout(timer);
      reject(new Error(`${program} exited with ${code}:\n${out}\n${err}`));
    });
  });
}

function stopServer(server) {
  return new Promise((resolve) => {
    server.child.removeAllListeners('exit');
    server.child.on('exit', () => resolve(server.output()));
    server.child.kill('SIGTERM');
  });
}

async function launchBrowser() {
  const profile = mkdtempSync(path.join(tmpdir(), 'pelta-chromium-'));
  const context = await chromium.launchPersistentContext(profile, {
    executablePath: process.env.CHROMIUM ?? '/usr/bin/chromium',
    headless: true,
    args: CHROMIUM_ARGS,
    viewport: { width: 1280, height: 800 },
    locale: 'bg-BG',
  });
  return { context, close: async () => { await context.close(); rmSync(profile, { recursive: true, force: true }); } };
}

// A field's value once the page has drawn `expected` into it (a reused form
// is drawn anew a moment after the command that showed it), else what it holds.
// What the page showed at the end of a test, to see why one failed.
async function endShot(page, t) {
  const name = (t?.name ?? 'test').replace(/[^\p{L}\p{N}]+/gu, '-').slice(0, 60);
  await page?.screenshot({ path: path.join(shotDir, `end-${name}.png`), fullPage: true }).catch(() => {});
}

async function valueOnceDrawn(field, expected) {
  for (let i = 0; i < 100; i++) {
    if ((await field.inputValue()) === expected) break;
    await new Promise((r) => setTimeout(r, 50));
  }
  return field.inputValue();
}

// The dialog now shown, and a click on one of its buttons.
async function answerDialog(page, expectedText, buttonText) {
  const dialog = page.locator('dialog[open]');
  await dialog.waitFor();
  await assert.doesNotReject(dialog.getByText(expectedText, { exact: false }).waitFor());
  await dialog.getByRole('button', { name: buttonText, exact: true }).click();
  await dialog.waitFor({ state: 'hidden' });
}

describe('pelta serve', () => {
  let work, server, browser, page;
  before(async () => {
    work = mkdtempSync(path.join(tmpdir(), 'pelta-serve-'));
    // No --db: the demo database is made in the data folder.
    server = await startServer(path.join(buildDir, 'bin/pelta'), ['serve', '--port', '0', '--web', webDir],
      { PELTA_REGISTRY: path.join(work, 'registry.ini'), XDG_DATA_HOME: work, PELTA_LOG_FOLDER: path.join(work, 'logs') });
    browser = await launchBrowser();
    page = await browser.context.newPage();
    await page.goto(server.url);
    await page.locator('body[data-ready=true]').waitFor();
  });
  after(async () => {
    await browser?.close();
    if (server) await stopServer(server);
    rmSync(work, { recursive: true, force: true });
  });

  afterEach((t) => endShot(page, t));
  const list = () => page.locator('section.screen[data-kind=list]');
  const form = () => page.locator('section.screen[data-kind=detail]');
  const footer = (n) => list().locator('.footer', { hasText: new RegExp(`Записи: ${n}$`) });
  // An attribute of the shown detail form typed and sent with Enter.
  const commitAttribute = async (field, value) => {
    const input = page.locator(`section.screen[data-kind=detail]:not([hidden]) input[name=${field}]`);
    await input.fill(value);
    await Promise.all([page.waitForResponse((r) => r.url().includes('/attributes')), input.press('Enter')]);
  };

  test('the navigation offers the library\'s lists; one not made yet says so', async () => {
    const ratios = page.locator('#lists a[data-list="PeltaNom15.ctxRatios"]');
    assert.equal(await ratios.textContent(), 'Валутни курсове');
    assert.ok(!(await ratios.getAttribute('class'))?.includes('unavailable'));
    const items = page.locator('#lists a[data-list="PeltaNom15.ctxItems"]');
    assert.equal(await items.textContent(), 'Продукти и материали');
    assert.ok(!(await items.getAttribute('class'))?.includes('unavailable'));
    // A list the library does not offer yet.
    const machines = page.locator('#lists a[data-list="PeltaNom15.ctxMachines"]');
    assert.ok((await machines.getAttribute('class')).includes('unavailable'));
    await machines.click();
    await answerDialog(page, 'още не е наличен', 'OK');
  });

  test('the currency-rate list shows the demo rates, grouped by bank', async () => {
    await page.locator('#lists a[data-list="PeltaNom15.ctxRatios"]').click();
    await list().locator('.ag-row', { hasText: 'БНБ' }).first().waitFor();
    await footer(90).waitFor();
    assert.equal(await page.locator('.tab.active').textContent(), 'Валутни курсове');
    // The group filter is applied on the server.
    await list().locator('select[name=group]').selectOption('БНБ');
    await footer(30).waitFor();
    await list().locator('select[name=group]').selectOption('(Всички)');
    await footer(90).waitFor();
  });

  test('a new rate is entered in the detail form, saved and shown in the list', async () => {
    await list().locator('.ag-row').first().click();
    await page.keyboard.press('Control+n');
    await form().waitFor();
    const bank = form().locator('[data-control=cboBank]');
    assert.equal(await bank.locator('option').first().textContent(), 'Изберете банка');
    await bank.selectOption({ label: 'БНБ – Българска народна банка' });
    await form().locator('[data-control=dtpDate]').fill('2031-05-04');
    await form().locator('button[data-action=addrow]').click();
    const row = form().locator('.rows-table tbody tr').last();
    await row.locator('select[name=Currency_ID]').selectOption({ label: 'USD – Щатски долар' });
    await row.locator('input[name=Units]').fill('1');
    await row.locator('input[name=Rate]').fill('1.812345');
    await page.keyboard.press('Control+s');
    await page.locator('#status', { hasText: 'Записано' }).waitFor();
    // The saved record comes back: its row now shows the currency's code.
    await form().locator('.rows-table td[data-column=CurrencyCode]', { hasText: 'USD' }).waitFor();
    await page.screenshot({ path: path.join(shotDir, 'pelta-rate-form.png') });

    await page.locator('.tab', { hasText: 'Валутни курсове' }).first().click();
    await footer(91).waitFor();
    // Sorted on the server by date, newest first, the new rate heads the list.
    const date = list().locator('.ag-header-cell', { hasText: 'Дата' });
    await date.click(); // ascending
    await date.click(); // descending
    await list().locator('.ag-row[row-index="0"]', { hasText: '04.05.2031' }).waitFor();
    await page.screenshot({ path: path.join(shotDir, 'pelta-rates.png') });
  });

  test('Del asks whether to delete the inactive rates; "Не" keeps them', async () => {
    await list().locator('.ag-row[row-index="0"]').click();
    await page.keyboard.press('Delete');
    await answerDialog(page, 'Желаете ли да изтриете избраните неактивни номенклатури?', 'Не');
    await footer(91).waitFor();
  });

  test('deleting from the form asks, deletes and closes the form', async () => {
    await page.locator('.tab', { hasText: 'Валутни курсове' }).last().click();
    await form().locator('button[data-command="118"]').click();
    await answerDialog(page, 'Желаете ли да изтриете номенклатурата?', 'Да');
    await form().waitFor({ state: 'detached' });
    await footer(90).waitFor();
  });

  test('the items list shows the demo catalogue with its computed prices', async () => {
    await page.locator('#lists a[data-list="PeltaNom15.ctxItems"]').click();
    const items = page.locator('section.screen[data-kind=list]', { hasText: 'Записи: 40' });
    await items.waitFor();
    await items.locator('.ag-row').first().waitFor();
    // Quick find by code ("/" prefix) leaves the one item.
    const search = page.locator('section.screen[data-kind=list] .quick-filter input[name=filter-802]');
    await search.fill('/0000007');
    await search.press('Enter');
    await page.locator('section.screen[data-kind=list]', { hasText: 'Записи: 1' }).waitFor();
    await search.fill('');
    await search.press('Enter');
    await items.waitFor();
    await page.screenshot({ path: path.join(shotDir, 'pelta-items.png') });
  });

  test('an item is opened from the list, changed, saved and found by its new second name', async () => {
    const items = page.locator('section.screen[data-kind=list]:not([hidden])');
    const search = items.locator('.quick-filter input[name=filter-802]');
    const find = async (text) => {
      await search.fill(text);
      await search.press('Enter');
    };
    const itemsFooter = (n) => items.locator('.footer', { hasText: new RegExp(`Записи: ${n}$`) });
    const field = (name) => form().locator(`[data-control=${name}]`);
    await find('/0000007');
    await itemsFooter(1).waitFor();
    // The footer counts the filtered rows before the grid has drawn them.
    const row = items.locator('.ag-row[row-index="0"]', { hasText: '0000007' });
    await row.waitFor();
    const name = (await row.locator('.ag-cell[col-id="Name"]').textContent()).trim();
    await row.dblclick();
    await form().waitFor();
    assert.equal(await field('txtName').inputValue(), name);
    assert.equal(await field('txtCode').inputValue(), '0000007');
    await field('txtName').fill(`${name} (нов)`);
    await commitAttribute('Name2', 'Браузърно второ име');
    await page.screenshot({ path: path.join(shotDir, 'pelta-item-form.png'), fullPage: true });
    await page.keyboard.press('Control+s');
    await page.locator('#status', { hasText: 'Записано' }).waitFor();

    // The list shows the change and its quick find searches the second name.
    await page.locator('.tab', { hasText: 'Продукти и материали' }).click();
    await items.locator('.ag-row[row-index="0"]', { hasText: `${name} (нов)` }).waitFor();
    await find('Браузърно второ');
    await itemsFooter(1).waitFor();
    await items.locator('.ag-row', { hasText: `${name} (нов)` }).waitFor();

    await find('');
    await itemsFooter(40).waitFor();
  });

  test('a new product is refused without a name, then saved with a barcode and found', async () => {
    const items = page.locator('section.screen[data-kind=list]:not([hidden])');
    await page.locator('.tab', { hasText: 'Продукти и материали' }).click();
    await items.locator('.ag-row').first().click();
    await page.keyboard.press('Control+n');
    const detail = page.locator('section.screen[data-kind=detail]:not([hidden])');
    await detail.locator('[data-control=txtCode]').waitFor();
    // The form the list reuses is drawn anew for the new product.
    assert.equal(await valueOnceDrawn(detail.locator('[data-control=txtCode]'), ''), '');
    // The defaults of a new product: VAT group "Б" among the attributes.
    assert.equal(await detail.locator('select[name=TaxGroup] option:checked').textContent(), 'Б');
    await commitAttribute('Name2', 'Second name');
    await page.keyboard.press('Control+s');
    await answerDialog(page, 'Невалидно име', 'OK');
    await detail.locator('[data-control=txtName]').fill('Браузърен продукт');
    await detail.locator('nav.form-tree button[data-node="Баркодове"]').click();
    const barcodes = detail.locator('.grid[data-grid=geBarCodes]');
    await barcodes.waitFor();
    await barcodes.locator('button[data-action=addrow]').click();
    await barcodes.locator('tbody tr').last().locator('input[name=Code]').fill('3800000000994');
    await page.screenshot({ path: path.join(shotDir, 'pelta-item-new.png'), fullPage: true });
    await page.keyboard.press('Control+s');
    await page.locator('#status', { hasText: 'Записано' }).waitFor();
    // The saved state comes back with the code the service gave it.
    let code = '';
    for (let i = 0; i < 100 && code === ''; i++) {
      code = await detail.locator('[data-control=txtCode]').inputValue();
      if (code === '') await page.waitForTimeout(50);
    }
    assert.match(code, /^\d+$/, 'the service numbered it');

    await page.locator('.tab', { hasText: 'Продукти и материали' }).click();
    const search = items.locator('.quick-filter input[name=filter-802]');
    await search.fill('Браузърен');
    await search.press('Enter');
    await items.locator('.footer', { hasText: /Записи: 1$/ }).waitFor();
    await items.locator('.ag-row', { hasText: 'Браузърен продукт' }).waitFor();
    await search.fill('');
    await search.press('Enter');
  });

  test('choosing a barcode row shows its image in the preview, which is saved as a download', async () => {
    const items = page.locator('section.screen[data-kind=list]:not([hidden])');
    await page.locator('.tab', { hasText: 'Продукти и материали' }).click();
    const search = items.locator('.quick-filter input[name=filter-802]');
    await search.fill('/0000007');
    await search.press('Enter');
    await items.locator('.footer', { hasText: /Записи: 1$/ }).waitFor();
    // The footer counts the filtered rows before the grid has drawn them.
    await items.locator('.ag-row[row-index="0"]', { hasText: '0000007' }).dblclick();
    const detail = page.locator('section.screen[data-kind=detail]:not([hidden])');
    const txtCode = detail.locator('[data-control=txtCode]');
    for (let i = 0; i < 100 && (await txtCode.inputValue()) !== '0000007'; i++) await page.waitForTimeout(50);
    await detail.locator('nav.form-tree button[data-node="Баркодове"]').click();
    const preview = detail.locator('img[data-control=imgBarCode]');
    await preview.waitFor();
    const first = await preview.getAttribute('src');
    assert.match(first, /^data:image\/svg\+xml/);
    assert.ok((await preview.evaluate((img) => img.complete && img.naturalWidth)) > 0, 'the image is drawn');

    // Another row: the options and the image follow it.
    const rows = detail.locator('.grid[data-grid=geBarCodes] tbody tr');
    const second = await rows.nth(1).locator('input[name=Code]').inputValue();
    await rows.nth(1).locator('input[name=Note]').click();
    const code = detail.locator('input[data-control=txtBarCode]');
    for (let i = 0; i < 100 && (await code.inputValue()) !== second; i++) await page.waitForTimeout(50);
    assert.equal(await code.inputValue(), second);
    assert.notEqual(await preview.getAttribute('src'), first);
    await page.screenshot({ path: path.join(shotDir, 'pelta-item-barcode.png'), fullPage: true });

    // Saved as a metafile: the browser receives it as a download.
    const [saved] = await Promise.all([
      page.waitForEvent('download'),
      detail.locator('button[data-command="10006"]').click(),
    ]);
    assert.equal(saved.suggestedFilename(), `${second}.wmf`);
    const bytes = readFileSync(await saved.path());
    assert.equal(bytes.readUInt32LE(0), 0x9ac6cdd7, 'a placeable metafile');

    await page.locator('.tab', { hasText: 'Продукти и материали' }).click();
    await search.fill('');
    await search.press('Enter');
  });

  test('the producer of an item is chosen in the partners\' list shown in a dialog', async () => {
    const items = page.locator('section.screen[data-kind=list]:not([hidden])');
    const detail = page.locator('section.screen[data-kind=detail]:not([hidden])');
    const openItem = async () => {
      await page.locator('.tab', { hasText: 'Продукти и материали' }).click();
      const search = items.locator('.quick-filter input[name=filter-802]');
      await search.fill('/0000005');
      await search.press('Enter');
      await items.locator('.footer', { hasText: /Записи: 1$/ }).waitFor();
      await items.locator('.ag-row[row-index="0"]', { hasText: '0000005' }).dblclick();
      await detail.locator('[data-control=txtCode]').waitFor();
      assert.equal(await valueOnceDrawn(detail.locator('[data-control=txtCode]'), '0000005'), '0000005');
    };
    await openItem();
    const producer = () => detail.locator('tr[data-field=ProducerCg_ID]');
    await producer().locator('button').click();

    // The partners' list in a modal dialog, filtered by a name.
    const dialog = page.locator('dialog[open][data-kind=selector]');
    await dialog.locator('h3', { hasText: 'Производител' }).waitFor();
    await dialog.locator('.footer', { hasText: /Записи: \d+$/ }).waitFor();
    const cell = dialog.locator('.ag-row[row-index="3"] .ag-cell[col-id="Name"]');
    let name = '';
    for (let i = 0; i < 100 && name === ''; i++) {
      name = ((await cell.textContent()) ?? '').trim();
      if (name === '') await page.waitForTimeout(50);
    }
    assert.ok(name.length > 3, name);
    const filter = dialog.locator('.quick-filter input');
    await filter.fill(name);
    await filter.press('Enter');
    await dialog.locator('.footer', { hasText: /Записи: 1$/ }).waitFor();
    await dialog.locator('.ag-row[row-index="0"]', { hasText: name }).click();
    await page.screenshot({ path: path.join(shotDir, 'pelta-item-selector.png') });
    await dialog.getByRole('button', { name: 'Избор', exact: true }).click();
    await dialog.waitFor({ state: 'detached' });
    await producer().locator('.attrib-shown', { hasText: name }).waitFor();
    await Promise.all([page.waitForResponse((r) => r.url().endsWith('/save')), page.keyboard.press('Control+s')]);
    await page.locator('#status', { hasText: 'Записано' }).waitFor();

    // "Отказ" leaves the importer as it was.
    const importer = detail.locator('tr[data-field=ImporterCg_ID]');
    await importer.locator('button').click();
    await dialog.locator('.ag-row').first().waitFor();
    await dialog.getByRole('button', { name: 'Отказ', exact: true }).click();
    await dialog.waitFor({ state: 'detached' });
    assert.equal((await importer.locator('.attrib-shown').textContent()).trim(), '');

    // Closed and opened again, the item reads its producer from the database.
    await detail.locator('button.close').click();
    await detail.waitFor({ state: 'detached' });
    await openItem();
    await producer().locator('.attrib-shown', { hasText: name }).waitFor();
  });

  test('a closed tab releases its session and terminates its screens', async () => {
    await page.close({ runBeforeUnload: true });
    await assert.doesNotReject(async () => {
      for (let i = 0; i < 200 && !/released: \d+ screens terminated/.test(server.errors()); i++)
        await new Promise((r) => setTimeout(r, 50));
    });
    const m = server.errors().match(/released: (\d+) screens terminated/);
    assert.ok(m, server.errors());
    assert.equal(Number(m[1]), 3); // the two lists and the item form; the rate's form had closed
    const output = await stopServer(server);
    server = null;
    assert.match(output, /library objects released: yes/);
  });
});

describe('pelta serve: partners', () => {
  let work, server, browser, page;
  before(async () => {
    work = mkdtempSync(path.join(tmpdir(), 'pelta-partners-'));
    server = await startServer(path.join(buildDir, 'bin/pelta'), ['serve', '--port', '0', '--web', webDir],
      { PELTA_REGISTRY: path.join(work, 'registry.ini'), XDG_DATA_HOME: work, PELTA_LOG_FOLDER: path.join(work, 'logs') });
    browser = await launchBrowser();
    page = await browser.context.newPage();
    await page.goto(server.url);
    await page.locator('body[data-ready=true]').waitFor();
  });
  after(async () => {
    await browser?.close();
    if (server) await stopServer(server);
    rmSync(work, { recursive: true, force: true });
  });

  afterEach((t) => endShot(page, t));
  const list = () => page.locator('section.screen[data-kind=list]');
  const form = () => page.locator('section.screen[data-kind=detail]');
  const footer = (n) => list().locator('.footer', { hasText: new RegExp(`Записи: ${n}$`) });
  const search = () => list().locator('.quick-filter input[name^=filter-]');
  const cell = (row, column) => list().locator(`.ag-row[row-index="${row}"] .ag-cell[col-id="${column}"]`);
  const find = async (text) => {
    await search().fill(text);
    await search().press('Enter');
  };
  let name;

  test('the partners\' list shows the demo partners and its quick filter', async () => {
    await page.locator('#lists a[data-list="PeltaNom15.ctxContragents"]').click();
    await footer(40).waitFor();
    assert.equal(await page.locator('.tab.active').textContent(), 'Контрагенти');
    assert.equal(await list().locator('.quick-filter .hint').textContent(),
      "(префикс '/' за търсене по код, '//' за търсене по адрес и др.)");
    assert.equal(await list().locator('.quick-filter .caption').textContent(), 'Търсене');
    await cell(2, 'Name').waitFor();
    await page.screenshot({ path: path.join(shotDir, 'pelta-partners.png') });
  });

  test('a partner is found with the quick filter, opened, changed and saved', async () => {
    name = (await cell(2, 'Name').textContent()).trim();
    assert.ok(name.length > 3, name);
    await find(name);
    await footer(1).waitFor();
    await list().locator('.ag-row', { hasText: name }).first().dblclick();
    await form().waitFor();
    assert.equal(await form().locator('[data-control=txtName]').inputValue(), name);
    await page.screenshot({ path: path.join(shotDir, 'pelta-partner-form.png'), fullPage: true });
    await form().locator('[data-control=attPhone]').fill('+359 2 9876543');
    await page.keyboard.press('Control+s');
    await page.locator('#status', { hasText: 'Записано' }).waitFor();

    await page.locator('.tab', { hasText: 'Контрагенти' }).click();
    await footer(1).waitFor();
    // The address search ("//") looks in the phones too: the saved one is found.
    await find('//2 9876543');
    await footer(1).waitFor();
    await list().locator('.ag-row', { hasText: name }).waitFor();
    await page.screenshot({ path: path.join(shotDir, 'pelta-partners-found.png') });
  });

  test('a new partner is refused once, then saved and found in the list', async () => {
    await list().locator('.ag-row').first().click();
    await page.keyboard.press('Control+n');
    await form().waitFor();
    const field = (name) => form().locator(`[data-control=${name}]`);
    // The form the list reuses is drawn anew for the new partner.
    assert.equal(await valueOnceDrawn(field('txtName'), ''), '');
    await field('txtAddress').fill('гр. Варна, ул. Тестова 1');
    await page.keyboard.press('Control+s');
    await answerDialog(page, 'Невалидно име', 'OK');
    await field('txtName').fill('Браузър Тест ООД');
    await field('txtBulstat').fill('203040500');
    const persons = form().locator('.grid[data-grid=gePersons]');
    await persons.locator('button[data-action=addrow]').click();
    await persons.locator('tbody tr').last().locator('input[name=Name]').fill('Иван Тестов');
    await page.screenshot({ path: path.join(shotDir, 'pelta-partner-new.png'), fullPage: true });
    await page.keyboard.press('Control+s');
    await page.locator('#status', { hasText: 'Записано' }).waitFor();

    await page.locator('.tab', { hasText: 'Контрагенти' }).click();
    await find('Браузър Тест');
    await footer(1).waitFor();
    await list().locator('.ag-row', { hasText: 'Браузър Тест ООД' }).waitFor();
    await find('');
    await footer(41).waitFor();
  });
});

describe('the shell over its fixture screens', () => {
  let server, browser, page;
  const pages = [];
  before(async () => {
    server = await startServer(path.join(buildDir, 'bin/shell_fixture_server'),
      ['--port', '0', '--rows', '1000000', '--web', webDir, '--session-timeout', '5'], {});
    browser = await launchBrowser();
    page = await browser.context.newPage();
    page.on('request', (r) => {
      const u = new URL(r.url());
      if (u.pathname.endsWith('/rows')) pages.push(Number(u.searchParams.get('count')));
    });
    await page.goto(server.url);
    await page.locator('body[data-ready=true]').waitFor();
  });
  after(async () => {
    await browser?.close();
    if (server) await stopServer(server);
  });

  const list = () => page.locator('section.screen[data-kind=list]');
  const rowWith = (text) => list().locator('.ag-row', { hasText: text }).first();

  test('a million rows page from the server, only the visible ones travel', async () => {
    await page.locator('#lists a', { hasText: 'Числа' }).click();
    await rowWith('Ред 1').waitFor();
    await assert.doesNotReject(list().locator('.footer', { hasText: /1\D?000\D?000/ }).waitFor());
    // To the end of the list and back: the grid asks only for the blocks in view.
    const viewport = list().locator('.ag-grid-viewport');
    await viewport.evaluate((el) => (el.scrollTop = el.scrollHeight));
    await rowWith('Ред 1000000').waitFor();
    await viewport.evaluate((el) => (el.scrollTop = 0));
    await rowWith('Ред 1').waitFor();
    const travelled = pages.reduce((a, b) => a + b, 0);
    assert.ok(pages.every((n) => n <= 100), `page sizes ${pages}`);
    assert.ok(travelled < 2000, `${travelled} rows travelled`);
  });

  test('sorting happens on the server', async () => {
    const code = list().locator('.ag-header-cell', { hasText: 'Код' });
    await code.click(); // ascending
    await code.click(); // descending
    await list().locator('.ag-row[row-index="0"]', { hasText: 'Ред 1000000' }).waitFor({ timeout: 60000 });
    await code.click(); // back to the server's own order
    await list().locator('.ag-row[row-index="0"]', { hasText: 'Ред 1' }).waitFor({ timeout: 60000 });
  });

  test('Ctrl+N opens a detail form; saving checks it and adds the row', async () => {
    await rowWith('Ред 1').click();
    await page.keyboard.press('Control+n');
    const form = page.locator('section.screen[data-kind=detail]');
    await form.waitFor();
    assert.equal(await form.locator('[data-control=txtName]').getAttribute('placeholder'), 'Въведете име');
    // Without a name the form refuses with a message at the name field.
    await page.keyboard.press('Control+s');
    await answerDialog(page, 'Моля въведете име', 'OK');
    await form.locator('[data-control=txtName]').fill('Тестово число');
    await form.locator('[data-control=txtAmount]').fill('12.50');
    await page.keyboard.press('Control+s');
    await page.locator('#status', { hasText: 'Записано' }).waitFor();
    await page.locator('.tab', { hasText: 'Числа' }).click();
    await list().locator('.footer', { hasText: /1\D?000\D?001/ }).waitFor();
    const viewport = list().locator('.ag-grid-viewport');
    await viewport.evaluate((el) => (el.scrollTop = el.scrollHeight));
    await rowWith('Тестово число').waitFor();
  });

  test('Del asks a Yes/No question; the answer decides', async () => {
    await rowWith('Тестово число').click();
    await page.keyboard.press('Delete');
    await answerDialog(page, 'Желаете ли да изтриете избраните числа?', 'Не');
    await list().locator('.footer', { hasText: /1\D?000\D?001/ }).waitFor();
    await rowWith('Тестово число').click();
    await page.keyboard.press('Delete');
    await answerDialog(page, 'Желаете ли да изтриете избраните числа?', 'Да');
    await list().locator('.footer', { hasText: /1\D?000\D?000$/ }).waitFor();
  });

  test('an input box carries the text typed into the page', async () => {
    const viewport = list().locator('.ag-grid-viewport');
    await viewport.evaluate((el) => (el.scrollTop = 0));
    await rowWith('Ред 2').click();
    await list().locator('button[data-command="300"]').click();
    const dialog = page.locator('dialog[open][data-kind=input]');
    await dialog.locator('input[name=value]').fill('Преименуван ред');
    await page.screenshot({ path: path.join(shotDir, 'shell-input-box.png') });
    await dialog.getByRole('button', { name: 'OK', exact: true }).click();
    await rowWith('Преименуван ред').waitFor();
    await page.screenshot({ path: path.join(shotDir, 'shell-list.png') });
  });

  test('a closed tab releases its session and terminates its screens', async () => {
    await page.close({ runBeforeUnload: true });
    let output = '';
    // The beacon of the closing tab ends the session; the server reports on exit.
    await new Promise((r) => setTimeout(r, 1000));
    output = await stopServer(server);
    server = null;
    const m = output.match(/sessions terminated: (\d+), screens terminated: (\d+)/);
    assert.ok(m, output);
    assert.equal(Number(m[1]), 1);
    assert.ok(Number(m[2]) >= 2, output); // the list and its detail form
  });
});
