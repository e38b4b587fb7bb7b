'use strict';

// --- Data: build.py writes the columns in this order ---------------------------------------------------

const data = JSON.parse(document.getElementById('data').textContent);
const textOf = (number) => (number === null ? null : data.texts[number]);

function groups(list, size) {
  return Array.from({length: list.length / size}, (_, i) => list.slice(i * size, (i + 1) * size));
}

function entryOf(row) {
  const [short, symbol, family, table, rule, context, prototype, operands, lanes, register, predicated, keeps, facts,
    alignment, choices, example] = row;
  const id = short.replace(/^ZRA_/, '');
  const types = groups(operands, 4).map(([name, type, role, shape]) => ({
    name: textOf(name), type: textOf(type), role: textOf(role), shape: textOf(shape),
  }));
  const names = [id, short, symbol.replace(/^\$_KOR_|^\$/, '')];
  return {
    id, short, symbol: symbol.replace('$', data.prefix), family, table, rule: textOf(rule), context: context.map(textOf),
    prototype: prototype.replaceAll('$', data.prefix), shortPrototype: prototype.replace(symbol, short).replaceAll('$', ''),
    operands: types, lanes, register, keeps, alignment: textOf(alignment), choices, facts, example,
    traits: new Set([...facts, ...(predicated ? ['predicated'] : []), ...(choices.length ? ['choice'] : []),
      ...(alignment === null ? [] : ['memory']), ...(/tested:/.test(textOf(alignment)) ? ['aligned'] : [])]),
    lowerId: id.toLowerCase(),
    searched: [...names, ...new Set(types.map((o) => o.type)), textOf(rule)].join('\n').toLowerCase(),
  };
}

const entries = data.entries.map(entryOf);
const byName = new Map();
for (const entry of entries)
  for (const name of [entry.id, entry.short, entry.symbol]) byName.set(name, entry);

// What can be asked for beside the text, and what an entry shows of it.
const TRAITS = {
  predicated: 'predicated', memory: 'memory', aligned: 'tests alignment', saturates: 'saturates', wraps: 'wraps',
  exact: 'exact', rounds: 'rounds', truncates: 'truncates', flags: 'raises flags', choice: 'a choice of this library',
};

// --- State: all of it is in the part of the address behind # --------------------------------------------
// #ADDNX16 opens an entry; #q=adds&family=integer searches; #ADDNX16&q=adds does both.

const EMPTY = {open: '', q: '', re: '', family: '', lane: '', register: '', with: ''};
let state = {...EMPTY};

function stateOfAddress() {
  const found = {...EMPTY};
  for (const part of location.hash.slice(1).split('&')) {
    const [, key, value] = part.match(/^(\w+)=(.*)$/) || [null, 'open', part];
    try {
      if (key in found) found[key] = decodeURIComponent(value.replaceAll('+', ' '));
    } catch { /* not an address that this page made: leave the part out */ }
  }
  return found;
}

function addressOf(asked) {
  const {open, ...rest} = asked;
  const pairs = Object.entries(rest).filter(([, value]) => value).map(([key, value]) => `${key}=${encodeURIComponent(value)}`);
  return '#' + [...(open ? [encodeURIComponent(open)] : []), ...pairs].join('&');
}

function ask(changes) {
  state = {...state, ...changes};
  history.replaceState(null, '', addressOf(state));
  showList();
}

// --- Search -------------------------------------------------------------------------------------------

// A function entry -> rank (0 best), or -1 where the entry does not match.
function matcher(query, isRegex) {
  const full = /cstub/i.test(query);
  const where = (entry) => (full ? `${entry.symbol}\n${entry.searched}` : entry.searched);
  if (isRegex) {
    const regex = new RegExp(query, 'im');
    return (entry) => (regex.test(entry.id) ? 0 : regex.test(where(entry)) ? 1 : -1);
  }
  const words = query.toLowerCase().split(/\s+/).filter(Boolean);
  return (entry) => {
    const text = full ? where(entry).toLowerCase() : entry.searched;
    if (!words.every((word) => text.includes(word))) return -1;
    const first = words[0] || '';
    return entry.lowerId === first ? 0 : entry.lowerId.startsWith(first) ? 1 : entry.lowerId.includes(first) ? 2 : 3;
  };
}

function passes(entry) {
  const traits = state.with ? state.with.split(',') : [];
  return (!state.family || data.families[entry.family][0] === state.family) &&
    (!state.lane || entry.lanes.includes(Number(state.lane))) &&
    (!state.register || entry.register === Number(state.register)) &&
    traits.every((trait) => entry.traits.has(trait));
}

function search() {
  const rank = matcher(state.q, state.re);
  const ranked = [];
  for (const entry of entries) {
    const r = passes(entry) ? rank(entry) : -1;
    if (r >= 0) (ranked[r] ||= []).push(entry);
  }
  return ranked.flat();
}

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

// --- The list: entries are added as they come into view ------------------------------------------------

const CHUNK = 40;
let found = [];

function item(entry) {
  const link = element('a', {href: addressOf({...state, open: entry.id})}, element('span', {class: 'name'}, entry.id),
    element('small', null, entry.rule));
  return element('li', null, link);
}

function showMore() {
  const shown = $('results').childElementCount;
  $('results').append(...found.slice(shown, shown + CHUNK).map(item));
}

function showMessage(text, isError) {
  $('message').textContent = text;
  $('message').classList.toggle('error', isError);
  $('query').setAttribute('aria-invalid', isError);
}

function showList() {
  try {
    found = search();
    const some = found.length === entries.length ? 'All ' : '';
    showMessage(found.length ? `${some}${found.length.toLocaleString('en')} ${found.length === 1 ? 'intrinsic' : 'intrinsics'}`
      : 'No intrinsic matches. Fewer words or filters may.', false);
  } catch (error) {
    found = [];
    showMessage(`This is not a regular expression: ${error.message}`, true);
  }
  $('list').scrollTop = 0;
  $('results').replaceChildren();
  showMore();
  markOpen();
}

function markOpen() {
  const open = entryNamed(state.open);
  for (const link of $('results').querySelectorAll('[aria-current]')) link.removeAttribute('aria-current');
  const index = found.indexOf(open);
  if (index >= 0 && index < $('results').childElementCount) linkAt(index).setAttribute('aria-current', 'true');
}

const linkAt = (index) => $('results').children[index].firstChild;

// --- An entry -----------------------------------------------------------------------------------------

const entryNamed = (name) => byName.get(name) || byName.get(name.replace(/^ZRA_/, ''));

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
  const keeper = entry.operands.find((o) => o.role === 'written');
  return section('What it does', element('p', {class: 'rule'}, sentence(entry.rule)),
    entry.keeps ? element('p', null, `Where the bit of p is 0, ${keeper.name} keeps the lane that it held.`) : null,
    entry.context.map((text) => element('p', {class: 'aside'}, 'That is: ', sentence(text))));
}

function operandTable(entry) {
  const rows = entry.operands.map((o) => element('tr', null, element('td', null, o.name || '(unnamed)'),
    element('td', null, o.type), element('td', null, o.shape), element('td', null, o.role === 'result' ? '' : o.role)));
  const head = ['', 'type', 'lanes × bits', ''].map((title) => element('th', {scope: 'col'}, title));
  return entry.operands.length ? section('Operands', element('div', {class: 'scroll', tabindex: 0, role: 'region',
    'aria-label': 'Operands'}, element('table', null, element('thead', null, element('tr', null, head)),
    element('tbody', null, rows)))) : [];
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

function show(entry) {
  const choices = entry.choices.map((i) => element('p', null, ...prose(sentence(data.choices[i]))));
  const family = data.families[entry.family][0];
  $('entry').replaceChildren(...[
    element('a', {class: 'back', href: addressOf({...state, open: ''})}, '← Back to the list'),
    element('h2', {class: 'name'}, entry.id), tags(entry),
    element('pre', {'aria-label': 'Prototype with short names'}, entry.shortPrototype + ';'),
    rule(entry), example(entry), operandTable(entry),
    entry.alignment ? section('Alignment', element('p', null, entry.alignment)) : [],
    choices.length ? section('Choices of this library', choices) : [],
    section('Full name', element('pre', null, entry.prototype + ';')),
    section('Where it stands', element('p', null, 'Row and rule: ', element('code', null, `src/${textOf(entry.table)}`),
      '. Declared in ', element('code', null, `kastarri/${family}.h`), '; short name: ', element('code', null, entry.short),
      ` (kastarri/names.h).`), element('p', {class: 'aside'}, data.tables[entry.table])),
  ].flat());
}

function welcome(unknown) {
  const links = data.families.map(([name, title], number) => element('li', null,
    element('a', {href: addressOf({...EMPTY, family: name})}, title),
    ` (${entries.filter((entry) => entry.family === number).length})`));
  $('entry').replaceChildren(...[
    unknown ? element('p', {role: 'alert'}, `There is no intrinsic named ${unknown}.`) : null,
    element('h2', null, 'Look up an intrinsic'),
    element('p', null, 'Words are found in names (short or full), types and rules; all of them have to occur. With Regex on, ',
      'the search is one regular expression, tried on each of these alone, so that ', element('code', null, '^MUL.*16$'),
      ' is a whole name. The address keeps the search, and ', element('code', null, '#ADDNX16'), ' opens an entry.'),
    element('ul', null, links),
    element('p', {class: 'aside'}, 'Tags such as “saturates” come from the words of a rule; “a choice of this library” from ',
      'docs/choices.md. Worked examples start with RoundMode to nearest and no flag set.'),
  ].filter(Boolean));
}

function showEntry() {
  const entry = state.open && entryNamed(state.open);
  document.body.classList.toggle('opened', Boolean(entry));
  document.title = entry ? `${entry.id} · kastarri` : 'kastarri: intrinsics';
  if (entry) show(entry); else welcome(state.open);
  $('entry').scrollTop = 0;
  const listIsHidden = entry && !$('list').offsetParent;
  if (listIsHidden) $('entry').focus();
}

// --- Controls -----------------------------------------------------------------------------------------

function fillControls() {
  const options = (id, pairs) => $(id).append(...pairs.map(([value, label]) => element('option', {value}, label)));
  const widths = (values) => [...new Set(values)].sort((a, b) => a - b);
  options('family', data.families);
  options('lane', widths(entries.flatMap((entry) => entry.lanes)).map((bits) => [bits, bits === 1 ? '1 bit' : `${bits} bits`]));
  options('register', widths(entries.map((entry) => entry.register)).map((bits) => [bits, bits ? `${bits} bits` : 'none']));
  $('with').append(...Object.entries(TRAITS).map(([trait, label]) =>
    element('label', null, element('input', {type: 'checkbox', value: trait}), ` ${label}`)));
}

function showControls() {
  if ($('query').value !== state.q) $('query').value = state.q;
  $('regex').checked = Boolean(state.re);
  for (const id of ['family', 'lane', 'register']) $(id).value = state[id];
  const traits = state.with.split(',');
  for (const box of $('with').querySelectorAll('input')) box.checked = traits.includes(box.value);
  if (state.family || state.lane || state.register || state.with) $('filters').open = true;
}

function showAll() {
  state = stateOfAddress();
  showControls();
  showList();
  showEntry();
}

function clear() {
  ask({...EMPTY, open: state.open});
  showControls();
  $('query').focus();
}

// --- Keys ---------------------------------------------------------------------------------------------

function chosenIndex() {
  const focused = document.activeElement.closest('#results a');
  return focused ? [...$('results').children].indexOf(focused.parentElement) : -1;
}

function move(step) {
  const index = chosenIndex() + step;
  if (index < 0) {
    $('query').focus();
    return;
  }
  if (index >= $('results').childElementCount) showMore();
  if (index >= found.length) return;
  linkAt(index).focus();
  linkAt(index).scrollIntoView({block: 'nearest'});
}

function openFirst() {
  if (found.length) linkAt(0).click();
}

const STEPS = {ArrowDown: 1, ArrowUp: -1, j: 1, k: -1};

function onKey(event) {
  if (event.ctrlKey || event.altKey || event.metaKey) return;
  const target = event.target;
  const types = target === $('query');
  const inList = types || target === document.body || Boolean(target.closest('#results'));
  const isLetter = event.key.length === 1;
  if (event.key === 'Escape') {
    clear();
  } else if (event.key === '/' && !types) {
    $('query').focus();
    $('query').select();
  } else if (event.key in STEPS && !(isLetter && types) && (inList || (isLetter && target.tagName !== 'SELECT'))) {
    move(STEPS[event.key]);
  } else {
    return;
  }
  event.preventDefault();
}

fillControls();
showAll();
addEventListener('hashchange', () => {
  const before = addressOf({...state, open: ''});
  const asked = stateOfAddress();
  if (addressOf({...asked, open: ''}) !== before) {
    showAll();
    return;
  }
  state = asked;
  markOpen();
  showEntry();
});
addEventListener('keydown', onKey);
$('list').addEventListener('scroll', () => {
  if ($('list').scrollTop + 2 * $('list').clientHeight > $('list').scrollHeight) showMore();
});
$('query').addEventListener('input', () => ask({q: $('query').value}));
$('regex').addEventListener('change', () => ask({re: $('regex').checked ? '1' : ''}));
for (const id of ['family', 'lane', 'register']) $(id).addEventListener('change', () => ask({[id]: $(id).value}));
$('with').addEventListener('change', () =>
  ask({with: [...$('with').querySelectorAll(':checked')].map((box) => box.value).join(',')}));
$('clear').addEventListener('click', clear);
$('search').addEventListener('submit', (event) => {
  event.preventDefault();
  openFirst();
});
