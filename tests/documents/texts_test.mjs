// Each text that is logged or thrown is told in the documents, once, and none that is not.
import assert from 'node:assert/strict';
import {execFileSync} from 'node:child_process';
import {test} from 'node:test';

import {isCommand} from './commands.mjs';
import {blocks, codeSpans, differences, documents, NO_DIFFERENCES, proseLines, tableRows} from './documents.mjs';
import {frontEndReasons, logFormats, loggedBy, thrownTexts} from './sources.mjs';

const formats = logFormats();
const thrown = thrownTexts();
const spans = documents.flatMap(proseLines).flatMap(({document, line, text}) =>
    codeSpans(text).map((span) => ({document, line, span})));

// Spans with a blank in them that are neither a text of ours nor a command.
const OTHER = [
    '/* */', '--user NAME', '== passed', '[ -- ]', '[ ok ]', 'Cache-Control: no-store', 'Location: ',
    'OIDCLogin(code, user)', 'Referrer-Policy: no-referrer', 'TimeOut 60', 'find_package(tavosso REQUIRED)', 'frame-ancestors \'none\'',
    'libgtest-dev libgmock-dev', 'project(tavosso VERSION ...)', 'target_link_libraries(sso.cgi PRIVATE tavosso::tavosso)',
];

const logRows = tableRows('docs/operations.md').filter(({header}) => header.join() === 'line,level,cause,remedy');
const curlTexts = tableRows('docs/operations.md').filter(({header}) => header[0] === 'CURL').map(({cells}) => cells[0]);

test('each log line of the sources is told, once, with its level, and none that cannot be logged', () => {
    assert.ok(formats.length > 15 && logRows.length > 10, `${formats.length} formats, ${logRows.length} rows`);
    const told = logRows.flatMap(({cells}) => codeSpans(cells[0]).map((line) => ({line, level: cells[1]})));
    const by = told.flatMap(({line}) => loggedBy(line)).map(({format, source}) => source + format);
    assert.deepEqual(told.filter(({line, level}) => !loggedBy(line).some((format) => format.level === level)), []);
    assert.deepEqual(formats.filter(({format, source}) => !by.includes(source + format)), []);
    const lines = told.map(({line}) => line);
    assert.deepEqual(lines.filter((line, index) => lines.indexOf(line) !== index), []);
    console.log(`${formats.length} formats, ${lines.length} lines`);
});

test('what is told of libcurl is what libcurl says', () => {
    const folder = execFileSync('pkg-config', ['--variable=libdir', 'libcurl'], {encoding: 'utf8'}).trim();
    const strings = execFileSync('strings', [`${folder}/libcurl.so`], {encoding: 'utf8', maxBuffer: 1 << 26}).split('\n');
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
    const isKnown = (span) => thrown.some(({text}) => text === span) || loggedBy(span).length > 0 ||
        parts.includes(span) || isCommand(span) || OTHER.includes(span);
    const quoted = spans.filter(({span}) => span.includes(' '));
    assert.ok(quoted.length > 80);
    assert.deepEqual(quoted.filter(({span}) => !isKnown(span)), []);
    assert.deepEqual(OTHER.filter((other) => !quoted.some(({span}) => span === other)), []);
});

test('each reason of the front end is told, once, and none that it never gives', () => {
    const rows = tableRows('docs/operations.md').filter(({header}) => header[0] === 'reason');
    const told = rows.flatMap(({cells}) => cells[0].split('<br>'))
        .map((text) => text.replace(/: SYSTEM$| ERROR .*| (state|code)\.$/, ''));
    assert.ok(told.length > 8);
    assert.deepEqual(differences({told: [...new Set(told)], real: frontEndReasons()}), NO_DIFFERENCES);
});
