// A program of one's own beside the provider that `./demo provider` serves: the program of the README signs users in.
// Runs as root of private namespaces.
import assert from 'node:assert/strict';
import {spawn, spawnSync} from 'node:child_process';
import {copyFileSync, readFileSync} from 'node:fs';
import {createInterface} from 'node:readline';
import {fileURLToPath} from 'node:url';
import {after, describe, test} from 'node:test';

import {Browser} from './browser.mjs';

const [webroot, nodeModules] = process.argv.slice(2);
const PROGRAM = `${webroot}/webman/sso/sso.cgi`;
const PROVIDER = fileURLToPath(new URL('../site/serve_provider.mjs', import.meta.url));
const REDIRECT_URI = 'https://localhost/webman/sso/sso.cgi';
const SYSTEM_BUNDLE = '/etc/ssl/certs/ca-certificates.crt';

/** Starts the provider; gives its process, its authority's certificate, and the users' passwords, as it prints them. */
async function startProvider(profile) {
    const server = spawn('node', [PROVIDER, '--node-modules', nodeModules, '--redirect-uri', REDIRECT_URI,
        '--profile', profile, '--etc', '/usr/tavo/etc'], {stdio: ['ignore', 'pipe', 'inherit']});
    const passwords = new Map();
    let authority;
    for await (const line of createInterface(server.stdout)) {
        authority ??= /^ {2}authority +(\S+),/.exec(line)?.[1];
        const [, login, password] = /^ {2}(\w+) +password (\S+)/.exec(line) ?? [];
        passwords.set(login, password);
        if (login === 'bob') { // the last one
            break;
        }
    }
    copyFileSync(authority, SYSTEM_BUNDLE);
    return {server, passwords, authority: readFileSync(authority)};
}

/** The headers of the program's answer to a request. */
function ask(query, cookie = '') {
    const {stdout} = spawnSync(PROGRAM, {
        encoding: 'utf8', env: {REQUEST_METHOD: 'GET', QUERY_STRING: query, HTTP_COOKIE: cookie},
    });
    return Object.fromEntries(stdout.trim().split('\n').map((line) => line.split(/: (.*)/s).slice(0, 2)));
}

describe('A program of one\'s own', () => {
    const servers = [];
    after(() => servers.forEach((server) => server.kill('SIGINT')));

    for (const profile of ['azure', 'websphere']) {
        test(`signs a user in under profile ${profile}`, async () => {
            const {server, passwords, authority} = await startProvider(profile);
            servers.push(server);
            const browser = new Browser(authority, () => {});
            const start = ask('');
            const form = await browser.open(start.Location);
            const isReturn = (url) => url.href.startsWith(REDIRECT_URI);
            const {next} = await browser.submit(form, {login: 'alice', password: passwords.get('alice')}, isReturn);
            const cookie = start['Set-Cookie'].split(';')[0];
            assert.match(ask(next.search.slice(1)).Location, /success=false$/); // without its cookie
            assert.match(ask(next.search.slice(1), cookie).Location, /success=true$/);
        });
    }
});
