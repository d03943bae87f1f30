// Names of tests, files, folders, packages, options and presets that the documents give are there.
import assert from 'node:assert/strict';
import {test} from 'node:test';

import {
    codeSpans, differences, documents, filesAndFolders, filesMatching, NO_DIFFERENCES, proseLines, read, tableRows,
} from './documents.mjs';
import {appliancePaths} from './sources.mjs';

const spans = documents.flatMap(proseLines).flatMap(({document, line, text}) =>
    codeSpans(text).map((span) => ({document, line, span})));

test('each test that is named is one', () => {
    const tests = filesMatching('tests/**/*_test.cpp').flatMap((file) =>
        [...read(file).matchAll(/^(?:TYPED_)?TEST(?:_[FP])?\((\w+), (\w+)\)/gm)].map(([, suite, name]) =>
            `${suite}.${name}`));
    const named = spans.filter(({span}) => /^[A-Z]\w+\.[A-Z]\w+$/.test(span) && !/\.(Debian|Json)$/.test(span));
    assert.ok(named.length > 30);
    assert.deepEqual(named.filter(({span}) => !tests.includes(span)), []);
    // A test that is a script is named by its file: ctest's name of it is put together.
    const scripts = filesMatching('tests/*');
    const cited = documents.flatMap(tableRows).filter(({header}) => header.at(-1) === 'test')
        .flatMap(({document, line, cells}) => codeSpans(cells.at(-1)).map((span) => ({document, line, span})));
    assert.ok(cited.length > 30);
    assert.deepEqual(cited.filter(({span}) => !tests.includes(span) && !scripts.includes(span)), []);
});

test('each identifier that is named stands in the sources', () => {
    const sources = filesMatching('*.cpp', '*.h', '*.mjs', '*.js', '*.conf', '*CMakeLists.txt', '*.cmake',
        'CMakePresets.json', 'debian/*').map(read).join('\n');
    const words = new Set(sources.match(/\w+/g));
    const named = spans.filter(({span}) => /^(?=.*[a-z])(?=.*[A-Z_])\w+(::\w+)*(\(\))?$/.test(span))
        .flatMap(({document, line, span}) => span.match(/\w+/g).map((word) => ({document, line, word})));
    assert.ok(named.length > 100);
    // Of others: what libcurl reads of the environment, and a header.
    const others = ['Proxy', 'all_proxy', 'http_proxy', 'https_proxy', 'no_proxy'];
    assert.deepEqual(named.filter(({word}) => !words.has(word) && !others.includes(word)), []);
});

test('each of our files and folders that is named is there', () => {
    const folders = 'azure|cmake|debian|docs|doctor|frontend|jwt|platform|sso|tests|tools|utils|websphere';
    const named = spans.filter(({span}) => new RegExp(`^(${folders})/[\\w./-]*$`).test(span));
    assert.ok(named.length > 40);
    assert.deepEqual(named.filter(({span}) => !filesAndFolders.has(span.replace(/\/$/, ''))), []);
    const names = new Set(filesMatching('*').map((file) => file.split('/').at(-1)));
    const bare = spans.filter(({span}) => /^\w+\.(cpp|h|mjs|js|html|css|abi|map)$/.test(span));
    assert.ok(bare.length > 20);
    // A program of the reader's own, and a script that Doxygen puts into the reference.
    assert.deepEqual(bare.filter(({span}) => !names.has(span) && !['sso.cpp', 'jquery.js'].includes(span)), []);
});

test('each path of the appliance that is named is one of the sources or of the packages', () => {
    const installed = filesMatching('debian/*.dirs').flatMap((file) => read(file).split('\n'))
        .map((folder) => `/${folder}`);
    const known = new Set([...appliancePaths(), ...installed].flatMap((file) =>
        file.split('/').map((_, end, parts) => parts.slice(0, end + 1).join('/'))));
    const files = [...documents, ...filesMatching('docs/man/*', 'debian/*.README.Debian'), 'sso/sso.h',
        'platform/platform.h'];
    const named = files.flatMap((file) => [...read(file).matchAll(/\/usr\/tavo\b[\w./-]*/g)].map(([name]) =>
        ({file, name: name.replace(/[./]+$/, '')})));
    assert.ok(named.length > 60);
    assert.deepEqual(named.filter(({name}) => !known.has(name)), []);
    console.log(`${named.length} paths`);
});

test('each list of packages has all of them, and none that is not built', () => {
    const real = [...read('debian/control').matchAll(/^Package: (.*)$/gm)].map(([, name]) => name);
    assert.ok(real.length > 5);
    for (const document of ['docs/quick-start.md', 'docs/operations.md']) {
        const told = tableRows(document).filter(({header}) => header[0] === 'package')
            .flatMap(({cells}) => cells[0].split(', '));
        assert.deepEqual(differences({told, real}), NO_DIFFERENCES);
    }
});

test('each option and each preset of CMake that is named is one', () => {
    const cmake = filesMatching('*CMakeLists.txt', '*.cmake').map(read).join('\n');
    const options = cmake.match(/(?<=^ *option\()\w+|(?<=^ *set\()\w+(?= \S* CACHE )/gm);
    const presets = JSON.parse(read('CMakePresets.json')).configurePresets.filter(({hidden}) => !hidden)
        .map(({name}) => name);
    const named = (pattern) => documents.flatMap((document) =>
        [...read(document).matchAll(pattern)].map(([name]) => ({document, name})));
    const namedOptions = named(/\bTAVOSSO_\w+/g);
    const namedPresets = named(/(?<=--preset )\w+/g);
    assert.ok(namedOptions.length > 1 && namedPresets.length > 10, `${namedOptions.length}, ${namedPresets.length}`);
    assert.deepEqual(namedOptions.filter(({name}) => !options.includes(name)), []);
    assert.deepEqual(namedPresets.filter(({name}) => !presets.includes(name)), []);
    const [, others] = /^other presets ([^]*?)^$/m.exec(read('README.md'));
    const told = codeSpans(others).filter((span) => /^[a-z]+$/.test(span));
    const real = presets.filter((name) => name !== 'release');
    assert.deepEqual(differences({told: [...new Set(told)], real}), NO_DIFFERENCES);
});

test('the version is the same wherever it is given', () => {
    const [, version] = /^project\(tavosso VERSION (\S+)/m.exec(read('CMakeLists.txt'));
    const [, packaged] = /^tavosso \((.*)-\d+\)/.exec(read('debian/changelog'));
    assert.equal(packaged, version);
    const chapters = documents.filter((document) => document.startsWith('docs/') && document !== 'docs/release.md');
    const named = ['README.md', ...chapters, ...filesMatching('docs/man/*')].flatMap((file) =>
        [...read(file).matchAll(/\blibtavosso\.so\.(\d+)/g)].map(([, major]) => ({file, major})));
    assert.ok(named.length > 5);
    assert.deepEqual(named.filter(({major}) => major !== version.split('.')[0]), []);
});
