// Each text that is logged or thrown is told in the documents, once, and none that is not.
import assert from 'node:assert/strict';
import {test} from 'node:test';

import {codeSpans, differences, documents, NO_DIFFERENCES, proseLines, tableRows} from './documents.mjs';
import {logFormats, thrownTexts} from './sources.mjs';

const formats = logFormats();
const thrown = thrownTexts();
const escape = (text) => text.replace(/[.*+?^${}()|[\]\\]/g, '\\$&');

// What an argument can be: a placeholder of capitals, a name that a call is made of, or the text of an exception.
const TEXT = `(?:[A-Z]+|resuid|resgid|${[...new Set(thrown.map(({text}) => escape(text)))].join('|')})`;

function pattern({format, source}) {
    return new RegExp('^' + escape(format).replace('%s:%d', `${source}:N`).replaceAll('%m', 'SYSTEM')
        .replaceAll('%d', '(?:-?\\d+|ID)').replaceAll('%s', TEXT) + '$');
}

const loggedAs = (line) => formats.filter((format) => pattern(format).test(line));

const logRows = tableRows('docs/operations.md').filter(({header}) => header.join() === 'line,level,cause,remedy');

test('each log line of the sources is told, once, with its level, and none that cannot be logged', () => {
    assert.ok(formats.length > 15 && logRows.length > 10, `${formats.length} formats, ${logRows.length} rows`);
    const told = logRows.flatMap(({cells}) => codeSpans(cells[0]).map((line) => ({line, level: cells[1]})));
    assert.deepEqual(told.filter(({line, level}) => !loggedAs(line).some((format) => format.level === level)), []);
    assert.deepEqual(formats.filter((format) => !told.some(({line}) => pattern(format).test(line))), []);
    const lines = told.map(({line}) => line);
    assert.deepEqual(lines.filter((line, index) => lines.indexOf(line) !== index), []);
    console.log(`${formats.length} formats, ${lines.length} lines`);
});

test('each log line that any document names can be logged', () => {
    const named = documents.flatMap(proseLines).flatMap(({document, line, text}) =>
        codeSpans(text).filter((span) => /^\w+:N /.test(span)).map((span) => ({document, line, span})));
    assert.ok(named.length > 15);
    assert.deepEqual(named.filter(({span}) => loggedAs(span.replace(/'\w*'/, '\'NAME\'')).length === 0), []);
});

const textRows = tableRows('docs/integration.md').filter(({heading}) => heading === 'What an exception means');

test('each text that is thrown is told, once, with its class, and none that is not', () => {
    const told = textRows.flatMap(({cells: [texts, classes]}) =>
        codeSpans(texts).map((text) => ({text, classes: codeSpans(classes)})));
    const real = [...new Set(thrown.map(({text}) => text))];
    assert.ok(real.length > 25, `${real.length} texts`);
    assert.deepEqual(differences({told: told.map(({text}) => text), real}), NO_DIFFERENCES);
    assert.deepEqual(thrown.filter(({text, type}) =>
        !told.find((row) => row.text === text).classes.includes(type)), []);
    console.log(`${real.length} texts`);
});

test('each exception that any document names is thrown', () => {
    const named = documents.flatMap(proseLines).flatMap(({document, line, text}) =>
        [...text.matchAll(/\bexceptions? `([^`]+)`/g)].map(([, span]) => ({document, line, span})));
    assert.ok(named.length > 10);
    assert.deepEqual(named.filter(({span}) => !thrown.some(({text}) => text === span)), []);
});
