'use strict';

// The search: what people write, and the entries that answer it, best first. Nothing here touches the page.

const N_BITS = /\b(\d+)[ -]?bits?\b/g;
const WIDTH = /^(8|16|24|32|48|64|128|256)$/;
const STOP_WORDS = new Set(('a an the of to in into with for from by on is are be do does how i can my me what which that ' +
  'this two using use vs intrinsic intrinsics function instruction').split(' '));
// Endings that tell no difference here: saturate, saturating, saturation.
const WHOLE = new Set(['masked', 'predicated', 'signed']);  // not those with a mask, a predicate, a sign
const ENDINGS = /(?:ations?|ating|ated|ates?|ings?|ions?|ed|es|ers?|s|e)$/;

function stem(word) {
  if (WHOLE.has(word)) return word;
  const cut = word.replace(ENDINGS, '');
  return cut.length < 3 || /\d/.test(word) ? word : cut.replace(/([^lse])\1$/, '$1');
}

function wordsOf(text) {
  const words = text.toLowerCase().replace(N_BITS, '$1bit').split(/[\s,;:()/.?"]+/);
  return words.flatMap((word) => (/^[a-z]+(-[a-z]+)+$/.test(word) ? word.split('-') : [word]))
    .map((word) => word.replace(/^[-'`]+|[-'`]+$/g, '')).filter(Boolean);
}

// Whether one letter too many, too few or another one, or two in the wrong order, lead from a to b.
function oneLetterApart(a, b) {
  if (Math.abs(a.length - b.length) > 1) return false;
  let i = 0;
  while (i < a.length && a[i] === b[i]) ++i;
  const rest = (text, from) => text.slice(from);
  return rest(a, i + 1) === rest(b, i + 1) || rest(a, i + 1) === rest(b, i) || rest(a, i) === rest(b, i + 1) ||
    (a[i] === b[i + 1] && a[i + 1] === b[i] && rest(a, i + 2) === rest(b, i + 2));
}

// How much a word says of an entry, by where it stands; what a match is worth; how much of the best score still counts.
const WEIGHTS = {operation: 6, attributes: 3, rule: 1};
const EXACT_NAME = 10, NAME_BEGINS = 5, NAME_CONTAINS = 2, NAME_MISSPELT = 8;
const BEGINS = 0.5, MISSPELT = 0.4, CUT = 0.35;

// An index of entries {id, names, words: {operation, attributes, rule}, plainness}; names are in lower case. Plainness,
// from 0 to 1, is what the score of an entry is multiplied by: what is used more goes before its variants.
function indexOf(entries) {
  const byWord = new Map();  // stem -> Map of number of the entry -> weight
  const known = new Map();  // many entries share a text
  const stemsOf = (text) => {
    if (!known.has(text)) known.set(text, new Set(wordsOf(text).map(stem)));
    return known.get(text);
  };
  entries.forEach((entry, number) => {
    for (const [field, weight] of Object.entries(WEIGHTS)) {
      for (const word of stemsOf(entry.words[field] || '')) {
        if (!byWord.has(word)) byWord.set(word, new Map());
        const found = byWord.get(word);
        found.set(number, Math.max(found.get(number) || 0, weight));
      }
    }
  });
  return {entries, byWord, stems: [...byWord.keys()]};
}

// What a name has of a word: all, its beginning, or the word within.
function nameWorth(names, word) {
  const worth = (name) => (name === word ? EXACT_NAME : word.length > 2 && name.startsWith(word) ? NAME_BEGINS
    : word.length > 3 && name.includes(word) ? NAME_CONTAINS : 0);
  return Math.max(0, ...names.map(worth));
}

// Number of the entry -> worth of one word of a query.
function matchesOf(index, word) {
  const wanted = stem(word);
  const matches = new Map();
  const matchWords = (fits, factor) => {
    for (const each of index.stems)
      if (fits(each)) index.byWord.get(each).forEach((weight, number) =>
        matches.set(number, Math.max(matches.get(number) || 0, weight * factor)));
  };
  matchWords((each) => each === wanted, 1);
  if (wanted.length > 2) matchWords((each) => each !== wanted && each.startsWith(wanted), BEGINS);
  index.entries.forEach(({names}, number) => {
    const worth = nameWorth(names, word), other = matches.get(number) || 0;
    if (worth) matches.set(number, worth > NAME_CONTAINS ? worth + other : Math.max(worth, other));
  });
  if (matches.size || word.length < 4) return matches;
  matchWords((each) => each.length > 2 && (oneLetterApart(each, wanted) || oneLetterApart(each, word)), MISSPELT);
  index.entries.forEach(({names}, number) => {
    if (names.some((name) => oneLetterApart(name, word))) matches.set(number, NAME_MISSPELT);
  });
  return matches;
}

// The numbers of the entries that answer a query, best first. A rare word tells more than a frequent one, and who has
// all the words goes before who has some.
function answersOf(index, query) {
  const written = wordsOf(query).map((word) => (WIDTH.test(word) ? word + 'bit' : word));
  const telling = written.filter((word) => !STOP_WORDS.has(word));
  const words = (telling.length ? telling : written).map((word) => {
    const matches = matchesOf(index, word);
    return {matches, rarity: Math.log(1 + index.entries.length / (1 + matches.size))};
  });
  const wanted = words.reduce((sum, {rarity}) => sum + rarity, 0);
  const scores = new Map();
  for (const {matches, rarity} of words)
    matches.forEach((worth, number) => {
      const [score, has] = scores.get(number) || [0, 0];
      scores.set(number, [score + worth * rarity, has + rarity]);
    });
  const ranked = [...scores].map(([number, [score, has]]) => [number, score * has / wanted * index.entries[number].plainness]);
  ranked.sort(([a, x], [b, y]) => y - x || a - b);
  return ranked.filter(([, score]) => score >= CUT * ranked[0][1]).map(([number]) => number);
}
