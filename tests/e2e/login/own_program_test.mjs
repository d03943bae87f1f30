// The README's program with the provider of `./demo provider`. Runs as root of private namespaces.
import assert from 'node:assert/strict';
import {spawn, spawnSync} from 'node:child_process';
import {once} from 'node:events';
import {copyFileSync, mkdirSync, mkdtempSync, readFileSync, rmSync, writeFileSync} from 'node:fs';
import {createInterface} from 'node:readline';
import {fileURLToPath} from 'node:url';
import {after, afterEach, describe, test} from 'node:test';

import {makeAuthority} from '../site/certificate_authority.mjs';
import {collectSystemLog} from '../site/syslog_collector.mjs';
import {Browser} from './browser.mjs';

const [webroot, nodeModules] = process.argv.slice(2);
const PROGRAM = `${webroot}/webman/sso/sso.cgi`;
const PROVIDER = fileURLToPath(new URL('../site/serve_provider.mjs', import.meta.url));
const REDIRECT_URI = 'https://localhost/webman/sso/sso.cgi';
const SYSTEM_BUNDLE = '/etc/ssl/certs/ca-certificates.crt';

/** Starts the provider. Returns its process, the certificate of its authority, and the passwords that it prints. */
async function startProvider(profile) {
    const server = spawn('node', [PROVIDER, '--node-modules', nodeModules, '--redirect-uri', REDIRECT_URI,
        '--profile', profile, '--etc', '/usr/tavo/etc'], {stdio: ['ignore', 'pipe', 'inherit']});
    const passwords = new Map();
    let authority;
    for await (const line of createInterface(server.stdout)) {
        authority ??= /^ {2}authority +(\S+)$/.exec(line)?.[1];
        const [, login, password] = /^ {2}(\w+) +password (\S+)/.exec(line) ?? [];
        passwords.set(login, password);
        if (login === 'bob') { // the last one
            break;
        }
    }
    copyFileSync(authority, SYSTEM_BUNDLE);
    mkdirSync('/usr/tavo/var', {recursive: true}); // the program creates its folder here
    return {server, passwords, authority: readFileSync(authority)};
}

/** Runs the program. Returns the headers of its answer. */
function ask(query, cookie = '') {
    const {stdout} = spawnSync(PROGRAM, {
        encoding: 'utf8', env: {REQUEST_METHOD: 'GET', QUERY_STRING: query, HTTP_COOKIE: cookie},
    });
    return Object.fromEntries(stdout.trim().split('\n').map((line) => line.split(/: (.*)/s).slice(0, 2)));
}

const cookieOf = (answer) => answer['Set-Cookie'].split(';')[0];
const csrfOf = ({parameters}) => JSON.parse(Buffer.from(parameters.get('state'), 'base64').toString()).csrf;
const isReturn = (url) => url.href.startsWith(REDIRECT_URI);

describe('The README\'s program', async () => {
    const log = await collectSystemLog(() => {});
    const folder = mkdtempSync('/tmp/own-program-');
    let provider;
    after(() => log.stop());
    afterEach(() => provider.server.kill('SIGINT'));

    /** Signs a user in at the provider. Returns the query and cookie of the return address. */
    async function signIn(login) {
        const browser = new Browser(provider.authority, () => {});
        const start = ask('');
        const form = await browser.open(start.Location);
        const {next} = await browser.submit(form, {login, password: provider.passwords.get(login)}, isReturn);
        return {query: next.search.slice(1), parameters: next.searchParams, cookie: cookieOf(start)};
    }

    async function isRefused(query, cookie, code) {
        assert.match(ask(query, cookie).Location, /success=false$/);
        await log.until(new RegExp(`^sso\\.cgi: sign-in failed \\(${code}\\): `));
    }

    for (const profile of ['azure', 'websphere']) {
        test(`signs users in and resists attacks (${profile})`, async () => {
            provider = await startProvider(profile);
            const alice = await signIn('alice');
            const bob = await signIn('bob');
            await isRefused(alice.query, '', 'other_browser');
            await isRefused(alice.query, bob.cookie, 'other_browser');
            await isRefused(alice.query, `__Host-login-0=${csrfOf(alice)}`, 'other_browser');
            const stolenCode = new URLSearchParams({code: alice.parameters.get('code'), state: bob.parameters.get('state')});
            await isRefused(stolenCode.toString(), bob.cookie, 'other_login');
            await isRefused(bob.query, bob.cookie, 'login_expired');
            const carol = await signIn('alice');
            assert.match(ask(carol.query, carol.cookie).Location, /success=true$/);
            await isRefused(carol.query, carol.cookie, 'login_expired');
        });
    }

    test('distinguishes network from certificate errors', async () => {
        provider = await startProvider('azure');
        const first = await signIn('alice');
        const second = await signIn('alice');
        copyFileSync(makeAuthority(folder).file, SYSTEM_BUNDLE);
        await isRefused(first.query, first.cookie, 'certificate');
        const ended = once(provider.server, 'exit');
        provider.server.kill('SIGINT');
        await ended;
        await isRefused(second.query, second.cookie, 'network');
    });

    test('keeps the page to return to', async () => {
        provider = await startProvider('azure');
        const {Location: address} = ask('origin=%2Ffiles');
        const state = new URL(address).searchParams.get('state');
        assert.equal(JSON.parse(Buffer.from(state, 'base64').toString()).origin, '/files');
    });

    test('reports missing configuration', async () => {
        provider = await startProvider('azure');
        const alice = await signIn('alice');
        rmSync('/usr/tavo/etc/ssoclient/azure.conf');
        await isRefused('', '', 'not_set_up');
        await isRefused(alice.query, alice.cookie, 'not_set_up');
        writeFileSync('/usr/tavo/etc/ssoclient/profile.conf', '{"sso_enable": false}');
        await isRefused('', '', 'switched_off');
    });
});
