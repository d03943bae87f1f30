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

test('each identifier that is named stands in the sources', () => {
    const sources = filesMatching('*.cpp', '*.h', '*.mjs', '*.js', '*.conf', '*CMakeLists.txt', '*.cmake', 'CMakePresets.json',
        'debian/*').map(read).join('\n');
    const words = new Set(sources.match(/\w+/g));
    const named = spans.filter(({span}) => /^(?=.*[a-z])(?=.*[A-Z_])\w+(::\w+)*(\(\))?$/.test(span))
        .flatMap(({document, line, span}) => span.match(/\w+/g).map((word) => ({document, line, word})));
    assert.ok(named.length > 100);
    // Of others: what libcurl reads of the environment, and a header.
    const others = ['Proxy', 'all_proxy', 'http_proxy', 'https_proxy', 'no_proxy'];
    assert.deepEqual(named.filter(({word}) => !words.has(word) && !others.includes(word)), []);
});

test('each of our files and folders that is named is there', () => {
    const files = filesMatching('*');
    const known = new Set(files.flatMap((file) => [file, ...file.split('/').map((_, end, parts) =>
        parts.slice(0, end).join('/'))]));
    const folders = 'azure|cmake|debian|docs|doctor|frontend|jwt|platform|sso|tests|tools|utils|websphere';
    const named = spans.filter(({span}) => new RegExp(`^(${folders})/[\\w./-]*$`).test(span));
    assert.ok(named.length > 40);
    assert.deepEqual(named.filter(({span}) => !known.has(span.replace(/\/$/, ''))), []);
    const names = new Set(files.map((file) => file.split('/').at(-1)));
    const bare = spans.filter(({span}) => /^\w+\.(cpp|h|mjs|js|html|css|abi|map)$/.test(span));
    assert.ok(bare.length > 20);
    // A program of the reader's own.
    assert.deepEqual(bare.filter(({span}) => !names.has(span) && span !== 'sso.cpp'), []);
});
