// The manual pages: well-formed, complete, and of the same mind as the headers and the sources.
import assert from 'node:assert/strict';
import {execFileSync, spawnSync} from 'node:child_process';
import {existsSync, mkdirSync, mkdtempSync, rmSync, symlinkSync, writeFileSync} from 'node:fs';
import {tmpdir} from 'node:os';
import path from 'node:path';
import {test} from 'node:test';

import {documents, filesMatching, PROJECT, read, unescaped} from './documents.mjs';
import {configurationKeys, level, loggedBy, thrownTexts} from './sources.mjs';

const files = filesMatching('docs/man/*');
const links = files.filter((file) => read(file).startsWith('.so '));
const pages = files.filter((file) => !links.includes(file))
    .map((file) => ({file, section: file.at(-1), source: read(file), text: render(file)}));
const ELSEWHERE = ['curl_easy_perform 3', 'journalctl 1', 'libcurl 3', 'lighttpd 8', 'pkg-config 1', 'setresuid 2',
    'strerror 3', 'syslog 3', 'update-ca-certificates 8', 'wbinfo 1', 'winbindd 8'];

function render(file) {
    const text = execFileSync('mandoc', ['-T', 'ascii', '-O', 'width=1000', file], {cwd: PROJECT, encoding: 'utf8'});
    return text.replace(/.\x08/g, ''); // eslint-disable-line no-control-regex -- bold and underlined
}

function part(text, heading) {
    return text.split(/^(?=[A-Z])/m).filter((each) => each.startsWith(heading)).join('');
}

const normal = (text) => text.replace(/\s+/g, ' ').replace(/\( /g, '(').trim();

test(`mandoc has nothing to say of ${files.length} pages`, () => {
    assert.ok(pages.length > 10 && links.length > 3);
    const lint = spawnSync('mandoc', ['-T', 'lint', '-W', 'warning', ...pages.map(({file}) => file)],
        {cwd: PROJECT, encoding: 'utf8'});
    assert.equal(lint.stdout + lint.stderr, '');
    assert.deepEqual(links.filter((file) => !existsSync(path.join(PROJECT, 'docs/man',
        read(file).replace(/^\.so man3\//, '').trim()))), []);
});

test('each page that another or a document refers to is there', () => {
    const known = [...files.map((file) => path.basename(file).replace(/\.(\d)$/, ' $1')), ...ELSEWHERE];
    const plain = [...documents, ...filesMatching('debian/*.README.Debian')]
        .map((file) => ({file, source: read(file)}));
    const named = (pattern, sources) => sources.flatMap(({file, source}) =>
        [...source.matchAll(pattern)].map(([, name, section]) => ({file, page: `${name} ${section}`})));
    const referred = [...named(/^\.Xr (\S+) (\d)/gm, pages), ...named(/([\w.:-]+)\((\d)\)/g, plain)];
    assert.ok(referred.length > 20 && referred.some(({file}) => file.startsWith('debian/')));
    assert.deepEqual(referred.filter(({page}) => !known.includes(page)), []);
});

test('a page that is a link leads to one that has its name', () => {
    const wrong = links.filter((file) => {
        const target = pages.find((page) => path.basename(page.file) === path.basename(read(file).trim()));
        return !target.source.includes(`.Nm ${path.basename(file, '.3')}`);
    });
    assert.deepEqual(wrong, []);
});

/** The lines of log that a page tells of, each with the levels that its paragraph and its own text name. */
function toldLines({file, text}) {
    const lines = [];
    let paragraph = '';
    for (const line of text.split('\n').filter((each) => each.trim() !== '')) {
        const [, logged] = /^ {5}(\w+:LINE \S.*)$/.exec(line) ?? [];
        if (logged !== undefined) {
            lines.push({file, line: logged, paragraph, own: ''});
        } else if (/^ {5}\S/.test(line)) {
            paragraph = line;
        } else { // of each of the lines that stand above it
            lines.forEach((each) => {
                each.own ||= line;
            });
        }
    }
    return lines.map((each) => ({...each, names: (each.paragraph + each.own).match(/LOG_[A-Z]+/g) ?? []}));
}

test('each line of log that a page tells of can be logged, with the level that the page tells', () => {
    const told = pages.flatMap(toldLines);
    assert.ok(told.length > 20);
    const isLogged = ({line, names}) => loggedBy(line, 'LINE').some((format) =>
        names.every((name) => format.level.split(', ').includes(level(name))));
    assert.deepEqual(told.filter((each) => !isLogged(each)), []);
    const levels = told.filter(({names}) => names.length > 0);
    assert.ok(levels.length > 20);
    console.log(`${told.length} lines of log, ${levels.length} with a level`);
});

test('each text that a page quotes among the errors is thrown as the class that it stands under', () => {
    const thrown = thrownTexts();
    const told = pages.flatMap(({file, text}) => {
        let type;
        return part(text, 'ERRORS').split('\n').flatMap((line) => {
            type = /^ {5}(\w[\w:]*)( itself)?$/.exec(line)?.[1] ?? type;
            const [, quoted] = /^ +"([^"]+)"$/.exec(line) ?? [];
            return quoted === undefined ? [] : [{file, quoted, type}];
        });
    });
    assert.ok(told.length > 25);
    assert.deepEqual(told.filter(({quoted, type}) =>
        !thrown.some((each) => each.text === quoted && type.endsWith(each.type))), []);
});

test('each exported function has its declaration in one synopsis, as in the header', () => {
    const declared = normal((read('sso/sso.h') + read('jwt/jwt.h')).replace(/\/\*[^]*?\*\/|\/\/.*$/gm, ''));
    const synopses = pages.map(({file, text}) => ({file, synopsis: normal(part(text, 'SYNOPSIS'))}));
    const names = [...new Set([...read('cmake/libtavosso.map').matchAll(/"TAVO::\w+::(?:\w+::)?(\w+)(?:\[[^"(]*)?\(/g)]
        .map(([, name]) => name))];
    assert.ok(names.length > 30);
    const declarations = names.flatMap((name) =>
        [...declared.matchAll(new RegExp(`[^;{}:]*\\b(?<!~)${name}\\([^;{]*;`, 'g'))].map(([text]) => normal(text)));
    assert.ok(declarations.length > names.length);
    assert.deepEqual(declarations.filter((text) => !synopses.some(({synopsis}) => synopsis.includes(text))), []);
    const told = synopses.flatMap(({file, synopsis}) => [...synopsis.matchAll(/\b\w+\([^;{}]*\)(?= *(?:override)?;)/g)]
        .map(([text]) => ({file, text})));
    assert.ok(told.length >= declarations.length);
    assert.deepEqual(told.filter(({text}) => !declared.includes(text)), []);
    console.log(`${declarations.length} declarations`);
});

test('each text that is thrown stands in a page, and none stands among the errors that is not', () => {
    const thrown = [...new Set(thrownTexts().map(({text}) => text))];
    const text = normal(pages.map((page) => page.text).join('\n'));
    assert.deepEqual(thrown.filter((each) => !text.includes(`"${each}"`)), []);
    const libcurls = ['Couldn\'t connect to server'];
    const told = pages.flatMap((page) => [...normal(part(page.text, 'ERRORS')).matchAll(/"([^" ][^"]* [^"]*[^" ])"/g)]
        .map(([, quoted]) => ({file: page.file, quoted})));
    assert.ok(told.length > 20);
    assert.deepEqual(told.filter(({quoted}) => ![...thrown, ...libcurls].includes(quoted)), []);
    console.log(`${thrown.length} texts`);
});

test('each key of a configuration file stands in the page of that file, with its type and its default', () => {
    for (const [file, real] of Object.entries(configurationKeys())) {
        const {source} = pages.find((page) => page.file === `docs/man/tavosso-${file}.5`);
        const told = [...source.matchAll(/^\.It Cm (\w+) Pq (\w+), default (\w+)$/gm)].map(([, key, type, byDefault]) =>
            ({key, type, byDefault}));
        assert.deepEqual(told, real);
        const [, example] = /^\.Bd -literal.*\n(\{[^]*?)^\.Ed/m.exec(source);
        assert.deepEqual(Object.keys(JSON.parse(unescaped(example))), real.map(({key}) => key));
    }
});

test('each example that is a program compiles', () => {
    const programs = pages.flatMap(({source}) => [...source.matchAll(/^\.Bd -literal.*\n([^]*?)^\.Ed/gm)])
        .map(([, text]) => unescaped(text))
        .filter((text) => text.includes('int main') || text.includes('main('));
    assert.ok(programs.length > 0);
    const folder = mkdtempSync(path.join(tmpdir(), 'examples-'));
    try {
        mkdirSync(path.join(folder, 'tavosso'));
        for (const header of ['sso/sso.h', 'jwt/jwt.h']) {
            symlinkSync(path.join(PROJECT, header), path.join(folder, 'tavosso', path.basename(header)));
        }
        const jsoncpp = execFileSync('pkg-config', ['--cflags', 'jsoncpp'], {encoding: 'utf8'}).trim().split(/\s+/);
        const flags = ['-std=c++17', '-Wall', '-Wextra', '-Werror', '-fsyntax-only', ...jsoncpp, `-I${folder}`];
        programs.forEach((program, index) => {
            const file = path.join(folder, `example${index}.cpp`);
            writeFileSync(file, program);
            execFileSync('g++', [...flags, file]);
        });
    } finally {
        rmSync(folder, {recursive: true});
    }
    console.log(`${programs.length} programs`);
});
