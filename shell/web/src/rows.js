// An editable grid of a detail form (the rows of a record): a table whose
// cells are fields. A changed cell is sent at once; the framework checks the
// row when the person leaves it or saves. Detail grids hold few rows, so the
// table asks for them all in one page.
const MAX_ROWS = 1000;

function display(value) {
  if (value === null || value === undefined) return '';
  if (value === true) return '✔';
  if (value === false) return '';
  return String(value);
}

export class RowsTable {
  constructor(element, connection, screen, grid, callbacks = {}) {
    this.element = element;
    this.connection = connection;
    this.screenId = screen.id;
    this.name = grid.name;
    this.grid = grid;
    this.callbacks = callbacks;
    this.current = '';
    this.rows = [];
    element.classList.add('rows-table');
    this.load();
  }

  async load() {
    const query = new URLSearchParams({ grid: this.name, offset: 0, count: MAX_ROWS });
    try {
      const page = await this.connection.get(`/api/screens/${this.screenId}/rows?${query}`);
      this.rows = page.rows;
      this.render();
      this.callbacks.onTotal?.(page.total);
    } catch (e) {
      this.callbacks.onError?.(e);
    }
  }

  render() {
    const bar = document.createElement('div');
    bar.className = 'toolbar rows-toolbar';
    const add = document.createElement('button');
    add.type = 'button';
    add.textContent = 'Нов ред';
    add.dataset.action = 'addrow';
    add.addEventListener('click', () => this.addRow());
    bar.append(add);

    const table = document.createElement('table');
    const head = table.createTHead().insertRow();
    const columns = this.grid.columns.map((c, i) => ({ ...c, index: i })).filter((c) => c.visible);
    for (const c of columns) {
      const th = document.createElement('th');
      th.textContent = c.caption; // a column may be shown without a caption
      head.append(th);
    }
    const body = table.createTBody();
    for (const row of this.rows) {
      const tr = body.insertRow();
      tr.dataset.row = row.key;
      if (row.key === this.current) tr.classList.add('current');
      for (const c of columns) {
        const td = tr.insertCell();
        td.dataset.column = c.key;
        td.append(this.cell(row, c));
      }
      tr.addEventListener('focusin', () => this.stand(row.key));
      tr.addEventListener('click', () => this.stand(row.key));
    }
    this.element.replaceChildren(bar, table);
  }

  cell(row, column) {
    const value = row.cells[column.index];
    if (!column.editor) {
      const span = document.createElement('span');
      span.textContent = display(value);
      return span;
    }
    let el;
    if (column.editor === 'combo' || column.editor === 'selector') {
      el = document.createElement('select');
      el.append(new Option('', ''));
      for (const o of column.options) el.append(new Option(o.text, o.key));
      el.value = value ?? '';
    } else if (column.editor === 'check') {
      el = document.createElement('input');
      el.type = 'checkbox';
      el.checked = value === true;
    } else {
      el = document.createElement('input');
      el.type = column.editor === 'date' ? 'date' : 'text';
      if (column.editor === 'number') el.inputMode = 'decimal';
      el.value = value === null || value === undefined ? '' : String(value);
    }
    el.name = column.key;
    el.setAttribute('aria-label', column.caption || column.key);
    el.addEventListener('change', () => {
      const v = column.editor === 'check' ? el.checked : el.value === '' ? null : el.value;
      this.callbacks.onWrite?.(this.edit(row.key, column.key, v));
    });
    return el;
  }

  // The person stands on a row: the screen is told (its preview follows the row).
  stand(key) {
    if (this.current === key) return;
    this.current = key;
    for (const tr of this.element.querySelectorAll('tr[data-row]'))
      tr.classList.toggle('current', tr.dataset.row === key);
    this.callbacks.onCurrent?.(key);
  }

  async edit(row, column, value) {
    try {
      await this.connection.post(`/api/screens/${this.screenId}/cells`, { grid: this.name, row, column, value });
    } catch (e) {
      this.callbacks.onError?.(e);
    }
  }

  async addRow() {
    try {
      const reply = await this.connection.post(`/api/screens/${this.screenId}/addrow`, { grid: this.name });
      if (!reply.added) return; // the row being edited was refused; a message said why
      this.current = reply.key;
      await this.load();
      this.element.querySelector(`tr[data-row="${reply.key}"] select, tr[data-row="${reply.key}"] input`)?.focus();
    } catch (e) {
      this.callbacks.onError?.(e);
    }
  }

  currentKey() {
    return this.current;
  }

  selectedKeys() {
    return this.current ? [this.current] : [];
  }

  refresh() {
    this.load();
  }

  focus() {
    this.element.querySelector('select, input')?.focus();
  }

  destroy() {}
}
