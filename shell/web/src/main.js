// The pelta page: the library's lists as navigation, every open screen in a
// tab, its commands in a toolbar with their shortcuts, and the dialogs its
// code asks for.
import './style.css';
import { ApiError, Connection } from './api.js';
import { Dialogs } from './dialogs.js';
import { AttributeGrid, hiddenByTree, nodeKeys, renderForm, renderTree, updateForm, valueOf } from './form.js';
import { ListGrid } from './grid.js';
import { RowsTable } from './rows.js';
import { Selector } from './selector.js';

const connection = new Connection();
const dialogs = new Dialogs(document.getElementById('dialog'), connection);
// A selector's list is drawn as the lists are, with their quick filter.
dialogs.selector = new Selector(connection, { quickFilter: (s, g) => quickFilter(s, g), onError: (e) => reportError(e) });
// id -> { description, tab, view, grids: [ListGrid], form, attributes: [AttributeGrid] }
const screens = new Map();
let active = null;
const writes = new Set(); // changes on their way to the server

// A change sent to the server; commands and saves wait for every one of them.
function track(promise) {
  writes.add(promise);
  promise.finally(() => writes.delete(promise));
  return promise;
}

// An action that depends on earlier changes starts once they have reached the
// server (requests may otherwise overtake each other on their way).
function afterWrites(action) {
  const before = Promise.allSettled([...writes]);
  return track(before.then(action));
}

async function settled() {
  if (document.activeElement instanceof HTMLElement) document.activeElement.blur();
  await Promise.allSettled([...writes]);
}

const $ = (id) => document.getElementById(id);

function status(text) {
  $('status').textContent = text;
}

function reportError(e) {
  if (e instanceof ApiError && e.status === 401) {
    status('Сесията е приключила');
    return;
  }
  dialogs.local(e.message || String(e));
}

// ---- shortcuts ---------------------------------------------------------------

function keyName(e) {
  const parts = [];
  if (e.ctrlKey || e.metaKey) parts.push('Ctrl');
  if (e.altKey) parts.push('Alt');
  if (e.shiftKey) parts.push('Shift');
  let key = e.key;
  if (key === 'Delete') key = 'Del';
  else if (key.length === 1) key = key.toUpperCase();
  parts.push(key);
  return parts.join('+');
}

document.addEventListener('keydown', (e) => {
  if (dialogs.open || !active) return;
  const screen = screens.get(active);
  if (!screen) return;
  const name = keyName(e);
  // Del in a text field edits the text, not the list.
  const typing = e.target instanceof HTMLElement && e.target.matches('input, textarea, select');
  if (typing && !e.ctrlKey && !e.altKey && !/^F\d+$/.test(e.key)) return;
  if (name === 'Ctrl+S' && screen.description.kind === 'detail') {
    e.preventDefault();
    save(screen);
    return;
  }
  const command = screen.description.commands.find((c) => c.enabled && c.shortcut === name);
  if (command) {
    e.preventDefault();
    execute(screen, command.id);
  }
});

// ---- screens -------------------------------------------------------------------

async function execute(screen, command) {
  await settled();
  const grid = screen.grids[0];
  const body = { command };
  if (grid) {
    body.grid = grid.name;
    body.current = grid.currentKey();
    body.selected = grid.selectedKeys();
  }
  try {
    await connection.post(`/api/screens/${screen.description.id}/execute`, body);
  } catch (e) {
    reportError(e);
  }
}

async function save(screen) {
  // A field being edited sends its change first.
  await settled();
  // The status tells of this save only, not of an earlier one.
  status('Записване...');
  try {
    const reply = await connection.post(`/api/screens/${screen.description.id}/save`);
    status(reply.unchanged ? 'Няма промени за запис' : reply.saved ? 'Записано' : 'Не е записано');
  } catch (e) {
    status('Не е записано');
    reportError(e);
  }
}

function toolbar(screen) {
  const bar = document.createElement('div');
  bar.className = 'toolbar';
  bar.setAttribute('role', 'toolbar');
  const d = screen.description;
  if (d.kind === 'detail') {
    const b = document.createElement('button');
    b.textContent = 'Запис';
    b.title = 'Запис (Ctrl+S)';
    b.dataset.command = 'save';
    b.addEventListener('click', () => save(screen));
    bar.append(b);
  }
  for (const c of d.commands) {
    if (d.kind === 'detail' && c.id === 201) continue; // the save button above
    const b = document.createElement('button');
    b.textContent = c.caption;
    b.title = c.tooltip || c.caption;
    b.disabled = !c.enabled;
    b.dataset.command = String(c.id);
    if (c.shortcut) {
      const k = document.createElement('kbd');
      k.textContent = c.shortcut;
      b.append(' ', k);
    }
    b.addEventListener('click', () => execute(screen, c.id));
    bar.append(b);
  }
  const close = document.createElement('button');
  close.className = 'close';
  close.textContent = '✕';
  close.title = 'Затваряне';
  close.addEventListener('click', () => closeScreen(d.id));
  bar.append(close);
  return bar;
}

// ---- a detail form's attribute grids and trees ----------------------------------------

// The form's values, attribute grids included, as the server holds them now:
// the screen's events may have changed more than the value sent.
async function refreshForm(screen, force = '') {
  const id = screen.description.id;
  let d;
  try {
    d = await connection.get(`/api/screens/${id}`);
  } catch (e) {
    if (e.status !== 404) reportError(e);
    return;
  }
  const names = (list) => JSON.stringify((list ?? []).map((x) => x.name));
  if (names(d.attributeGrids) !== names(screen.description.attributeGrids)) {
    await showScreen(id, false);
    return;
  }
  screen.description = d;
  if (screen.form) updateForm(screen.form, d);
  if (screen.nodeForm) updateForm(screen.nodeForm, d);
  for (const a of screen.attributes) {
    const info = d.attributeGrids.find((x) => x.name === a.name);
    if (info) a.update(info, force);
  }
}

// Draws the screen anew, then puts the focus back where the person was.
async function redraw(screen, focusSelector) {
  await showScreen(screen.description.id, false);
  screen.view.querySelector(focusSelector)?.focus();
}

const REFUSED = 'Стойността не е приета';

function attributeActions(screen, grid) {
  const base = `/api/screens/${screen.description.id}`;
  return {
    set: (field, value) =>
      afterWrites(() =>
        connection
          .post(`${base}/attributes`, { grid, field, value })
          .then((reply) => {
            if (!reply.ok) status(REFUSED);
            else if ($('status').textContent === REFUSED) status('');
            return refreshForm(screen, reply.ok ? '' : field);
          })
          .catch(reportError),
      ),
    button: (field) =>
      afterWrites(() =>
        connection
          .post(`${base}/attributebutton`, { grid, field })
          .then(() => redraw(screen, `[data-attributes="${CSS.escape(grid)}"] [name="${CSS.escape(field)}"]`))
          .catch(reportError),
      ),
    select: (field) =>
      track(connection.post(`${base}/attributeselect`, { grid, field }).catch(reportError)),
  };
}

function activateNode(screen, tree, key) {
  return afterWrites(() =>
    connection
      .post(`/api/screens/${screen.description.id}/activate`, { tree, key })
      .then(() => redraw(screen, `[data-tree="${CSS.escape(tree)}"] [data-node="${CSS.escape(key)}"]`))
      .catch(reportError),
  );
}

function render(screen) {
  const d = screen.description;
  screen.tab.querySelector('.tab-caption').textContent = d.caption;
  for (const g of screen.grids) g.destroy();
  screen.grids = [];
  screen.attributes = [];
  screen.form = null;
  screen.nodeForm = null;
  screen.view.replaceChildren(toolbar(screen));
  screen.view.dataset.kind = d.kind;
  // A changed value is sent; the screen's events may change others, which the form then takes.
  const send = (control, value) =>
    track(
      connection
        .post(`/api/screens/${d.id}/values`, { control: control.name, value })
        .then(() => (control.group && nodeKeys(d).has(control.group) ? refreshForm(screen) : null))
        .catch(reportError),
    );
  // Controls of a tree's node stand with that node's lists, the others at the top.
  const ofNode = (c) => nodeKeys(d).has(c.group);
  if (d.kind === 'detail') {
    const form = document.createElement('form');
    form.className = 'detail';
    form.addEventListener('submit', (e) => e.preventDefault());
    renderForm(form, d, send, (c) => !ofNode(c));
    screen.view.append(form);
    screen.form = form;
    for (const info of d.attributeGrids ?? []) {
      const grid = new AttributeGrid(info, attributeActions(screen, info.name));
      screen.attributes.push(grid);
      screen.view.append(grid.element);
    }
  }
  // A form with a tree shows it on the left of its lists; a list belongs to
  // the node whose key is its control's group and shows while that node is selected.
  let lists = screen.view;
  const trees = d.kind === 'detail' ? d.trees ?? [] : [];
  if (trees.length) {
    const area = document.createElement('div');
    area.className = 'lists-area';
    const side = document.createElement('div');
    side.className = 'lists-trees';
    for (const t of trees) side.append(renderTree(t, (key) => activateNode(screen, t.name, key)));
    lists = document.createElement('div');
    lists.className = 'lists';
    area.append(side, lists);
    screen.view.append(area);
  }
  const hidden = hiddenByTree(d);
  for (const g of d.grids) {
    // A form's grid under the caption of the control it stands for.
    const declared = d.kind === 'detail' && d.controls.find((c) => c.kind === 'grid' && c.name === g.name);
    if (declared && hidden(declared.group)) continue;
    if (g.groups && g.groups.length > 1) lists.append(groupFilter(screen, g));
    if (g.filters && g.filters.length) lists.append(quickFilter(screen, g));
    if (declared && declared.caption) {
      const heading = document.createElement('h3');
      heading.className = 'grid-caption';
      heading.textContent = declared.caption;
      lists.append(heading);
    }
    const holder = document.createElement('div');
    holder.className = 'grid';
    holder.dataset.grid = g.name;
    lists.append(holder);
    const footer = document.createElement('div');
    footer.className = 'footer';
    lists.append(footer);
    const callbacks = {
      onOpen: () => {
        const open = d.commands.find((c) => c.id === 102 && c.enabled);
        if (open) execute(screen, 102);
      },
      onTotal: (total) => (footer.textContent = `Записи: ${total.toLocaleString('bg-BG')}`),
      // 404: the screen closed while its rows were on their way.
      onError: (e) => e.status !== 404 && reportError(e),
      onWrite: track,
    };
    if (d.kind === 'detail' && g.editable) callbacks.onCurrent = (key) => chooseRow(screen, g.name, key);
    const grid =
      d.kind === 'detail' && g.editable
        ? new RowsTable(holder, connection, d, g, callbacks)
        : new ListGrid(holder, connection, d, g, callbacks);
    screen.grids.push(grid);
  }
  if (trees.length) {
    const nodeForm = document.createElement('form');
    nodeForm.className = 'detail node-controls';
    nodeForm.addEventListener('submit', (e) => e.preventDefault());
    renderForm(nodeForm, d, send, ofNode);
    if (nodeForm.childElementCount) {
      lists.append(nodeForm);
      screen.nodeForm = nodeForm;
    }
  }
}

// The row the person stands on in a form's grid; the form then shows what
// follows it (a preview of the row).
function chooseRow(screen, grid, row) {
  return track(
    connection
      .post(`/api/screens/${screen.description.id}/current`, { grid, row })
      .then(() => refreshForm(screen))
      .catch(reportError),
  );
}

// A file a screen wrote for the person: fetched once and saved by the browser.
async function download(file) {
  try {
    const response = await fetch(`/api/downloads/${encodeURIComponent(file.token)}`, {
      headers: { 'X-Pelta-Session': connection.session },
      credentials: 'same-origin',
    });
    if (!response.ok) throw new ApiError(response.status, response.statusText);
    const url = URL.createObjectURL(await response.blob());
    const a = document.createElement('a');
    a.href = url;
    a.download = file.name;
    a.hidden = true;
    document.body.append(a);
    a.click();
    a.remove();
    setTimeout(() => URL.revokeObjectURL(url), 60000);
    status(`Запазен файл ${file.name}`);
  } catch (e) {
    reportError(e);
  }
}

// The groups of a grouped list ("(Всички)" first); the server filters.
function groupFilter(screen, g) {
  const label = document.createElement('label');
  label.className = 'group-filter';
  const column = g.columns.find((c) => c.key === g.groupColumn);
  label.append(`${column ? column.caption : g.groupColumn}: `);
  const select = document.createElement('select');
  select.name = 'group';
  for (const value of g.groups) select.append(new Option(value, value));
  select.value = g.group;
  select.addEventListener('change', async () => {
    try {
      await connection.post(`/api/screens/${screen.description.id}/group`, { grid: g.name, value: select.value });
      for (const grid of screen.grids) if (grid.name === g.name) grid.refresh();
    } catch (e) {
      reportError(e);
    }
  });
  label.append(select);
  return label;
}

// The grid's quick filter: a field per typed filter and the list's hint.
// Enter (or leaving the field) applies the text on the server.
function quickFilter(screen, g) {
  const bar = document.createElement('div');
  bar.className = 'quick-filter';
  bar.dataset.grid = g.name;
  for (const [i, f] of g.filters.entries()) {
    const label = document.createElement('label');
    const caption = document.createElement('span');
    caption.className = 'caption';
    caption.textContent = f.caption;
    const input = document.createElement('input');
    input.type = 'search';
    input.name = `filter-${f.id}`;
    input.value = f.text;
    if (i === 0 && g.filterHint) input.title = g.filterHint; // also shown beside the fields
    input.setAttribute('aria-label', f.caption);
    let applied = f.text;
    const apply = async () => {
      const text = input.value;
      if (text === applied) return;
      applied = text;
      try {
        await connection.post(`/api/screens/${screen.description.id}/filter`, { grid: g.name, field: f.id, text });
        for (const grid of screen.grids) if (grid.name === g.name) grid.refresh();
      } catch (e) {
        reportError(e);
      }
    };
    input.addEventListener('keydown', (e) => {
      if (e.key === 'Enter') {
        e.preventDefault();
        apply();
      }
    });
    input.addEventListener('change', apply);
    label.append(caption, input);
    bar.append(label);
  }
  if (g.filterHint) {
    const hint = document.createElement('small');
    hint.className = 'hint';
    hint.textContent = g.filterHint;
    bar.append(hint);
  }
  return bar;
}

function activate(id) {
  active = id;
  for (const [sid, s] of screens) {
    const on = sid === id;
    s.tab.classList.toggle('active', on);
    s.tab.setAttribute('aria-selected', String(on));
    s.view.hidden = !on;
  }
}

const loading = new Map(); // id -> promise of showScreen, so that a screen is drawn once at a time

// Draws a screen anew; `bringForward` for a screen opened (not one that only changed).
function showScreen(id, bringForward = true) {
  const prior = loading.get(id) ?? Promise.resolve();
  const next = prior.then(() => drawScreen(id, bringForward));
  loading.set(id, next);
  next.finally(() => {
    if (loading.get(id) === next) loading.delete(id);
  });
  return next;
}

async function drawScreen(id, bringForward) {
  let description;
  try {
    description = await connection.get(`/api/screens/${id}`);
  } catch (e) {
    if (e.status !== 404) reportError(e);
    return;
  }
  let screen = screens.get(id);
  if (!screen) {
    const tab = document.createElement('button');
    tab.className = 'tab';
    tab.setAttribute('role', 'tab');
    tab.dataset.screen = String(id);
    const caption = document.createElement('span');
    caption.className = 'tab-caption';
    tab.append(caption);
    tab.addEventListener('click', () => activate(id));
    $('tabs').append(tab);
    const view = document.createElement('section');
    view.className = 'screen';
    view.dataset.screen = String(id);
    $('screens').append(view);
    screen = { description, tab, view, grids: [], attributes: [], form: null };
    screens.set(id, screen);
  }
  const isNew = !screen.drawn;
  const typing = screen.drawn ? typedField(screen) : null;
  screen.description = description;
  render(screen);
  if (typing) keepTyping(screen, typing);
  screen.drawn = true;
  if (bringForward || isNew) activate(id);
  else screen.view.hidden = active !== id;
}

// The field of the screen the person is typing in, when its text is no
// longer what the server held (not sent yet: a field sends when it is left).
function typedField(screen) {
  const el = document.activeElement;
  if (!(el instanceof HTMLElement) || !screen.view.contains(el) || !el.dataset.control) return null;
  if (!(el instanceof HTMLInputElement || el instanceof HTMLTextAreaElement) || el.type === 'checkbox') return null;
  const control = screen.description.controls.find((c) => c.name === el.dataset.control);
  const held = control?.value === null || control?.value === undefined ? '' : String(control.value);
  return control && el.value !== held ? { name: control.name, value: el.value } : null;
}

// A redraw keeps what the person was typing: the new field takes it, keeps
// the focus, and the text is sent as leaving the field would send it.
function keepTyping(screen, typing) {
  const el = screen.view.querySelector(`[data-control="${CSS.escape(typing.name)}"]`);
  const control = screen.description.controls.find((c) => c.name === typing.name);
  if (!el || !control || control.readOnly || !('value' in el)) return;
  el.value = typing.value;
  el.focus();
  track(
    connection
      .post(`/api/screens/${screen.description.id}/values`, { control: control.name, value: valueOf(el, control) })
      .catch(reportError),
  );
}

function removeScreen(id) {
  const s = screens.get(id);
  if (!s) return;
  for (const g of s.grids) g.destroy();
  s.tab.remove();
  s.view.remove();
  screens.delete(id);
  if (active === id) activate(screens.size ? [...screens.keys()].at(-1) : null);
}

async function closeScreen(id) {
  try {
    const reply = await connection.del(`/api/screens/${id}`);
    if (reply.closed) removeScreen(id);
  } catch (e) {
    reportError(e);
  }
}

async function openList(entry) {
  try {
    const d = await connection.post('/api/lists', { id: entry.id });
    if (!screens.has(d.id) && !loading.has(d.id)) await showScreen(d.id);
    else activate(d.id);
  } catch (e) {
    reportError(e);
  }
}

// ---- start ---------------------------------------------------------------------

async function loadNavigation() {
  const { lists } = await connection.get('/api/navigation');
  const ul = $('lists');
  ul.replaceChildren();
  for (const entry of lists) {
    const li = document.createElement('li');
    const a = document.createElement('a');
    a.href = '#';
    a.textContent = entry.caption;
    a.dataset.list = entry.id;
    if (!entry.available) a.classList.add('unavailable');
    a.addEventListener('click', (e) => {
      e.preventDefault();
      openList(entry);
    });
    li.append(a);
    ul.append(li);
  }
}

function listen() {
  connection.listen({
    dialog: (d) => dialogs.show(d),
    'dialog-closed': (d) => dialogs.closed(d.id),
    download: (f) => download(f),
    screen: (e) => {
      if (e.change === 'closed') removeScreen(e.screen);
      else if (e.change === 'opened' && (screens.has(e.screen) || loading.has(e.screen))) activate(e.screen);
      else showScreen(e.screen, e.change === 'opened');
    },
    refresh: (e) => {
      const s = screens.get(e.screen);
      for (const g of s ? s.grids : []) if (!e.grid || g.name === e.grid) g.refresh();
    },
    closed: () => {
      status('Сесията е приключила');
      connection.events.close();
    },
    error: () => status(connection.events.readyState === 2 ? 'Няма връзка' : 'Свързване...'),
  });
  connection.events.onopen = () => status('');
}

async function start(user, password) {
  await connection.start(user, password);
  connection.closeOnExit();
  listen();
  await loadNavigation();
  document.body.dataset.ready = 'true';
}

async function main() {
  const info = await connection.request('GET', '/api/info', undefined, false);
  document.title = 'Pelta';
  if (!info.login) {
    await start();
    return;
  }
  const login = $('login');
  login.hidden = false;
  $('login-form').addEventListener('submit', async (e) => {
    e.preventDefault();
    try {
      const data = new FormData(e.target);
      await start(data.get('user'), data.get('password'));
      login.hidden = true;
    } catch (err) {
      $('login-error').textContent = err.status === 401 ? 'Грешно име или парола' : err.message;
    }
  });
}

main().catch(reportError);
