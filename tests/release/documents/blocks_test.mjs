// Verifies that JSON in the documents is valid, and that programs are quoted from examples/, which are compiled and
// run.
import assert from 'node:assert/strict';
import {test} from 'node:test';

import {blocks, documents, filesMatching, read} from './documents.mjs';

const inLanguage = (wanted) => documents.flatMap(blocks).filter(({language}) => language === wanted);

test('JSON blocks are valid JSON', () => {
    assert.ok(inLanguage('json').length > 2);
    inLanguage('json').forEach(({text}) => JSON.parse(text));
});

test('C++ blocks are quoted from examples', () => {
    const examples = filesMatching('examples/*').map(read);
    const quoted = inLanguage('cpp');
    assert.ok(quoted.length > 2);
    assert.deepEqual(quoted.filter(({text}) => !examples.some((example) => example.includes(text))), []);
});
