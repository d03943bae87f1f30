// The licences of all that the project's own commands install are told, and of nothing else.
import assert from 'node:assert/strict';
import {test} from 'node:test';

import {codeSpans, filesMatching, read, tableRows} from './documents.mjs';

const DOCUMENT = 'docs/licences.md';

/** Of Debian: what stands in a script's arrays of packages, and what its function for a part's packages prints. */
function debianPackages(script) {
    const lists = /(?:packages\+?=|^directory=)\(([^)]*)\)|^ +(?:\w[\w |]*\) )?echo ([a-z][^;\n]*?)(?: ;;)?$/gm;
    return [...read(script).matchAll(lists)]
        .flatMap(([, array, printed]) => (array ?? printed).split(/\s+/))
        .filter((word) => /^[a-z][a-z0-9+.-]+$/.test(word));
}

/** Of npm: what the project asks for; what these need is told with them. */
function npmPackages() {
    return filesMatching('*package.json').flatMap((file) => Object.keys(JSON.parse(read(file)).dependencies ?? {}));
}

test('each package that is installed stands in the table with its licence, and no other', () => {
    const installed = [...['check', 'demo', 'bench/run'].flatMap(debianPackages), ...npmPackages()];
    const told = tableRows(DOCUMENT).filter(({header}) => header[1] === 'installed as')
        .flatMap(({cells}) => codeSpans(cells[1]));
    assert.ok(told.length > 40);
    assert.deepEqual(told.sort(), [...new Set(installed)].sort());
});
