// Each key of each configuration file is told in the documents, once, and none that is not read.
import assert from 'node:assert/strict';
import {test} from 'node:test';

import {blocks, codeSpans, differences, NO_DIFFERENCES, tableRows} from './documents.mjs';
import {configurationKeys} from './sources.mjs';

const keys = configurationKeys();
const rows = tableRows('docs/configuration.md').filter(({header}) => header[0] === 'key');
const examples = blocks('docs/configuration.md').filter(({language}) => language === 'json')
    .map(({text}) => Object.keys(JSON.parse(text)));

for (const [file, real] of Object.entries(keys)) {
    test(`the keys of ${file}: ${real.length}`, () => {
        assert.ok(real.length > 1);
        const told = rows.filter(({heading}) => heading === file).flatMap(({cells}) => codeSpans(cells[0]));
        assert.deepEqual(differences({told, real}), NO_DIFFERENCES);
        assert.ok(examples.some((example) => example.join() === told.join()), 'no example holds all of them in this order');
    });
}

test('no other file has keys', () => {
    assert.deepEqual([...new Set(rows.map(({heading}) => heading))], Object.keys(keys));
});
