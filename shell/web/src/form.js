// A detail form drawn from its declared controls: text, number, date, check
// box, combo and note fields grouped as declared, and its grids below them.
// A changed field is sent to the server at once; the framework holds the values.

function inputFor(control) {
  let el;
  switch (control.kind) {
    case 'check':
      el = document.createElement('input');
      el.type = 'checkbox';
      el.checked = control.value === true;
      break;
    case 'date':
      el = document.createElement('input');
      el.type = 'date';
      el.value = typeof control.value === 'string' ? control.value.slice(0, 10) : '';
      break;
    case 'combo':
    case 'selector': {
      el = document.createElement('select');
      const empty = document.createElement('option');
      empty.value = '';
      empty.textContent = control.prompt || '';
      el.append(empty);
      for (const o of control.options) {
        const opt = document.createElement('option');
        opt.value = o.key;
        opt.textContent = o.text;
        el.append(opt);
      }
      el.value = control.value ?? '';
      break;
    }
    case 'note':
    case 'rich':
      el = document.createElement('textarea');
      el.rows = 4;
      el.value = control.value ?? '';
      break;
    case 'label':
      el = document.createElement('span');
      el.textContent = control.value ?? '';
      return el;
    case 'picture':
      el = document.createElement('img');
      el.alt = control.caption || '';
      setPicture(el, control.value);
      return el;
    default:
      el = document.createElement('input');
      el.type = 'text';
      if (control.kind === 'number') el.inputMode = 'decimal';
      el.value = control.value === null || control.value === undefined ? '' : String(control.value);
  }
  const placeholder = control.prompt || control.hint;
  if (placeholder && 'placeholder' in el) el.placeholder = placeholder;
  el.disabled = control.readOnly;
  return el;
}

// A picture's value is an SVG document, shown as an image from a data: URL,
// where it can run nothing and load nothing; anything else shows no image.
export function setPicture(img, value) {
  const svg = typeof value === 'string' && value.startsWith('<svg') ? value : '';
  if (img.dataset.svg === svg) return;
  img.dataset.svg = svg;
  if (svg) img.src = `data:image/svg+xml;charset=utf-8,${encodeURIComponent(svg)}`;
  else img.removeAttribute('src');
  img.hidden = !svg;
}

export function valueOf(el, control) {
  if (control.kind === 'check') return el.checked;
  if (el.value === '' && (control.kind === 'number' || control.kind === 'date')) return null;
  return el.value;
}

// A form's tree owns the controls whose group is the key of one of its
// nodes: they are shown while that node is the selected one. Answers whether
// a control of `group` is hidden now.
export function hiddenByTree(screen) {
  const nodes = new Set();
  const selected = new Set();
  for (const t of screen.trees ?? []) {
    for (const n of t.nodes) nodes.add(n.key);
    if (t.selected) selected.add(t.selected);
  }
  return (group) => Boolean(group) && nodes.has(group) && !selected.has(group);
}

function nodeTexts(screen) {
  const texts = new Map();
  for (const t of screen.trees ?? []) for (const n of t.nodes) texts.set(n.key, n.text);
  return texts;
}

// The keys of the nodes of the form's trees.
export function nodeKeys(screen) {
  const keys = new Set();
  for (const t of screen.trees ?? []) for (const n of t.nodes) keys.add(n.key);
  return keys;
}

// Fills `element` with the form's controls that `include` takes (all by
// default); `send(control, value)` posts a change.
export function renderForm(element, screen, send, include = () => true) {
  element.replaceChildren();
  const hidden = hiddenByTree(screen);
  const legends = nodeTexts(screen);
  const groups = new Map();
  for (const c of screen.controls) {
    if (['grid', 'tree', 'tabstrip', 'splitter', 'button'].includes(c.kind)) continue;
    if (hidden(c.group) || !include(c)) continue;
    const group = c.group || '';
    if (!groups.has(group)) groups.set(group, []);
    groups.get(group).push(c);
  }
  for (const [name, controls] of groups) {
    const fieldset = document.createElement('fieldset');
    if (name) {
      const legend = document.createElement('legend');
      legend.textContent = legends.get(name) ?? name;
      fieldset.append(legend);
    }
    for (const c of controls) {
      const shownOnly = c.kind === 'picture' || c.kind === 'label';
      const row = document.createElement(shownOnly ? 'div' : 'label');
      row.className = `field field-${c.kind}`;
      const input = inputFor(c);
      input.dataset.control = c.name;
      if (!shownOnly) {
        input.name = c.name;
        input.addEventListener('change', () => send(c, valueOf(input, c)));
      }
      // A picture or a text shown without a caption takes the whole row.
      if (c.caption || !shownOnly) {
        const caption = document.createElement('span');
        caption.className = 'caption';
        caption.textContent = c.caption || c.name;
        row.append(caption);
      } else {
        row.classList.add('uncaptioned');
      }
      row.append(input);
      if (c.hint && c.prompt) {
        const hint = document.createElement('small');
        hint.className = 'hint';
        hint.textContent = c.hint;
        row.append(hint);
      }
      fieldset.append(row);
    }
    element.append(fieldset);
  }
}

// The form's fields take the values the server holds now (an event of the
// screen may have changed them); the field the person is in keeps what is typed.
export function updateForm(element, screen) {
  for (const c of screen.controls) {
    const input = element.querySelector(`[data-control="${CSS.escape(c.name)}"]`);
    if (!input || input === document.activeElement) continue;
    if (c.kind === 'check') input.checked = c.value === true;
    else if (c.kind === 'date') input.value = typeof c.value === 'string' ? c.value.slice(0, 10) : '';
    else if (c.kind === 'label') input.textContent = c.value ?? '';
    else if (c.kind === 'picture') setPicture(input, c.value);
    else input.value = c.value === null || c.value === undefined ? '' : String(c.value);
  }
}

// ---- help texts ------------------------------------------------------------------

// A help text as nodes: "[b]...[/b]" in bold, everything else as plain text.
export function helpNodes(text) {
  const out = [];
  const bold = /\[b\]([\s\S]*?)\[\/b\]/g;
  let at = 0;
  for (let m = bold.exec(text); m; m = bold.exec(text)) {
    if (m.index > at) out.push(document.createTextNode(text.slice(at, m.index)));
    const strong = document.createElement('strong');
    strong.textContent = m[1];
    out.push(strong);
    at = m.index + m[0].length;
  }
  if (at < text.length) out.push(document.createTextNode(text.slice(at)));
  return out;
}

// ---- attribute grids ---------------------------------------------------------------

function plain(value) {
  return value === null || value === undefined ? '' : String(value);
}

// The options of a tree list, parents before their children, indented by depth.
function treeOrder(options) {
  const children = new Map();
  const keys = new Set(options.map((o) => o.key));
  for (const o of options) {
    const parent = o.parent && keys.has(o.parent) ? o.parent : '';
    if (!children.has(parent)) children.set(parent, []);
    children.get(parent).push(o);
  }
  const out = [];
  const seen = new Set();
  const walk = (parent, depth) => {
    for (const o of children.get(parent) ?? []) {
      if (seen.has(o.key)) continue; // a cycle in the data
      seen.add(o.key);
      out.push({ ...o, depth });
      walk(o.key, depth + 1);
    }
  };
  walk('', 0);
  return out;
}

// An attribute grid: a table "Име" / "Стойност" with a heading row per
// group, an editor per row by its kind, and the chosen row's help text under
// it. `actions` posts: set(field, value) -> Promise<bool>, button(field),
// select(field).
export class AttributeGrid {
  constructor(info, actions) {
    this.actions = actions;
    this.element = document.createElement('section');
    this.element.className = 'attributes';
    this.element.dataset.attributes = info.name;
    this.render(info);
  }

  get name() {
    return this.info.name;
  }

  // The shape of the grid: rows and what the lists offer. Values may change
  // in place; a new shape draws the grid anew.
  static shape(info) {
    return JSON.stringify(info.rows.map((r) => [r.field, r.editor, r.options]));
  }

  render(info) {
    this.info = info;
    this.selected = info.selected;
    const table = document.createElement('table');
    table.className = 'attrib-grid';
    const head = table.createTHead().insertRow();
    for (const caption of ['Име', 'Стойност']) {
      const th = document.createElement('th');
      th.textContent = caption;
      head.append(th);
    }
    const body = table.createTBody();
    const groups = [...info.groups];
    for (const r of info.rows)
      if (!groups.some((g) => g.number === r.group)) groups.push({ number: r.group, caption: '' });
    for (const g of groups) {
      const rows = info.rows.filter((r) => r.group === g.number);
      if (!rows.length) continue;
      const heading = body.insertRow();
      heading.className = 'attrib-group';
      const th = document.createElement('th');
      th.colSpan = 2;
      th.textContent = g.caption;
      heading.append(th);
      for (const r of rows) body.append(this.row(r));
    }
    this.help = document.createElement('div');
    this.help.className = 'attrib-help';
    this.help.setAttribute('aria-live', 'polite');
    this.element.replaceChildren(table, this.help);
    this.showSelected();
  }

  row(r) {
    const tr = document.createElement('tr');
    tr.dataset.field = r.field;
    if (r.style) tr.dataset.style = r.style;
    const caption = document.createElement('td');
    caption.className = 'attrib-caption';
    caption.textContent = r.caption;
    const cell = document.createElement('td');
    cell.className = 'attrib-value';
    cell.append(this.editor(r));
    tr.append(caption, cell);
    tr.addEventListener('focusin', () => this.choose(r.field));
    tr.addEventListener('click', () => this.choose(r.field));
    return tr;
  }

  editor(r) {
    let el;
    switch (r.editor) {
      case 'check':
        el = document.createElement('input');
        el.type = 'checkbox';
        el.checked = r.value === true;
        el.addEventListener('change', () => this.commit(r.field, el.checked));
        break;
      case 'list':
      case 'treelist':
      case 'fixedlist': {
        el = document.createElement('select');
        if (r.editor !== 'fixedlist') el.append(new Option('', ''));
        const options = r.editor === 'treelist' ? treeOrder(r.options) : r.options;
        for (const o of options) {
          const opt = new Option(o.text, o.key);
          if (o.depth) opt.textContent = '\u00a0\u00a0\u00a0'.repeat(o.depth) + o.text;
          el.append(opt);
        }
        this.setSelect(el, r);
        el.addEventListener('change', () => this.commit(r.field, el.value === '' ? null : el.value));
        break;
      }
      case 'selector': {
        el = document.createElement('span');
        el.className = 'attrib-selector';
        const shown = document.createElement('span');
        shown.className = 'attrib-shown';
        shown.textContent = r.text;
        const button = document.createElement('button');
        button.type = 'button';
        button.textContent = '…';
        button.title = r.caption;
        button.addEventListener('click', () => this.actions.button(r.field));
        el.append(shown, button);
        el.dataset.editor = 'selector';
        return this.named(el, r, button);
      }
      default:
        el = document.createElement('input');
        el.type = r.editor === 'date' ? 'date' : 'text';
        if (r.editor === 'number') el.inputMode = 'decimal';
        this.setEntry(el, r);
        // A number shows in its format and is edited as it is held.
        el.addEventListener('focus', () => {
          if (r.editor === 'number' && el.value !== el.dataset.raw) {
            el.value = el.dataset.raw;
            el.select(); // as a grid's cell: what is typed replaces the value
          }
          el.dataset.start = el.value;
        });
        el.addEventListener('keydown', (e) => {
          if (e.key !== 'Enter') return;
          e.preventDefault();
          this.commitEntry(el, r.field);
        });
        el.addEventListener('blur', () => {
          if (!this.commitEntry(el, r.field) && r.editor === 'number') el.value = el.dataset.shown ?? el.value;
        });
    }
    return this.named(el, r, el);
  }

  named(el, r, focusable) {
    el.dataset.attribute = r.field;
    focusable.name = r.field;
    focusable.setAttribute('aria-label', r.caption);
    return el;
  }

  setSelect(select, r) {
    const value = plain(r.value);
    if (value !== '' && ![...select.options].some((o) => o.value === value))
      select.append(new Option(r.text || value, value)); // held but not offered
    select.value = value;
  }

  setEntry(input, r) {
    const raw = input.type === 'date' ? plain(r.value).slice(0, 10) : plain(r.value);
    input.dataset.raw = raw;
    input.dataset.shown = r.editor === 'number' ? r.text : raw;
    input.value = input.dataset.shown;
  }

  // Sends an entry's text when it changed since the person came in; true when sent.
  commitEntry(input, field) {
    if (input.value === input.dataset.start) return false;
    input.dataset.start = input.value;
    this.commit(field, input.value === '' ? null : input.value);
    return true;
  }

  commit(field, value) {
    this.actions.set(field, value);
  }

  choose(field) {
    if (this.selected === field) return;
    this.selected = field;
    this.showSelected();
    this.actions.select(field);
  }

  showSelected() {
    const row = this.info.rows.find((r) => r.field === this.selected);
    for (const tr of this.element.querySelectorAll('tr[data-field]'))
      tr.classList.toggle('selected', tr.dataset.field === this.selected);
    this.help.replaceChildren(...helpNodes(row ? row.help : ''));
  }

  // The values the server holds now. `force`: a field whose editor takes the
  // server's value even while the person is in it (a refused entry).
  update(info, force = '') {
    if (AttributeGrid.shape(info) !== AttributeGrid.shape(this.info)) {
      const focused = document.activeElement?.closest?.('[data-attribute]')?.dataset.attribute;
      this.render(info);
      if (focused) this.element.querySelector(`[name="${CSS.escape(focused)}"]`)?.focus();
      return;
    }
    this.info = info;
    for (const r of info.rows) {
      const tr = this.element.querySelector(`tr[data-field="${CSS.escape(r.field)}"]`);
      if (!tr) continue;
      if (r.style) tr.dataset.style = r.style;
      else delete tr.dataset.style;
      const el = tr.querySelector('[data-attribute]');
      const typing = el === document.activeElement && r.field !== force;
      if (el.dataset.editor === 'selector') el.querySelector('.attrib-shown').textContent = r.text;
      else if (typing) {
        // What the person types stays; the texts to show when they leave follow the server.
        if (el.tagName === 'INPUT' && el.type !== 'checkbox') {
          const kept = el.value;
          this.setEntry(el, r);
          el.value = kept;
        }
      } else if (r.editor === 'check') el.checked = r.value === true;
      else if (el.tagName === 'SELECT') this.setSelect(el, r);
      else {
        this.setEntry(el, r);
        if (el === document.activeElement) {
          el.value = el.dataset.raw;
          el.dataset.start = el.value;
        }
      }
    }
    this.showSelected();
  }
}

// ---- trees -----------------------------------------------------------------------

// A form's tree as a clickable nested list; `activate(key)` posts a click.
export function renderTree(tree, activate) {
  const nav = document.createElement('nav');
  nav.className = 'form-tree';
  nav.dataset.tree = tree.name;
  const children = new Map();
  const keys = new Set(tree.nodes.map((n) => n.key));
  for (const n of tree.nodes) {
    const parent = n.parent && keys.has(n.parent) ? n.parent : '';
    if (!children.has(parent)) children.set(parent, []);
    children.get(parent).push(n);
  }
  const list = (parent, depth) => {
    const ul = document.createElement('ul');
    ul.setAttribute('role', depth ? 'group' : 'tree');
    for (const n of children.get(parent) ?? []) {
      const li = document.createElement('li');
      li.setAttribute('role', 'treeitem');
      li.setAttribute('aria-selected', String(n.key === tree.selected));
      const button = document.createElement('button');
      button.type = 'button';
      button.dataset.node = n.key;
      button.textContent = n.text || '\u00a0';
      if (n.key === tree.selected) button.classList.add('selected');
      button.addEventListener('click', () => activate(n.key));
      li.append(button);
      if (depth < 32 && children.has(n.key)) li.append(list(n.key, depth + 1));
      ul.append(li);
    }
    return ul;
  };
  nav.append(list('', 0));
  return nav;
}
