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

function valueOf(el, control) {
  if (control.kind === 'check') return el.checked;
  if (el.value === '' && (control.kind === 'number' || control.kind === 'date')) return null;
  return el.value;
}

// Fills `element` with the form; `send(control, value)` posts a change.
export function renderForm(element, screen, send) {
  element.replaceChildren();
  const groups = new Map();
  for (const c of screen.controls) {
    if (['grid', 'tree', 'tabstrip', 'splitter', 'button'].includes(c.kind)) continue;
    const group = c.group || '';
    if (!groups.has(group)) groups.set(group, []);
    groups.get(group).push(c);
  }
  for (const [name, controls] of groups) {
    const fieldset = document.createElement('fieldset');
    if (name) {
      const legend = document.createElement('legend');
      legend.textContent = name;
      fieldset.append(legend);
    }
    for (const c of controls) {
      const row = document.createElement('label');
      row.className = `field field-${c.kind}`;
      const caption = document.createElement('span');
      caption.className = 'caption';
      caption.textContent = c.caption || c.name;
      const input = inputFor(c);
      input.dataset.control = c.name;
      input.name = c.name;
      input.addEventListener('change', () => send(c, valueOf(input, c)));
      row.append(caption, input);
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
