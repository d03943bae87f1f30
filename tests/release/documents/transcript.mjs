// The transcript in the guide for administrators is what the doctor prints of such files. Runs as root of private
// namespaces.
//
//   tools/private-root node tests/release/documents/transcript.mjs DOCTOR            fails where they differ
//   tools/private-root node tests/release/documents/transcript.mjs DOCTOR --update   writes what it prints into the guide
import assert from 'node:assert/strict';
import {spawnSync} from 'node:child_process';
import {chmodSync, mkdirSync, readFileSync, writeFileSync} from 'node:fs';
import {fileURLToPath} from 'node:url';

const GUIDE = fileURLToPath(new URL('../../../docs/operations.md', import.meta.url));
const TRANSCRIPT = /(?<=^```text\n)\nProfile\n[^]*?(?=^```$)/m;
const SETTINGS = '/usr/tavo/etc/ssoclient';

// As they may be after an afternoon: a key with a capital, another page to return to, rights as an editor left them.
const FILES = {
    [`${SETTINGS}/profile.conf`]: {sso_enable: true, sso_profile: 'azure'},
    [`${SETTINGS}/azure.conf`]: {
        azure_sso_enable: true,
        azure_wellknown: 'https://login.example.com/9f3c/.well-known/openid-configuration',
        azure_client_id: '5d1b0c6e-6f3e-4c4d-9d55-0e1f2a3b4c5d',
        Azure_client_secret: 'a long random text of the provider',
        azure_tenant_id: '9f3c',
        azure_authorization_endpoint: 'https://login.example.com/9f3c/oauth2/authorize',
        azure_token_endpoint: 'https://login.example.com/9f3c/oauth2/token',
        azure_redirect_uri: 'https://nas.example.com/',
        azure_logout_endpoint: 'https://login.example.com/9f3c/oauth2/logout',
    },
    '/usr/tavo/etc/domains.conf': {'corp.example.net': 'ACME'},
};

const [doctor, update] = process.argv.slice(2);
mkdirSync(SETTINGS, {recursive: true});
for (const [file, content] of Object.entries(FILES)) {
    writeFileSync(file, JSON.stringify(content, null, 4));
    chmodSync(file, 0o644);
}
const {status, stdout, stderr} = spawnSync(doctor, ['--domain', 'corp.example.net'], {encoding: 'utf8'});
assert.equal(stderr, '');
assert.equal(status, 1);

const guide = readFileSync(GUIDE, 'utf8');
const [transcript] = TRANSCRIPT.exec(guide) ?? assert.fail('the guide has no transcript');
if (update) {
    writeFileSync(GUIDE, guide.replace(TRANSCRIPT, () => stdout));
} else {
    assert.equal(transcript, stdout);
}
