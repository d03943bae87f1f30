// Each key of each configuration file is told in the documents, once, and none that is not read.
import assert from 'node:assert/strict';
import {test} from 'node:test';

import {
    blocks, codeSpans, differences, documents, filesMatching, NO_DIFFERENCES, read, tableRows,
} from './documents.mjs';
import {configurationKeys, thrownTexts} from './sources.mjs';

const keys = configurationKeys();
const rows = tableRows('docs/configuration.md').filter(({header}) => header[0] === 'key');
const troubles = tableRows('docs/configuration.md')
    .filter(({header}) => ['where', 'what is wrong'].includes(header[0]));
const examples = blocks('docs/configuration.md').filter(({language}) => language === 'json')
    .map(({text}) => Object.keys(JSON.parse(text)));

for (const [file, members] of Object.entries(keys)) {
    const real = members.map(({key}) => key);

    test(`the keys of ${file}: ${real.length}, with types and defaults`, () => {
        assert.ok(real.length > 1);
        const told = rows.filter(({heading}) => heading === file).map(({cells: [key, type, byDefault]}) =>
            ({key: codeSpans(key)[0], type, byDefault: codeSpans(byDefault)[0] ?? byDefault}));
        assert.deepEqual(told, members);
        assert.ok(examples.some((example) => example.join() === real.join()),
            'no example holds all of them in this order');
    });

    test(`what happens when a key of ${file} is wrong is told of each`, () => {
        const told = troubles.filter(({heading}) => heading === file).flatMap(({cells}) => codeSpans(cells[0]))
            .filter((span) => span.includes('_'));
        assert.deepEqual(differences({told: [...new Set(told)], real}), NO_DIFFERENCES);
    });
}

test('what looks like a key, in any document, manual page and header, is one', () => {
    const known = [...Object.values(keys).flat().map(({key}) => key), ...thrownTexts().map(({type}) => type)];
    const files = [...documents, ...filesMatching('docs/man/*', 'debian/*.README.Debian', 'sso/sso.h', 'jwt/jwt.h')];
    const named = files.flatMap((file) => [...read(file).matchAll(/\b(?:sso|azure|websphere)_[a-z_]+\b/g)]
        .map(([name]) => ({file, name})));
    assert.ok(named.length > 100);
    assert.deepEqual(named.filter(({name}) => !known.includes(name)), []);
});

test('no other file has keys', () => {
    assert.deepEqual([...new Set(rows.map(({heading}) => heading))].sort(), Object.keys(keys).sort());
});
