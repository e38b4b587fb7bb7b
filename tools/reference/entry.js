// --- Entries, and what there is none of: the right-hand side of the page ------------------------------------

// --- Elements -----------------------------------------------------------------------------------------

const $ = (id) => document.getElementById(id);

function element(tag, attributes, ...children) {
  const made = document.createElement(tag);
  for (const [name, value] of Object.entries(attributes || {})) made.setAttribute(name, value);
  made.append(...children.flat().filter((child) => child !== null));
  return made;
}

// Text with `names` in it.
function prose(text) {
  return text.split('`').map((part, i) => (i % 2 ? element('code', null, part) : part));
}

// --- An entry -----------------------------------------------------------------------------------------

function section(title, ...children) {
  return [element('h3', null, title), ...children.flat().filter((child) => child !== null)];
}

function tags(entry) {
  const family = data.families[entry.family][1];
  return element('p', {class: 'tags'}, element('span', null, family), Object.entries(TRAITS)
    .filter(([trait]) => entry.traits.has(trait))
    .map(([trait, label]) => element('span', trait === 'choice' ? {class: 'choice'} : null, label)));
}

function sentence(text) {
  return text.replace(/[^.]$/, '$&.');
}

function rule(entry) {
  return section('What it does', element('p', {class: 'rule'}, sentence(entry.rule)),
    entry.context.map((text) => element('p', {class: 'aside'}, 'That is: ', sentence(text))));
}

function operandTable(entry) {
  const typeOf = (o) => (data.types[o.type] ? [o.type, element('small', null, data.types[o.type][2])] : [o.type]);
  const rows = entry.operands.map((o) => element('tr', null, element('td', null, o.name || '(unnamed)'),
    element('td', null, typeOf(o)), element('td', null, o.shape), element('td', null, o.role === 'result' ? '' : o.role)));
  const head = ['', 'type', 'lanes × bits', ''].map((title) => element('th', {scope: 'col'}, title));
  return entry.operands.length ? section('Operands', element('div', {class: 'scroll operands', tabindex: 0, role: 'region',
    'aria-label': 'Operands'}, element('table', null, element('thead', null, element('tr', null, head)),
    element('tbody', null, rows)))) : [];
}

// A call with the names of the parameters, and a declaration of what it gives.
function callOf(entry) {
  const parameters = entry.shortPrototype.replace(/^.*?\(|\)$/g, '').split(', ').filter(Boolean);
  const inOrder = entry.operands.filter((o) => o.role !== 'result');
  const names = parameters.map((parameter, i) => (/\*\*/.test(parameter) ? '&' : '') + inOrder[i].name);
  const call = `${entry.short}(${names.join(', ')});`;
  const result = entry.operands.find((o) => o.role === 'result');
  const written = inOrder.filter((o) => o.role === 'written').map((o) => `${o.type} ${o.name};\n`).join('');
  return result ? `const ${result.type} result = ${call}` : written + call;
}

function copy(text, button) {
  const done = () => { button.textContent = 'Copied'; };
  const mark = () => getSelection().selectAllChildren(button.previousSibling);  // to be copied by hand
  if (navigator.clipboard) navigator.clipboard.writeText(text).then(done, mark);
  else mark();
}

function callSection(entry) {
  const text = callOf(entry);
  const button = element('button', {type: 'button'}, 'Copy');
  button.addEventListener('click', () => copy(text, button));
  return section('Call', element('div', {class: 'call'}, element('pre', null, text), button));
}

// Twins differ from the entry on one axis alone; build.py writes the axes in this order.
const AXES = ['With and without a predicate', 'Other addressing', 'Other signs', 'Other lanes', 'Fresh, added, subtracted',
  'With and without saturation'];

function twinsOf(entry, axis) {
  const same = (other) => entry.axes.every((place, i) => i === axis || place === other.axes[i]);
  return entries.filter((other) => other !== entry && other.stem === entry.stem && same(other));
}

const linkTo = (id) => element('a', {href: addressOf({...state, open: id})}, id);

function twins(entry) {
  const rows = AXES.map((title, axis) => [title, twinsOf(entry, axis)]).filter(([, found]) => found.length);
  if (!rows.length) return [];
  const lines = rows.map(([title, found]) => element('tr', null, element('th', {scope: 'row'}, title),
    element('td', null, found.flatMap((twin) => [linkTo(twin.id), ' ']))));
  return section('Twins', element('table', {class: 'twins'}, element('tbody', null, lines)));
}

function cost(entry) {
  if (!entry.cycles) return [];
  const row = (tag, texts) => element('tr', null, texts.map((text) => element(tag, tag === 'th' ? {scope: 'col'} : null, text)));
  return section('Cost', element('table', {class: 'cost'}, element('thead', null, row('th', data.targets)),
    element('tbody', null, row('td', entry.cycles.split(' ')))),
  element('p', {class: 'aside'}, sentence(data.cycles[0].toUpperCase() + data.cycles.slice(1))));
}

function laneRow(kind, [name, values], columns, before) {
  const [label, first] = name.split('@');
  const title = label + (first ? `, lanes ${first} …` : kind === 'out' && before ? ' after' : '');
  const cells = values.split(' ');
  const old = before && !first ? before.split(' ') : cells;
  const row = element('tr', {class: kind}, element('th', {scope: 'row'}, title));
  if (cells.length === 1 && columns > 1) {
    row.append(element('td', {colspan: columns, class: 'alone'}, cells[0]));
    return row;
  }
  for (let i = 0; i < columns; ++i)
    row.append(element('td', cells[i] === old[i] ? null : {class: 'changed'}, cells[i] ?? ''));
  return row;
}

function example(entry) {
  const [calls, given, got] = entry.example;
  const [ins, outs] = [given, got].map((list) => groups(list, 2).map((pair) => pair.map(textOf)));
  if (!ins.length && !outs.length)
    return section('Worked example', element('p', null, 'Nothing to show: it has no operands and no result.'));
  const before = new Map(ins);
  const columns = Math.max(...[...ins, ...outs].map(([, values]) => values.split(' ').length));
  const word = calls > 1 ? 'call' : 'lane';
  const head = Array.from({length: columns}, (_, i) => element('th', {scope: 'col'}, `${i ? '' : word + ' '}${i}`));
  const table = element('table', {class: 'lanes'},
    element('thead', null, element('tr', null, element('th', null, ''), columns > 1 ? head : [])),
    element('tbody', null, ins.map((row) => laneRow('in', row, columns)),
      outs.map((row) => laneRow('out', row, columns, before.get(row[0])))));
  const note = calls > 1 ? 'Each column is a call of its own.'
    : columns === 8 ? 'The first eight lanes; the operands repeat after every eighth.' : '';
  return section('Worked example', element('div', {class: 'scroll', tabindex: 0, role: 'region',
    'aria-label': 'Worked example'}, table),
  element('p', {class: 'aside'}, `${note} The library computed the shaded rows.`));
}

// Lines break between parameters only.
function prototype(text) {
  const parts = (text + ';').split(/(?<=[(,]) ?/);
  return element('pre', {'aria-label': 'Prototype with short names'},
    parts.flatMap((part) => [element('span', null, part), part.endsWith(',') ? ' ' : '']));
}

function show(entry) {
  const choices = entry.choices.map((i) => element('p', null, ...prose(sentence(data.choices[i]))));
  const family = data.families[entry.family][0];
  $('entry').replaceChildren(...[
    element('a', {class: 'back', href: addressOf({...state, open: ''})}, '← Back to the list'),
    element('h2', {class: 'name'}, entry.id), tags(entry),
    prototype(entry.shortPrototype),
    rule(entry), callSection(entry), example(entry), operandTable(entry),
    entry.alignment ? section('Alignment', element('p', null, entry.alignment)) : [],
    choices.length ? section('Choices of this library', choices) : [],
    cost(entry), twins(entry),
    section('Full name', element('pre', null, entry.prototype + ';')),
    section('Where it stands', element('p', null, 'Row and rule: ', element('code', null, `src/${textOf(entry.table)}`),
      '. Declared in ', element('code', null, `kastarri/${family}.h`), '; as ', element('code', null, entry.short), ' in ',
      element('code', null, `kastarri/names/${family}.h`), '.'), element('p', {class: 'aside'}, data.tables[entry.table])),
  ].flat());
}

// --- What there is no entry of ---------------------------------------------------------------------------

// Text with names of intrinsics in it, which become links.
const linked = (text) => text.split('`').map((part, i) => (i % 2 === 0 ? part
  : entryNamed(part) ? linkTo(entryNamed(part).id) : element('code', null, part)));

// A name and, as names without an entry are often misspelt or of other lanes, what resembles it.
function nearest(name) {
  for (let end = withoutPackage(name).length; end > 2; --end) {
    const found = answersOf(index, withoutPackage(name).slice(0, end)).map((number) => index.entries[number]);
    if (found.some((answer) => answer.rule)) return found.filter((answer) => answer.rule).slice(0, 6);
  }
  return [];
}

function showTopic(topic, name) {
  $('entry').replaceChildren(
    element('a', {class: 'back', href: addressOf({...state, open: ''})}, '← Back to the list'),
    element('h2', null, 'Not built: ', ...prose(topic.title)),
    name === topic.id ? '' : element('p', {role: 'alert'}, 'There is no intrinsic named ', element('code', null, name), '.'),
    ...section('Why', element('p', null, sentence(topic.why[0].toUpperCase() + topic.why.slice(1)),
      ' A guess would be a silent wrong answer.')),
    ...section('What to write instead', element('p', {class: 'rule'}, linked(topic.instead))));
}

function welcome(unknown) {
  const start = document.getElementById('start').content.cloneNode(true);
  const links = data.families.map(([name, title], number) => element('li', null,
    element('a', {href: addressOf({...EMPTY, family: name})}, title),
    ` (${entries.filter((entry) => entry.family === number).length})`));
  const types = Object.entries(data.types).map(([name, [shape, bytes, meaning]]) => element('tr', null,
    element('td', null, element('a', {href: addressOf({...EMPTY, q: name})}, name)), element('td', null, shape),
    element('td', null, bytes), element('td', {class: 'text'}, meaning)));
  start.getElementById('families').append(...links);
  start.getElementById('types').append(...types);
  for (const query of start.querySelectorAll('.queries a')) query.href = addressOf({...EMPTY, q: query.textContent});
  const close = unknown ? nearest(unknown) : [];
  const message = unknown ? element('p', {role: 'alert'}, 'There is no intrinsic named ', element('code', null, unknown), '.',
    close.length ? ' Near it: ' : '', ...close.flatMap((entry) => [linkTo(entry.id), ' '])) : '';
  $('entry').replaceChildren(message, start);
}

function showEntry() {
  const entry = state.open && entryNamed(state.open);
  const topic = state.open && !entry && topicNamed(state.open);
  document.body.classList.toggle('opened', Boolean(state.open));
  document.title = entry ? `${entry.id} · kastarri` : 'kastarri: intrinsics';
  if (entry) show(entry); else if (topic) showTopic(topic, state.open); else welcome(state.open);
  $('entry').scrollTop = 0;
  const listIsHidden = state.open && !$('list').offsetParent;
  if (listIsHidden) $('entry').focus();
}

