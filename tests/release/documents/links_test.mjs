// Links, anchors and pictures of the documents are there, and the index leads to every chapter.
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

/** The anchors that a document's headings have where it is shown. */
function anchors(document) {
    return proseLines(document).map(({text}) => /^#+ (.*)/.exec(text)?.[1]).filter(Boolean)
        .map((heading) => heading.toLowerCase().replace(/[^\w\- ]/g, '').replaceAll(' ', '-'));
}

test(`each of ${links.length} links leads to a file of ours`, () => {
    assert.ok(links.length > 30);
    assert.deepEqual(links.filter(({file}) => !filesAndFolders.has(file.replace(/\/$/, ''))), []);
});

test('each anchor is a heading there', () => {
    const anchored = links.filter(({anchor}) => anchor !== undefined);
    assert.ok(anchored.length > 10);
    assert.deepEqual(anchored.filter(({file, anchor}) => !anchors(file).includes(anchor)), []);
});

test('the index leads to every chapter', () => {
    const led = links.filter(({document}) => document === 'README.md').map(({file}) => file);
    const chapters = documents.filter((document) => document.startsWith('docs/'));
    assert.ok(chapters.length > 5);
    assert.deepEqual(chapters.filter((chapter) => !led.includes(chapter)), []);
});
