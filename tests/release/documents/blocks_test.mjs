// What stands in the documents' blocks is what it says it is.
import assert from 'node:assert/strict';
import {execFileSync} from 'node:child_process';
import {mkdtempSync, readdirSync, readFileSync, rmSync} from 'node:fs';
import {tmpdir} from 'node:os';
import path from 'node:path';
import {test} from 'node:test';

import {blocks, codeSpans, documents, PROJECT, proseLines} from './documents.mjs';

const LANGUAGES = ['conf', 'cpp', 'json', 'mermaid', 'sh', 'text'];
// Marks for the programs that write figures into a document. Any other comment may hide what stands behind it.
const MARKS = ['<!-- targets -->', '<!-- figures -->', '<!-- end -->'];
const all = documents.flatMap(blocks);
const inLanguage = (wanted) => all.filter(({language}) => language === wanted);

test(`each of ${all.length} blocks says what it is`, () => {
    assert.ok(all.length > 15);
    assert.deepEqual(all.filter(({language}) => !LANGUAGES.includes(language)), []);
});

test('nothing is written in a form that no test reads', () => {
    const unread = {
        'a block that is indented, or fenced otherwise': (text) => /^(\t| {4})|```|~~~/.test(text),
        'a span in backticks that does not end in its line': (text) => text.split('`').length % 2 === 0,
        'quotation marks of other forms': (text) => /[“”„«»]/.test(text),
        'HTML, but for line breaks in tables and marks for programs': (text) => !MARKS.includes(text) &&
            /<(?!br>)[!?/a-z]/i.test(codeSpans(text).reduce((rest, span) => rest.replace(`\`${span}\``, ''), text)),
    };
    for (const [form, isIn] of Object.entries(unread)) {
        assert.deepEqual(documents.flatMap(proseLines).filter(({text}) => isIn(text)), [], form);
    }
});

test('each JSON block is JSON', () => {
    assert.ok(inLanguage('json').length > 2);
    inLanguage('json').forEach(({text}) => JSON.parse(text));
});

test('each C++ block is one of the programs that are compiled as they stand', () => {
    const folder = mkdtempSync(path.join(tmpdir(), 'programs-'));
    try {
        execFileSync(path.join(PROJECT, 'tests/release/consumer/programs'), [folder]);
        const compiled = readdirSync(folder, {recursive: true}).filter((file) => /\.(cpp|h)$/.test(file))
            .map((file) => readFileSync(path.join(folder, file), 'utf8').trim());
        assert.ok(compiled.length > 3);
        const told = inLanguage('cpp').map(({text}) => text);
        assert.equal(told.length, compiled.length);
        assert.deepEqual(told.filter((text) => !compiled.includes(text)).map((text) => text.split('\n')[0]), []);
    } finally {
        rmSync(folder, {recursive: true});
    }
});
