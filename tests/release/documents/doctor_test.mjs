// Each check of the doctor is told in its chapter, once, and none that it does not make.
import assert from 'node:assert/strict';
import {execFileSync} from 'node:child_process';
import {test} from 'node:test';

import {codeSpans, differences, filesMatching, NO_DIFFERENCES, PROJECT, read, tableRows} from './documents.mjs';

const sources = filesMatching('doctor/*.cpp').map(read).join('\n');

/** The ids that stand in the sources, and those that are put together there. */
function ids() {
    const groups = 'profile|client|discovery|authorization_endpoint|keys|token_endpoint|token|directory|state|login';
    const whole = [...sources.matchAll(new RegExp(`"((?:${groups})\\.[a-z_]+)"`, 'g'))].map(([, id]) => id);
    const keys = [...sources.matchAll(/^ +\{"([a-z_]+)", Kind::/gm)].map(([, key]) => `client.${key}`);
    const endpoints = [...sources.matchAll(/CheckEndpoint\("([a-z_]+)"/g)].map(([, member]) => `discovery.${member}`);
    const transfers = [...sources.matchAll(/CheckTransfer\("([a-z_]+)"/g)].flatMap(([, id]) =>
        [`${id}.reachable`, `${id}.certificate`]);
    assert.ok(keys.length > 10 && endpoints.length === 3 && transfers.length === 8);
    return [...new Set([...whole, ...keys, ...endpoints, ...transfers, 'clock'])];
}

test('each check is told, once, and none that is not made', () => {
    const rows = tableRows('docs/doctor.md').filter(({header}) => header[0] === 'id');
    const told = rows.flatMap(({cells}) => codeSpans(cells[0]));
    assert.ok(told.length > 40, `${told.length} checks`);
    assert.deepEqual(differences({told, real: ids()}), NO_DIFFERENCES);
    console.log(`${told.length} checks`);
});

test('each command is told in its chapter and in the manual page and is completed, and none that is not one', () => {
    const real = [...sources.matchAll(/\badd_subcommand\("([a-z-]+)"/g)].map(([, command]) => command);
    assert.ok(real.length > 2, `${real.length} commands`);
    const manual = read('docs/man/tavosso-doctor.8');
    const [, list] = /^The commands are:\n([^]*?)^\.El$/m.exec(manual);
    const completion = read('doctor/completion.bash');
    const [, recognised] = /^ *(\w+(?: \| \w+)+)\) command=/m.exec(completion);
    const [, offered] = /^ *''\) choices\+=' ([^']*)'/m.exec(completion);
    const places = {
        chapter: tableRows('docs/doctor.md').filter(({header}) => header[0] === 'command')
            .flatMap(({cells}) => codeSpans(cells[0])[0].match(/(?<=^tavosso-doctor )[a-z-]+/) ?? []),
        synopsis: manual.match(/(?<=^\.Op Ar options\n\.Cm )[a-z-]+/gm),
        description: list.match(/(?<=^\.It Cm )[a-z-]+/gm),
        recognised: recognised.split(' | '),
        offered: offered.split(' '),
    };
    for (const [place, told] of Object.entries(places)) {
        assert.deepEqual({place, ...differences({told, real})}, {place, ...NO_DIFFERENCES});
    }
});

test('each option is told in the manual page and can be completed, and none that is not one', () => {
    const real = [...sources.matchAll(/(?:flag|option)\("(--[a-z-]+)"/g)].map(([, option]) => option).concat('--help');
    assert.ok(real.length > 8, `${real.length} options`);
    const manual = read('docs/man/tavosso-doctor.8');
    const told = [...manual.matchAll(/^\.It Fl -([a-z-]+)/gm)].map(([, name]) => `--${name}`);
    const inSynopsis = [...manual.matchAll(/^\.Op Fl -([a-z-]+)/gm)].map(([, name]) => `--${name}`);
    assert.deepEqual(differences({told: [...told, ...inSynopsis], real}), NO_DIFFERENCES);
    const completed = [...new Set(read('doctor/completion.bash').match(/--[a-z-]+(?=[' ])/g))];
    assert.deepEqual(differences({told: completed, real}), NO_DIFFERENCES);
});

test('bash completes commands, options and files', () => {
    const script = 'source doctor/completion.bash; COMP_WORDS=(tavosso-doctor "$@"); COMP_CWORD=$#;' +
        ' _tavosso_doctor 2>/dev/null; echo "${COMPREPLY[*]}"';
    const complete = (...words) =>
        execFileSync('bash', ['-c', script, 'bash', ...words], {cwd: PROJECT, encoding: 'utf8'}).trim();
    assert.equal(complete('to'), 'token');
    assert.equal(complete('--js'), '--json');
    assert.equal(complete('token', '--f'), '--fetch');
    assert.equal(complete('login', '--f'), '');
    assert.equal(complete('token', 'READ'), 'README.md');
    assert.equal(complete('--user', 'roo'), 'root');
});
