// Each key of each configuration file is told in the documents, once, and none that is not read.
import assert from 'node:assert/strict';
import {test} from 'node:test';

import {blocks, codeSpans, differences, documents, filesMatching, NO_DIFFERENCES, read, tableRows} from './documents.mjs';
import {booleanKeys, configurationKeys, thrownTexts} from './sources.mjs';

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

test('each key has its type and its default', () => {
    const booleans = booleanKeys();
    assert.equal(booleans.length, 2);
    const wrong = rows.filter(({cells: [key, type, byDefault]}) => booleans.includes(codeSpans(key)[0])
        ? type !== 'boolean' || byDefault !== '`false`'
        : type !== 'string' || byDefault !== 'empty');
    assert.deepEqual(wrong, []);
});

test('what looks like a key, in any document and manual page, is one', () => {
    const known = [...Object.values(keys).flat(), ...thrownTexts().map(({type}) => type)];
    const files = [...documents, ...filesMatching('docs/man/*', 'debian/*.README.Debian')];
    const named = files.flatMap((file) => [...read(file).matchAll(/\b(?:sso|azure|websphere)_[a-z_]+\b/g)]
        .map(([name]) => ({file, name})));
    assert.ok(named.length > 100);
    assert.deepEqual(named.filter(({name}) => !known.includes(name)), []);
});

test('no other file has keys', () => {
    assert.deepEqual([...new Set(rows.map(({heading}) => heading))], Object.keys(keys));
});
