// Runs the commands of the quick start verbatim on a bare Debian, as a user with sudo.
import assert from 'node:assert/strict';
import {execFileSync, spawnSync} from 'node:child_process';
import {mkdtempSync, rmSync, writeFileSync} from 'node:fs';
import {tmpdir} from 'node:os';
import path from 'node:path';
import {test} from 'node:test';

import {blocks, PROJECT} from './documents.mjs';

const DOCUMENT = 'docs/quick-start.md';

/** The command blocks, each with the output that the next text block shows. */
function commandsWithOutput() {
    const all = blocks(DOCUMENT);
    return all.flatMap(({language, line, text}, index) => {
        const next = all[index + 1];
        return language === 'sh' ? [{line, text, output: next?.language === 'text' ? next.text : ''}] : [];
    });
}

const quoted = (text) => `'${text.replaceAll('\'', '\'\\\'\'')}'`;

/** A grep pattern; "..." matches any text. */
const pattern = (text) => text.replace(/[.*[\]^$\\]/g, '\\$&').replaceAll('\\.\\.\\.', '.*');

function script(commands) {
    const run = commands.map(({line, text, output}) => [
        `echo "${DOCUMENT}:${line}"`,
        // apt asks for confirmation.
        `bash -e -o pipefail -c ${quoted(text)} >../log 2>&1 < <(yes | head -n 100) || { tail -n 40 ../log; exit 1; }`,
        ...output.split('\n').filter(Boolean).map((expected) =>
            `grep -x ${quoted(pattern(expected))} ../log >/dev/null || { echo "missing: "${quoted(expected)}; exit 1; }`),
    ]);
    return ['cd /home/ada/tavosso', ...run.flat()].join('\n');
}

test('the commands of the quick start work on a bare Debian', () => {
    const commands = commandsWithOutput();
    assert.ok(commands.length > 4);
    const folder = mkdtempSync(path.join(tmpdir(), 'quick-start-'));
    try {
        execFileSync('sh', ['-c', 'git ls-files -z | tar --null --files-from=- --create | tar --extract --directory="$0"',
            folder], {cwd: PROJECT});
        writeFileSync(path.join(folder, 'quick_start.sh'), script(commands));
        const {status} = spawnSync('tests/release/package/machine', ['--user', 'ada', '--copy', folder,
            '/home/ada/tavosso', 'bash', '/home/ada/tavosso/quick_start.sh'],
        {cwd: PROJECT, stdio: ['ignore', 'inherit', 'inherit']});
        assert.equal(status, 0);
    } finally {
        rmSync(folder, {recursive: true});
    }
});
