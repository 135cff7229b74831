// A selector: a list shown in a modal dialog for choosing rows, while the
// screen that asked waits on the server. The list is drawn as the page draws
// any list (rows paged from the server, the quick filter above them); the
// person stands on or marks rows and chooses ("Избор", a double click or
// Enter), or cancels ("Отказ", Escape).
import { ListGrid } from './grid.js';

const CHOOSE = 1;
const CANCEL = 2;

export class Selector {
  // `quickFilter(screen, grid)` draws a grid's quick filter as lists have it.
  constructor(connection, { quickFilter, onError }) {
    this.connection = connection;
    this.quickFilter = quickFilter;
    this.onError = onError;
    this.grid = null;
    this.shown = null;
  }

  // Draws the dialog `d` into the dialog element; `answer(button, body)` answers it.
  async show(d, element, answer) {
    this.hide();
    const shown = { dialog: d };
    this.shown = shown;
    const form = document.createElement('form');
    form.method = 'dialog';
    form.className = 'selector';
    form.addEventListener('submit', (e) => e.preventDefault());
    const heading = document.createElement('h3');
    heading.textContent = d.caption;
    const holder = document.createElement('div');
    holder.className = 'grid';
    const footer = document.createElement('div');
    footer.className = 'footer';
    const buttons = document.createElement('div');
    buttons.className = 'dialog-buttons';
    const choose = () => {
      if (!this.grid || this.shown !== shown) return;
      answer(CHOOSE, { current: this.grid.currentKey(), selected: this.grid.selectedKeys() });
    };
    for (const [id, text, action] of [
      [CHOOSE, 'Избор', choose],
      [CANCEL, 'Отказ', () => answer(CANCEL)],
    ]) {
      const b = document.createElement('button');
      b.type = 'button';
      b.dataset.button = String(id);
      b.textContent = text;
      b.addEventListener('click', action);
      buttons.append(b);
    }
    form.append(heading, holder, footer, buttons);
    element.replaceChildren(form);
    element.showModal();

    let description;
    try {
      description = await this.connection.get(`/api/screens/${d.screen}`);
    } catch (e) {
      if (this.shown === shown) answer(CANCEL);
      if (e.status !== 404) this.onError?.(e); // 404: the dialog is over already
      return;
    }
    if (this.shown !== shown) return; // answered or closed meanwhile
    const g = description.grids[0];
    if (!g) {
      answer(CANCEL);
      return;
    }
    const screen = { description, grids: [] };
    if (g.filters && g.filters.length) form.insertBefore(this.quickFilter(screen, g), holder);
    this.grid = new ListGrid(holder, this.connection, description, g, {
      onOpen: choose,
      onTotal: (total) => (footer.textContent = `Записи: ${total.toLocaleString('bg-BG')}`),
      // 404: the dialog ended while rows were on their way.
      onError: (e) => e.status !== 404 && this.onError?.(e),
    });
    screen.grids.push(this.grid);
    // Enter on a row chooses it; Enter in the filter applies the filter.
    holder.addEventListener('keydown', (e) => {
      if (e.key !== 'Enter') return;
      e.preventDefault();
      e.stopPropagation();
      choose();
    });
    (form.querySelector('.quick-filter input') ?? buttons.querySelector('button'))?.focus();
  }

  // The dialog is over: the list lets go of its grid.
  hide() {
    this.grid?.destroy();
    this.grid = null;
    this.shown = null;
  }
}
