// Message boxes, questions, input boxes and messages at a control, shown as
// modal dialogs. The server's screen waits until the answer is posted.

const BUTTON_TEXT = {
  1: 'OK',
  2: 'Отказ',
  3: 'Прекрати',
  4: 'Опитай пак',
  5: 'Пропусни',
  6: 'Да',
  7: 'Не',
};
const ICONS = { critical: '⛔', question: '❓', exclamation: '⚠️', information: 'ℹ️' };

export class Dialogs {
  constructor(element, connection, onShown) {
    this.element = element;
    this.connection = connection;
    this.onShown = onShown;
    this.queue = [];
    this.current = null;
    // Escape closes a dialog as its Cancel (or No) button would.
    element.addEventListener('cancel', (e) => {
      e.preventDefault();
      if (!this.current) return;
      const b = this.current.buttons;
      const dismiss = b.includes(2) ? 2 : b.includes(7) ? 7 : b.length === 1 ? b[0] : null;
      if (dismiss !== null) this.answer(dismiss);
    });
  }

  get open() {
    return this.current !== null;
  }

  // A dialog the server posted.
  show(dialog) {
    if (this.current && this.current.id === dialog.id) return;
    if (this.queue.some((d) => d.id === dialog.id)) return;
    this.queue.push(dialog);
    if (!this.current) this.next();
  }

  // The server says the dialog is over (answered here or elsewhere, or the session ended).
  closed(id) {
    this.queue = this.queue.filter((d) => d.id !== id);
    if (this.current && this.current.id === id) this.finish();
  }

  // A dialog of the page itself (an error of a request), answered locally.
  local(text, caption = 'Pelta') {
    this.show({ id: `local-${Date.now()}-${Math.random()}`, kind: 'message', text, caption,
      details: '', icon: 'critical', buttons: [1], defaultButton: 1, local: true });
  }

  next() {
    const d = this.queue.shift();
    if (!d) return;
    this.current = d;
    const el = this.element;
    el.replaceChildren();
    el.dataset.kind = d.kind;
    el.dataset.dialogId = String(d.id);
    if (d.kind === 'selector' && this.selector) {
      this.selector.show(d, el, (button, body) => this.answer(button, body));
      this.onShown?.(d);
      return;
    }

    const form = document.createElement('form');
    form.method = 'dialog';
    if (d.caption) {
      const h = document.createElement('h3');
      h.textContent = d.caption;
      form.append(h);
    }
    const body = document.createElement('div');
    body.className = 'dialog-body';
    if (ICONS[d.icon]) {
      const icon = document.createElement('span');
      icon.className = 'dialog-icon';
      icon.textContent = ICONS[d.icon];
      body.append(icon);
    }
    const text = document.createElement('p');
    text.className = 'dialog-text';
    text.textContent = d.text;
    body.append(text);
    form.append(body);
    if (d.hint) {
      const hint = document.createElement('p');
      hint.className = 'dialog-hint';
      hint.textContent = d.hint;
      form.append(hint);
    }
    let input = null;
    if (d.kind === 'input') {
      input = document.createElement('input');
      input.type = 'text';
      input.name = 'value';
      input.value = d.value ?? '';
      form.append(input);
    }
    if (d.details) {
      const details = document.createElement('details');
      const summary = document.createElement('summary');
      summary.textContent = 'Подробности';
      const pre = document.createElement('pre');
      pre.textContent = d.details;
      details.append(summary, pre);
      form.append(details);
    }
    const buttons = document.createElement('div');
    buttons.className = 'dialog-buttons';
    let focus = null;
    for (const id of d.buttons) {
      const b = document.createElement('button');
      b.type = 'button';
      b.value = String(id);
      b.dataset.button = String(id);
      b.textContent = BUTTON_TEXT[id] ?? String(id);
      b.addEventListener('click', () => this.answer(id));
      if (id === d.defaultButton) focus = b;
      buttons.append(b);
    }
    form.append(buttons);
    form.addEventListener('submit', (e) => {
      e.preventDefault();
      this.answer(d.defaultButton ?? d.buttons[0]);
    });
    el.append(form);
    el.showModal();
    (input ?? focus)?.focus();
    if (input) input.select();
    this.onShown?.(d);
  }

  // `extra` goes with the answer (a selector's chosen rows).
  async answer(button, extra = {}) {
    const d = this.current;
    if (!d || d.answering) return;
    d.answering = true;
    const value = this.element.querySelector('input[name=value]')?.value;
    if (d.local) {
      this.finish();
      return;
    }
    try {
      const body = { ...extra, button };
      if (d.kind === 'input') body.value = value ?? '';
      await this.connection.post(`/api/dialog/${d.id}`, body);
    } catch (e) {
      // 404: the server no longer waits for it (the session ended); close it anyway.
      if (e.status !== 404) {
        d.answering = false;
        return;
      }
    }
    if (this.current === d) this.finish();
  }

  finish() {
    const d = this.current;
    this.current = null;
    if (d && d.kind === 'selector') this.selector?.hide();
    this.element.close();
    this.element.replaceChildren();
    if (d && d.kind === 'notice' && d.control) {
      document.querySelector(`[data-control="${CSS.escape(d.control)}"]`)?.focus();
    }
    this.next();
  }
}
