// A list's grid: ag-grid's infinite row model asks the server for the block of
// rows in view, in the order of the clicked column headers. Only visible rows
// (and a small look-ahead) travel, so a million rows scroll like a hundred.
import { AllCommunityModule, ModuleRegistry, createGrid } from 'ag-grid-community';

ModuleRegistry.registerModules([AllCommunityModule]);

const BLOCK = 100;

const ISO_DATE = /^(\d{4})-(\d{2})-(\d{2})(?:T(\d{2}:\d{2}:\d{2}))?$/;

// Dates as dd.mm.yyyy, check marks as ✔, combo keys as the text offered.
function cellFormatter(column) {
  const options = new Map((column.options ?? []).map((o) => [o.key, o.text]));
  return (p) => {
    const v = p.value;
    if (v === null || v === undefined) return '';
    if (v === true) return '✔';
    if (v === false) return '';
    if (options.has(v)) return options.get(v);
    if (typeof v === 'string') {
      const m = v.match(ISO_DATE);
      if (m) return `${m[3]}.${m[2]}.${m[1]}${m[4] ? ' ' + m[4] : ''}`;
    }
    return String(v);
  };
}

const WIDEST = 320; // px a column takes at most when fitted to its texts

export class ListGrid {
  // `screen` is the screen description; `grid` one of its grids.
  constructor(element, connection, screen, grid, callbacks = {}) {
    this.connection = connection;
    this.screenId = screen.id;
    this.name = grid.name;
    this.total = grid.rowCount;
    this.callbacks = callbacks;
    this.element = element;
    this.fixedWidths = grid.columns.filter((c) => c.width > 0).map((c) => c.key);
    const columns = grid.columns.map((c, i) => ({
      colId: c.key,
      headerName: c.caption || c.key,
      hide: !c.visible,
      width: c.width > 0 ? c.width : undefined,
      minWidth: 48,
      sortable: true,
      valueGetter: (p) => (p.data ? p.data.cells[i] : undefined),
      valueFormatter: cellFormatter(c),
      type: c.editor === 'number' ? 'rightAligned' : undefined,
    }));
    this.api = createGrid(element, {
      columnDefs: columns,
      rowModelType: 'infinite',
      cacheBlockSize: BLOCK,
      maxBlocksInCache: 50,
      infiniteInitialRowCount: Math.min(this.total, BLOCK),
      rowBuffer: 10,
      getRowId: (p) => p.data.key,
      rowSelection: { mode: 'multiRow', checkboxes: false, headerCheckbox: false, enableClickSelection: true },
      datasource: { getRows: (params) => this.load(params) },
      onRowDoubleClicked: () => this.callbacks.onOpen?.(),
      // The current row stays current while the focus is on a toolbar button.
      onCellFocused: (e) => this.remember(e.rowIndex),
      onRowClicked: (e) => this.remember(e.rowIndex),
      // Once the first rows arrived, columns take the width of their texts;
      // the rows fill the grid when that leaves room, else scroll sideways.
      onFirstDataRendered: () => this.fit(),
      overlayNoRowsTemplate: '<span>Няма записи</span>',
    });
  }

  async load(params) {
    const sort = params.sortModel.map((s) => `${s.colId}:${s.sort}`).join(',');
    const count = params.endRow - params.startRow;
    const query = new URLSearchParams({ grid: this.name, offset: params.startRow, count });
    if (sort) query.set('sort', sort);
    try {
      const page = await this.connection.get(`/api/screens/${this.screenId}/rows?${query}`);
      this.total = page.total;
      params.successCallback(page.rows, page.total);
      this.callbacks.onTotal?.(page.total);
    } catch (e) {
      params.failCallback();
      this.callbacks.onError?.(e);
    }
  }

  fit() {
    const fixed = new Set(this.fixedWidths);
    const columns = this.api.getAllDisplayedColumns().filter((c) => !fixed.has(c.getColId()));
    if (!columns.length) return;
    this.api.autoSizeColumns(columns);
    const wide = columns.filter((c) => c.getActualWidth() > WIDEST);
    if (wide.length) this.api.setColumnWidths(wide.map((c) => ({ key: c, newWidth: WIDEST })));
    const total = this.api.getAllDisplayedColumns().reduce((sum, c) => sum + c.getActualWidth(), 0);
    if (total < this.element.clientWidth - 20) this.api.sizeColumnsToFit();
  }

  remember(rowIndex) {
    if (rowIndex === null || rowIndex === undefined) return;
    const node = this.api.getDisplayedRowAtIndex(rowIndex);
    if (node && node.data) this.current = node.data.key;
    this.callbacks.onCurrent?.(this.current);
  }

  // The key of the current row (the framework's current row); '' when none.
  currentKey() {
    const cell = this.api.getFocusedCell();
    if (cell) this.remember(cell.rowIndex);
    return this.current ?? '';
  }

  selectedKeys() {
    return this.api.getSelectedRows().map((r) => r.key);
  }

  refresh() {
    this.current = undefined;
    this.api.deselectAll();
    this.api.refreshInfiniteCache();
  }

  focus() {
    const cell = this.api.getFocusedCell();
    const first = this.api.getColumns()?.find((c) => c.isVisible());
    if (first) this.api.setFocusedCell(cell ? cell.rowIndex : 0, cell ? cell.column : first);
  }

  destroy() {
    this.api.destroy();
  }
}
