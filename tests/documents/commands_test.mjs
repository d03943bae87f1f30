// Each command that the documents tell their readers to run is run, on a bare Debian, by a user who may use sudo.
import assert from 'node:assert/strict';
import {spawnSync} from 'node:child_process';
import {mkdtempSync, rmSync, writeFileSync} from 'node:fs';
import {tmpdir} from 'node:os';
import path from 'node:path';
import {test} from 'node:test';

import {count, needless, script} from './commands.mjs';
import {PROJECT} from './documents.mjs';

test('nothing is left out that no document names', () => assert.deepEqual(needless, []));

test(`each of ${count} commands and blocks of commands works`, () => {
    assert.ok(count > 20);
    const folder = mkdtempSync(path.join(tmpdir(), 'commands-'));
    try {
        writeFileSync(path.join(folder, 'commands'), script());
        const run = spawnSync('tests/package/machine', ['--clone', '/home/ada/tavosso', '--user', 'ada',
            '--copy', folder, '/commands', 'tests/documents/run_commands', '/commands/commands'],
        {cwd: PROJECT, stdio: ['ignore', 'inherit', 'inherit']});
        assert.equal(run.status, 0);
    } finally {
        rmSync(folder, {recursive: true});
    }
});
