// Follows the guide's recipes for providers that run here, and signs in through each. Runs as root of private
// namespaces.
import assert from 'node:assert/strict';
import {spawnSync} from 'node:child_process';
import {mkdtempSync, readFileSync, rmSync, symlinkSync, writeFileSync} from 'node:fs';
import {after, afterEach, describe, test} from 'node:test';

import {Browser} from '../login/browser.mjs';
import {makeAuthority} from '../site/certificate_authority.mjs';
import {listen, startWebServer, useProfile} from '../site/front_end.mjs';
import {collectSystemLog} from '../site/syslog_collector.mjs';
import {blocks, run} from './recipe.mjs';

const SYSTEM_BUNDLE = '/etc/ssl/certs/ca-certificates.crt';

const [webroot, nodeModules, doctor] = process.argv.slice(2);

async function signInAtOidcProvider(browser, page) {
    const consent = await browser.submit(page, {login: 'alice', password: 'any'});
    await browser.submit(consent, {});
}

// The page's script sends these requests.
async function signInAtGlewlwyd(browser, page, values) {
    const {origin, searchParams} = page.url;
    const credentials = {username: 'alice', password: values.get('user_password')};
    await browser.requestWithJson('POST', new URL('/api/auth/', origin), credentials);
    const grant = new URL(`/api/auth/grant/${values.get('client_id')}`, origin);
    await browser.requestWithJson('PUT', grant, {scope: 'openid'});
    await browser.open(`${searchParams.get('callback_url')}&g_continue`);
}

const RECIPES = [
    {provider: 'oidc-provider', profile: 'azure', signedIn: /signed in: ACME\\alice$/, signIn: signInAtOidcProvider},
    {provider: 'oidc-provider', profile: 'websphere', signedIn: /signed in: alice$/, signIn: signInAtOidcProvider, algorithm: 'HS256'},
    {provider: 'glewlwyd', profile: 'azure', signedIn: /signed in: ACME\\alice$/, signIn: signInAtGlewlwyd, names: ['user_password']},
];

/** A port that is free in this network namespace, whose only user is this test. */
async function freePort() {
    const socket = await listen();
    const {port} = socket.address();
    socket.close();
    return port;
}

describe('The recipe', async () => {
    const folder = mkdtempSync('/tmp/recipes-');
    const authority = makeAuthority(folder);
    const log = await collectSystemLog(() => {});
    const socket = await listen();
    const appliance = `localhost:${socket.address().port}`;
    const webServer = startWebServer({socket, webroot, certificate: authority.issue('appliance', 'DNS:localhost'), folder});
    let provider;
    afterEach(() => provider?.stop());
    after(async () => {
        await webServer.stop();
        log.stop();
    });

    async function follow({provider: name, names = [], algorithm = 'RS256'}) {
        const place = mkdtempSync('/tmp/provider-');
        if (name === 'oidc-provider') {
            symlinkSync(nodeModules, `${place}/node_modules`);
            writeFileSync(`${place}/provider.mjs`, blocks(name, 'js').join('\n'));
        }
        rmSync('/usr/tavo/etc', {recursive: true, force: true});
        const replacements = [
            ['8443', String(await freePort())],
            ['idp.example.com', 'localhost'],
            ['nas.example.com', appliance],
            ['RS256', algorithm],
        ];
        const commands = [...blocks('A test provider', 'sh'), ...blocks(name, 'sh')];
        provider = await run({commands, folder: place, replacements, names: ['client_id', ...names]});
        writeFileSync(SYSTEM_BUNDLE, [authority.file, `${place}/cert.pem`].map((file) => readFileSync(file)).join(''));
        return provider.values;
    }

    for (const recipe of RECIPES) {
        test(`for ${recipe.provider} signs in (${recipe.profile})`, async () => {
            const values = await follow(recipe);
            useProfile(recipe.profile);
            const {stdout, status} = spawnSync(doctor, ['--domain', 'alice@corp.example.net'], {encoding: 'utf8'});
            console.log(`\n== ${recipe.provider}, ${recipe.profile}\n${stdout}`);
            assert.match(stdout, /^No findings\.$/m);
            assert.equal(status, 0);
            const browser = new Browser(readFileSync(SYSTEM_BUNDLE), () => {});
            const page = await browser.open(`https://${appliance}/webman/sso/login.cgi`);
            await recipe.signIn(browser, page, values);
            await log.until(recipe.signedIn);
        });
    }
});
