// Each command that the documents tell their readers to run is run, on a bare Debian, by a user who may use sudo.
import assert from 'node:assert/strict';
import {execFileSync, spawnSync} from 'node:child_process';
import {mkdtempSync, rmSync, writeFileSync} from 'node:fs';
import {tmpdir} from 'node:os';
import path from 'node:path';
import {test} from 'node:test';

import {count, countWithOutput, needless, otherTexts, script} from './commands.mjs';
import {differences, NO_DIFFERENCES, PROJECT, read} from './documents.mjs';

test('nothing is left out that no document names', () => assert.deepEqual(needless, []));

test('the help of ./check tells each of its parts', () => {
    const help = execFileSync('./check', ['--help'], {cwd: PROJECT, encoding: 'utf8'});
    const [, kinds] = /a part by itself: ([^]*?)\n {2}[a-z]/.exec(help);
    const told = [...help.matchAll(/^ {2}([a-z]+) /gm)].map(([, part]) => part).concat(kinds.split(/,\s+|\s+and\s+/));
    const real = [...read('check').matchAll(/^(?:whole|kinds|longer)=\((.*)\)$/gm)]
        .flatMap(([, parts]) => parts.split(' '));
    assert.ok(real.length > 15);
    assert.deepEqual(differences({told, real}), NO_DIFFERENCES);
});

test('each block of text is a command, what one prints, or what another test reads', () => {
    const isLog = ({text}) => text.split('\n').every((line) => /^\S+\[\d+\]: /.test(line)); // texts_test.mjs
    const isTranscript = ({text}) => text.startsWith('\nProfile\n'); // transcript.mjs, which looks for one
    assert.deepEqual(otherTexts.filter((block) => !isLog(block) && !isTranscript(block)), []);
    assert.equal(otherTexts.filter(isTranscript).length, 1);
});

test(`each of ${count} commands and blocks of commands works`, () => {
    assert.ok(count > 20 && countWithOutput > 2);
    const folder = mkdtempSync(path.join(tmpdir(), 'commands-'));
    try {
        writeFileSync(path.join(folder, 'commands'), script());
        // What is committed, and over it what is not yet.
        execFileSync('git', ['clone', '--quiet', PROJECT, path.join(folder, 'tavosso')]);
        execFileSync('sh', ['-c', 'git ls-files -z --cached --others --exclude-standard | ' +
        'tar --null --files-from=- --ignore-failed-read --create | tar --extract --directory="$0"',
        path.join(folder, 'tavosso')], {cwd: PROJECT});
        const run = spawnSync('tests/release/package/machine', ['--user', 'ada', '--copy', folder, '/home/ada/work',
            '/home/ada/work/tavosso/tests/documents/run_commands', '/home/ada/work/commands'],
        {cwd: PROJECT, stdio: ['ignore', 'inherit', 'inherit']});
        assert.equal(run.status, 0, 'the last line above that begins with FAILED tells which');
    } finally {
        rmSync(folder, {recursive: true});
    }
});
