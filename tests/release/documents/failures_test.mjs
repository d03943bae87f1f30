// Verifies that the failure tables in the documents are those of `tavosso-doctor explain --list --markdown`, that their
// texts are in the sources, and that the doctor explains the log lines in the documents.
//
//   node failures_test.mjs DOCTOR            fails if they differ
//   node failures_test.mjs DOCTOR --update   writes the tables into the documents
import assert from 'node:assert/strict';
import {execFileSync} from 'node:child_process';
import {writeFileSync} from 'node:fs';
import path from 'node:path';

import {blocks, documents, filesMatching, PROJECT, read} from './documents.mjs';

const TABLE = /<!-- failures: [^]*?<!-- end -->\n/g;
const beginning = (table) => table.split('\n')[0];

const [doctor, update] = process.argv.slice(2);
const explain = (...options) => execFileSync(doctor, ['explain', '--list', ...options], {encoding: 'utf8'});

const printed = new Map(explain('--markdown').match(TABLE).map((table) => [beginning(table), table]));
const shown = [];
for (const document of documents) {
    const before = read(document);
    const after = before.replace(TABLE, (table) => {
        shown.push(beginning(table));
        return printed.get(beginning(table)) ?? assert.fail(`${document}: no such table: ${beginning(table)}`);
    });
    if (update) {
        writeFileSync(path.join(PROJECT, document), after);
    } else {
        assert.equal(before, after, `${document} differs. Run this script with --update.`);
    }
}
assert.deepEqual(shown.sort(), [...printed.keys()].sort());

const isSource = (file) => !/^(?:bench|doctor|examples|tests)\//.test(file);
const sources = filesMatching('*.cpp', '*.h').filter(isSource).map(read).join('\n').replaceAll('\\"', '"');
const {explanations} = JSON.parse(explain('--json'));
const FOREIGN = ['CURL', 'a text of another library', 'std::bad_alloc', '{... "error": ...}'];
// Composed of several texts; unit tests compare these lines.
const isComposed = (about) => /setres[ug]id|\.\.$/.test(about);
const texts = explanations.filter(({about, table}) =>
    !['results of libcurl', 'error codes of the provider'].includes(table) && !FOREIGN.includes(about) && !isComposed(about)).map(({about}) => about);
/** Whether the sources contain the text between the placeholders. The prefix is composed from "%s:%d". */
const isInSource = (about) => about.replace(/^\w+:N /, '').split(/\b[A-Z]{3,6}\b/)
    .every((piece) => sources.includes(piece.replace(/: $/, '')));
assert.ok(texts.length > 80, `${texts.length} texts`);
assert.deepEqual(texts.filter((about) => !isInSource(about)), []);

const examples = documents.flatMap(blocks).filter(({language}) => language === 'text')
    .flatMap(({text}) => text.match(/^\S+\[\d+\]: .*$/gm) ?? []);
assert.ok(examples.length > 1);
for (const line of examples) {
    execFileSync(doctor, ['explain', line]); // fails if it does not explain the line
}
console.log(`${shown.length} tables, ${texts.length} texts`);
