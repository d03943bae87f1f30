// Verifies links, anchors and images of the documents, and that the README links every chapter.
import assert from 'node:assert/strict';
import path from 'node:path';
import {test} from 'node:test';

import {documents, filesAndFolders, proseLines} from './documents.mjs';

const links = documents.flatMap(proseLines).flatMap(({document, line, text}) =>
    [...text.replace(/`[^`]*`/g, '``').matchAll(/\]\(([^)\s]+)\)/g)].map(([, target]) => ({document, line, target})))
    .map((link) => {
        const [file, anchor] = link.target.split('#');
        return {...link, file: file === '' ? link.document : path.join(path.dirname(link.document), file), anchor};
    });

/** The anchors of a document's headings. */
function anchors(document) {
    return proseLines(document).map(({text}) => /^#+ (.*)/.exec(text)?.[1]).filter(Boolean)
        .map((heading) => heading.toLowerCase().replace(/[^\w\- ]/g, '').replaceAll(' ', '-'));
}

test(`${links.length} links point to existing files`, () => {
    assert.ok(links.length > 30);
    assert.deepEqual(links.filter(({file}) => !filesAndFolders.has(file.replace(/\/$/, ''))), []);
});

test('anchors match headings', () => {
    const anchored = links.filter(({anchor}) => anchor !== undefined);
    assert.ok(anchored.length > 10);
    assert.deepEqual(anchored.filter(({file, anchor}) => !anchors(file).includes(anchor)), []);
});

test('the README links every chapter', () => {
    const linked = links.filter(({document}) => document === 'README.md').map(({file}) => file);
    const chapters = documents.filter((document) => document.startsWith('docs/'));
    assert.ok(chapters.length > 5);
    assert.deepEqual(chapters.filter((chapter) => !linked.includes(chapter)), []);
});
