// Names of tests, files and folders that the documents give are there.
import assert from 'node:assert/strict';
import {test} from 'node:test';

import {codeSpans, documents, filesMatching, proseLines, read} from './documents.mjs';

const spans = documents.flatMap(proseLines).flatMap(({document, line, text}) =>
    codeSpans(text).map((span) => ({document, line, span})));

test('each test that is named is one', () => {
    const tests = filesMatching('tests/**/*_test.cpp').flatMap((file) =>
        [...read(file).matchAll(/^(?:TYPED_)?TEST(?:_[FP])?\((\w+), (\w+)\)/gm)].map(([, suite, name]) => `${suite}.${name}`));
    const named = spans.filter(({span}) => /^[A-Z]\w+\.[A-Z]\w+$/.test(span) && !/\.(Debian|Json)$/.test(span));
    assert.ok(named.length > 30);
    assert.deepEqual(named.filter(({span}) => !tests.includes(span)), []);
});

test('each of our files and folders that is named is there', () => {
    const files = filesMatching('*');
    const known = new Set(files.flatMap((file) => [file, ...file.split('/').map((_, end, parts) =>
        parts.slice(0, end).join('/'))]));
    const named = spans.filter(({span}) =>
        /^(azure|cmake|debian|docs|frontend|jwt|platform|sso|tests|tools|utils|websphere)\/[\w./-]*$/.test(span));
    assert.ok(named.length > 40);
    assert.deepEqual(named.filter(({span}) => !known.has(span.replace(/\/$/, ''))), []);
});
