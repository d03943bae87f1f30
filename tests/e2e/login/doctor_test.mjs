// The doctor with a real OpenID provider: healthy sites of both profiles, a login with its help, and mistakes of
// administrators. Prints the output of the doctor. Runs as root of private namespaces.
import assert from 'node:assert/strict';
import {spawn, spawnSync} from 'node:child_process';
import {chmodSync, copyFileSync, mkdtempSync, readFileSync, rmSync, writeFileSync} from 'node:fs';
import {after, before, beforeEach, describe, test} from 'node:test';

import {useProfile, writeDomains, writeSettings} from '../site/front_end.mjs';
import {makeAuthority} from '../site/certificate_authority.mjs';
import {makeUsers, startSite} from '../site/site.mjs';
import {Browser} from './browser.mjs';

const SETTINGS = '/usr/tavo/etc/ssoclient';
const SYSTEM_BUNDLE = '/etc/ssl/certs/ca-certificates.crt';
const RETURN_PATH = '/webman/sso/return.cgi';
const USERS = {alice: 'alice@corp.example.net', bob: 'bob@corp.example.net'};

const [webroot, nodeModules, doctor] = process.argv.slice(2);

function change(name, changed) {
    const file = `${SETTINGS}/${name}.conf`;
    writeFileSync(file, JSON.stringify(changed(JSON.parse(readFileSync(file, 'utf8'))), null, 4));
}

function rename(settings, from, to) {
    const {[from]: value, ...others} = settings;
    return {...others, [to]: value};
}

/** Mistakes of an administrator, and the check that finds each. */
const MISTAKES = [
    ['removes the profile file', 'azure', 'profile.file', () => rmSync(`${SETTINGS}/profile.conf`)],
    ['leaves a comma after the last key', 'azure', 'profile.file',
        () => writeFileSync(`${SETTINGS}/profile.conf`, '{\n    "sso_enable": true,\n    "sso_profile": "azure",\n}\n')],
    ['writes a string instead of a boolean', 'azure', 'profile.sso_enable',
        () => change('profile', (settings) => ({...settings, sso_enable: 'true'}))],
    ['writes the profile with a capital', 'azure', 'profile.sso_profile',
        () => change('profile', (settings) => ({...settings, sso_profile: 'Azure'}))],
    ['makes the client\'s file readable by all', 'azure', 'client.rights', () => chmodSync(`${SETTINGS}/azure.conf`, 0o644)],
    ['misspells a key', 'azure', 'client.unknown_key',
        () => change('azure', (settings) => rename(settings, 'azure_tenant_id', 'azure_tenantid'))],
    ['names another page as return program', 'websphere', 'client.redirect_uri',
        () => change('websphere', (settings) => ({...settings, websphere_redirect_uri: 'https://localhost/index.cgi'}))],
    ['registers another redirect URI', 'azure', 'authorization_endpoint.request', () => change('azure',
        (settings) => ({...settings, azure_redirect_uri: `https://nas.example.com${RETURN_PATH}`}))],
    ['has an old secret', 'azure', 'token_endpoint.client',
        () => change('azure', (settings) => ({...settings, azure_client_secret: 'that of last year'}))],
    ['has an old secret', 'websphere', 'token_endpoint.client',
        () => change('websphere', (settings) => ({...settings, websphere_client_secret: 'that of last year'}))],
    ['takes the issuer for the discovery document', 'azure', 'discovery.document',
        () => change('azure', (settings) => ({...settings, azure_wellknown: new URL('/', settings.azure_wellknown).href}))],
    ['has another provider\'s token endpoint', 'azure', 'discovery.token_endpoint',
        () => change('azure', (settings) => ({...settings, azure_token_endpoint: `${settings.azure_token_endpoint}/v2`}))],
    ['does not trust the provider\'s authority', 'azure', 'discovery.certificate',
        () => copyFileSync(makeAuthority(mkdtempSync('/tmp/another-')).file, SYSTEM_BUNDLE)],
    ['forgets the table of domains', 'azure', 'directory.source', () => rmSync('/usr/tavo/etc/domains.conf')],
];

describe('The doctor', () => {
    let site;
    before(async () => {
        site = await startSite({webroot, nodeModules, users: makeUsers(USERS), onRequest() {}, onLog() {}});
    });
    after(() => site.stop());
    beforeEach(() => {
        copyFileSync(site.authority, SYSTEM_BUNDLE);
        rmSync('/usr/tavo/etc', {recursive: true}); // including the permissions of its files
        writeDomains({'corp.example.net': 'ACME'});
        writeSettings(site);
    });

    // Not `spawnSync`, because the provider runs in this process.
    async function ask(args = [], talk = () => {}) {
        const child = spawn(doctor, args);
        let printed = '';
        for (const stream of [child.stdout, child.stderr]) {
            stream.setEncoding('utf8').on('data', (text) => {
                printed += text;
                talk(printed, child.stdin);
            });
        }
        const status = await new Promise((resolve) => {
            child.on('close', resolve);
        });
        for (const {secret} of site.clients) {
            assert.ok(!printed.includes(secret), 'the doctor prints a secret');
        }
        return {status, printed};
    }

    for (const profile of ['azure', 'websphere']) {
        test(`reports no findings on a healthy site (${profile})`, async () => {
            useProfile(profile);
            const {status, printed} = await ask(['--domain', 'corp.example.net']);
            console.log(`\n== Healthy, ${profile}\n${printed}`);
            assert.match(printed, /^No findings\.$/m);
            assert.equal(status, 0);
        });
    }

    for (const [mistake, profile, id, happen] of MISTAKES) {
        test(`${id}: an administrator ${mistake} (${profile})`, async () => {
            useProfile(profile);
            happen();
            const {status, printed} = await ask();
            console.log(`\n== An administrator ${mistake} (${profile})\n${printed}`);
            assert.equal(status, 1);
            const {checks} = JSON.parse((await ask(['--json'])).printed);
            assert.equal(checks.find(({mark}) => mark === 'finding').id, id);
        });
    }

    async function signIn(login, authorizationURI) {
        const browser = new Browser(readFileSync(site.authority), () => {});
        const form = await browser.open(authorizationURI);
        const values = {login, password: site.users.get(login).password};
        const last = await browser.submit(form, values, (url) => url.pathname === RETURN_PATH);
        return last.next.href;
    }

    for (const [profile, login, name] of [['azure', 'alice', 'ACME\\alice'], ['websphere', 'bob', 'bob']]) {
        test(`guides ${login} through a login (${profile})`, async () => {
            useProfile(profile);
            let address;
            const {status, printed} = await ask(['login'], (text, stdin) => {
                const [, uri] = /^ {2}(https:\S+)\n/m.exec(text) ?? [];
                if (uri && address === undefined) {
                    address = signIn(login, uri).then((href) => stdin.end(`${href}\n`));
                }
            });
            await address;
            const shown = printed.replace(/^ {2}https:.*$/m, '  https://...');
            console.log(`\n== A walk through a login, ${profile}\n${shown}`);
            assert.ok(printed.includes(`signs in as "${name}"`));
            assert.match(printed, /^If users still cannot sign in, run: journalctl /m);
            assert.equal(status, 0);
        });
    }

    test('prints its version', () => {
        assert.match(spawnSync(doctor, ['--version'], {encoding: 'utf8'}).stdout, /^tavosso-doctor \d+\.\d+\.\d+\n$/);
    });
});
