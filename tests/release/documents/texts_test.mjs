// Each text that is logged or thrown is told in the documents, once, and none that is not.
import assert from 'node:assert/strict';
import {execFileSync} from 'node:child_process';
import {test} from 'node:test';

import {displayed, isCommand} from './commands.mjs';
import {
    blocks, codeSpans, differences, documents, filesMatching, NO_DIFFERENCES, proseLines, quotations, read, tableRows,
} from './documents.mjs';
import {frontEndReasons, level, logFormats, loggedBy, referenceComments, thrownTexts, unseenForms} from './sources.mjs';

const formats = logFormats();
const thrown = thrownTexts();
const spans = documents.flatMap(proseLines).flatMap(({document, line, text}) =>
    codeSpans(text).map((span) => ({document, line, text: span})));

// What is quoted with a blank in it, and is neither a text of ours nor a command.
const OTHER = [
    '/* */', '--user NAME', '0 tests', '== passed', '[ -- ]', '[ ok ]', '[VERSION] - YYYY-MM-DD',
    'Cache-Control: no-store', 'Conflicts: libtavoplatform-abi-0', 'ERROR: LEAVECriticalSection', 'Keep a Changelog',
    'Location: ', 'OIDCLogin(code, user)', 'On request', 'Provides: libtavoplatform-abi-0',
    'Referrer-Policy: same-origin', 'Refuse a token whose clock cannot be read', 'Replaces: libtavoplatform-abi-0',
    'TimeOut 60', 'a id_token', 'find_package(tavosso REQUIRED)', 'frame-ancestors \'none\'',
    'libgtest-dev libgmock-dev', 'libtavoplatform0 | libtavoplatform-abi-0', 'not support', 'openid profile email',
    'project(tavosso VERSION ...)', 'target_link_libraries(sso.cgi PRIVATE tavosso::tavosso)', 'typeinfo name',
];

const logRows = tableRows('docs/operations.md').filter(({header}) => header.join() === 'line,level,cause,remedy');
const curlTexts = tableRows('docs/operations.md').filter(({header}) => header[0] === 'CURL').map(({cells}) => cells[0]);

test('the sources log and throw in the forms that are looked at here', () => {
    assert.deepEqual(unseenForms(), []);
});

test('each log line of the sources is told, once, with its level, and none that cannot be logged', () => {
    assert.ok(formats.length > 15 && logRows.length > 10, `${formats.length} formats, ${logRows.length} rows`);
    const told = logRows.flatMap(({cells}) => codeSpans(cells[0]).map((line) => ({line, byTable: cells[1]})));
    const by = told.flatMap(({line}) => loggedBy(line)).map(({format, source}) => source + format);
    assert.deepEqual(told.filter(({line, byTable}) => !loggedBy(line).some((format) => format.level === byTable)), []);
    assert.deepEqual(formats.filter(({format, source}) => !by.includes(source + format)), []);
    const lines = told.map(({line}) => line);
    assert.deepEqual(lines.filter((line, index) => lines.indexOf(line) !== index), []);
    console.log(`${formats.length} formats, ${lines.length} lines`);
});

test('what is told of libcurl is what libcurl says', () => {
    const folder = execFileSync('pkg-config', ['--variable=libdir', 'libcurl'], {encoding: 'utf8'}).trim();
    const strings = execFileSync('strings', [`${folder}/libcurl.so`], {encoding: 'utf8', maxBuffer: 1 << 26})
        .split('\n');
    assert.ok(curlTexts.length > 5);
    assert.deepEqual(curlTexts.filter((text) => !strings.includes(text)), []);
});

test('each line of log that is shown as an example can be logged', () => {
    const shown = documents.flatMap(blocks).filter(({language}) => language === 'text').flatMap(({document, text}) =>
        [...text.matchAll(/^\S+\[\d+\]: (.*)$/gm)].map(([, line]) => ({document, line})));
    assert.ok(shown.length > 1);
    assert.deepEqual(shown.filter(({line}) => loggedBy(line, '\\d+', curlTexts).length === 0), []);
});

const textRows = tableRows('docs/integration.md').filter(({heading}) => heading === 'What an exception means');

test('each text that is thrown is told, once, with its class, and none that is not', () => {
    const told = textRows.flatMap(({cells: [texts, classes]}) =>
        codeSpans(texts).map((text) => ({text, classes: codeSpans(classes)})));
    const real = [...new Set(thrown.map(({text}) => text))];
    assert.ok(real.length > 25, `${real.length} texts`);
    assert.deepEqual(differences({told: told.map(({text}) => text), real}), NO_DIFFERENCES);
    assert.deepEqual(thrown.filter(({text, type}) =>
        !told.find((row) => row.text === text).classes.includes(type)), []);
    console.log(`${real.length} texts`);
});

test('whatever else is quoted with a blank in it is one of these texts, a part of one, or a command', () => {
    const parts = formats.flatMap(({format}) => format.split(/%[sdm]|:/).concat(format.replace('%s:%d ', '')))
        .map((part) => part.trim()).filter((part) => part.includes(' '));
    // What the other programs show, in whole: of these it is enough that it stands there.
    const programs = filesMatching('doctor/*.cpp', 'frontend/*.cpp', 'frontend/*.js', 'platform/*.cpp')
        .map(read).join('\n');
    const isKnown = (quoted) => thrown.some(({text}) => [quoted, `ALG${quoted}`].includes(text)) ||
        loggedBy(quoted).length > 0 || parts.includes(quoted) || curlTexts.includes(quoted) || isCommand(quoted) ||
        [`"${quoted}"`, `'${quoted}'`].some((literal) => programs.includes(literal)) || OTHER.includes(quoted);
    const quoted = [...spans, ...documents.flatMap(quotations), ...displayed].filter(({text}) => text.includes(' '));
    assert.ok(quoted.length > 120, `${quoted.length} texts`);
    assert.deepEqual(quoted.filter(({text}) => !isKnown(text)), []);
    assert.deepEqual(OTHER.filter((other) => !quoted.some(({text}) => text === other)), []);
});

test('each reason of the front end is told, once, and none that it never gives', () => {
    const rows = tableRows('docs/operations.md').filter(({header}) => header[0] === 'reason');
    const told = rows.flatMap(({cells}) => cells[0].split('<br>'))
        .map((text) => text.replace(/: SYSTEM$| ERROR .*| (state|code)\.$/, ''));
    assert.ok(told.length > 8);
    assert.deepEqual(differences({told: [...new Set(told)], real: frontEndReasons()}), NO_DIFFERENCES);
});

/** What a comment quotes that has a blank in it, with the comment's text before and behind it. */
const inReference = referenceComments.flatMap(({file, text}) => [...text.matchAll(/"([^"]*)"/g)].map((found) =>
    ({file, quoted: found[1], before: text.slice(0, found.index), behind: text.slice(found.index + found[0].length)})))
    .filter(({quoted}) => quoted.includes(' '));

test('each text that the reference quotes is thrown or logged, and it quotes each of the library\'s', () => {
    const told = [...new Set(inReference.map(({quoted}) => quoted))];
    const others = ['SOURCE:LINE ', 'Location: ', 'openid profile email'];
    assert.deepEqual(told.filter((text) => !thrown.some((each) => each.text === text) &&
        loggedBy(text, 'LINE').length === 0), others);
    const logged = told.flatMap((text) => loggedBy(text, 'LINE')).map(({format, source}) => source + format);
    // The stand-in is no part of the library, nor is the front end.
    assert.deepEqual(formats.filter(({format, source, file}) => !/^(platform|frontend)\//.test(file) &&
        !logged.includes(source + format)), []);
    assert.deepEqual(thrown.filter(({text}) => !told.includes(text) &&
        !told.some((line) => line.endsWith(`:LINE ${text}`))), []);
    console.log(`${told.length} texts in the reference`);
});

test('each text that the reference says is thrown is thrown as that class', () => {
    const told = inReference.flatMap(({file, quoted, before}) => {
        const [, type] = /@throws (\S+)[^@]*$/.exec(before) ?? [];
        return type === undefined || quoted.includes(':LINE ') ? [] : [{file, quoted, type}];
    });
    assert.ok(told.length > 40, `${told.length} texts`);
    assert.deepEqual(told.filter(({quoted, type}) =>
        !thrown.some((each) => each.text === quoted && type.endsWith(each.type))), []);
});

test('each log line in the reference has the level that stands before it, or else behind it', () => {
    const names = /LOG_(?:ERR|WARNING|INFO)/g;
    const told = inReference.filter(({quoted}) => /:LINE ./.test(quoted)).map(({file, quoted, before, behind}) => {
        const name = before.match(names)?.at(-1) ?? behind.match(names)?.[0];
        return {file, quoted, level: name && level(before.includes('LOG_AUTH') ? `${name} LOG_AUTH` : name)};
    });
    assert.ok(told.length > 15, `${told.length} lines`);
    assert.deepEqual(told.filter((line) =>
        !loggedBy(line.quoted, 'LINE').some((format) => format.level === line.level)), []);
});
