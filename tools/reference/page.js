// --- Data: build.py writes the columns in this order ---------------------------------------------------

const data = JSON.parse(document.getElementById('data').textContent);
const textOf = (number) => (number === null ? null : data.texts[number]);

function groups(list, size) {
  return Array.from({length: list.length / size}, (_, i) => list.slice(i * size, (i + 1) * size));
}

function entryOf(row) {
  const [short, symbol, family, table, rule, context, prototype, operands, lanes, register, predicated, facts,
    alignment, choices, example, [operation, attributes], plainness, [stem, ...axes], cycles] = row;
  const id = short.replace(/^ZRA_/, '');
  const types = groups(operands, 4).map(([name, type, role, shape]) => ({
    name: textOf(name), type: textOf(type), role: textOf(role), shape: textOf(shape),
  }));
  const fullName = symbol.replace('$', data.prefix);
  const names = [id, short, symbol.replace(/^\$_KOR_|^\$/, ''), fullName].map((name) => name.toLowerCase());
  const typeNames = [...new Set(types.map((o) => o.type))];
  return {
    id, short, symbol: fullName, names, family, table, rule: textOf(rule), context: context.map(textOf),
    prototype: prototype.replaceAll('$', data.prefix), shortPrototype: prototype.replace(symbol, short).replaceAll('$', ''),
    operands: types, lanes, register, alignment: textOf(alignment), choices, facts, example,
    traits: new Set([...facts, ...(predicated ? ['predicated'] : []), ...(choices.length ? ['choice'] : []),
      ...(alignment === null ? [] : ['memory']), ...(/tested:/.test(textOf(alignment)) ? ['aligned'] : [])]),
    searched: [...names.slice(0, 3), ...typeNames, textOf(rule)].join('\n').toLowerCase(),
    words: {
      operation: textOf(operation), attributes: [textOf(attributes), ...typeNames].join(' '),
      rule: [textOf(rule), ...context.map(textOf), data.families[family][1]].join(' '),
    },
    plainness: plainness / 100, stem: textOf(stem), axes: axes.map(textOf), cycles,
  };
}

const entries = data.entries.map(entryOf);
const byName = new Map(entries.flatMap((entry) => entry.names.map((name) => [name, entry])));

// What is not built is found like an entry.
const topics = data.topics.map((topic) => ({
  ...topic, id: `not-built:${topic.key}`, names: [], patterns: topic.names.map((pattern) => new RegExp(`^(?:${pattern})$`)),
  words: {operation: topic.words}, plainness: 0.93,
}));
const index = indexOf([...topics, ...entries]);

const withoutPackage = (name) => name.replace(/^ZRA_/i, '');
const entryNamed = (name) => byName.get(name.toLowerCase());
const topicNamed = (name) => topics.find((topic) => topic.id === name ||
  topic.patterns.some((pattern) => pattern.test(withoutPackage(name).toUpperCase())));

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

// A regular expression is tried on each name, type and rule alone; names go before the rest.
function entriesThatMatch(expression) {
  const regex = new RegExp(expression, 'im');
  const found = entries.filter((entry) => regex.test(entry.searched) || regex.test(entry.id));
  const named = found.filter((entry) => regex.test(entry.id));
  return [...named, ...found.filter((entry) => !named.includes(entry))];
}

function passes(entry) {
  const traits = state.with ? state.with.split(',') : [];
  if (!entry.traits) return !(state.family || state.lane || state.register || traits.length);  // what is not built
  return (!state.family || data.families[entry.family][0] === state.family) &&
    (!state.lane || entry.lanes.includes(Number(state.lane))) &&
    (!state.register || entry.register === Number(state.register)) &&
    traits.every((trait) => entry.traits.has(trait));
}

function search() {
  const query = state.q.trim();
  if (!query) return entries.filter(passes);
  if (state.re) return entriesThatMatch(query).filter(passes);
  const topic = !/\s/.test(query) && !entryNamed(query) && topicNamed(query);
  const answers = answersOf(index, query).map((number) => index.entries[number]).filter(passes);
  return topic ? [topic, ...answers.filter((answer) => answer !== topic)] : answers;
}

// --- The list: entries are added as they come into view ------------------------------------------------

const CHUNK = 40;
let found = [];

function item(entry) {
  const title = entry.rule ? element('span', {class: 'name'}, entry.id)
    : element('span', {class: 'missing'}, 'Not built: ', ...prose(entry.title));
  const link = element('a', {href: addressOf({...state, open: entry.id})}, title,
    element('small', null, entry.rule || 'why, and what to write instead'));
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
    const there = found.filter((answer) => answer.rule).length;
    const some = there === entries.length ? 'All ' : '';
    const order = state.q && there > 1 && !state.re ? ', best first' : '';
    const count = `${some}${there.toLocaleString('en')} ${there === 1 ? 'intrinsic' : 'intrinsics'}${order}`;
    showMessage(found.length ? count : 'No intrinsic matches. Fewer words or filters may.', false);
  } catch (error) {
    found = [];
    showMessage(`This is not a regular expression: ${error.message}`, true);
  }
  $('list').scrollTop = 0;
  document.body.classList.toggle('asking', Boolean(state.q || state.family || state.lane || state.register || state.with));
  $('results').replaceChildren();
  showMore();
  markOpen();
}

function markOpen() {
  const open = entryNamed(state.open) || topicNamed(state.open);
  for (const link of $('results').querySelectorAll('[aria-current]')) link.removeAttribute('aria-current');
  const index = found.indexOf(open);
  if (index >= 0 && index < $('results').childElementCount) linkAt(index).setAttribute('aria-current', 'true');
}

const linkAt = (index) => $('results').children[index].firstChild;

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
