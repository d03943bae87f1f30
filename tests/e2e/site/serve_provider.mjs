// Serves only the OpenID provider until Ctrl-C, for a program of the reader: see ../../../demo.
import {mkdirSync, mkdtempSync, rmSync} from 'node:fs';
import {tmpdir} from 'node:os';
import path from 'node:path';
import {parseArgs} from 'node:util';

import {makeAuthority} from './certificate_authority.mjs';
import {useProfile, writeDomains, writeSettings} from './front_end.mjs';
import {startProvider} from './provider.mjs';
import {makeClients, makeUsers} from './site.mjs';

const USERS = {alice: 'alice@corp.example.net', bob: 'bob@corp.example.net'};

const {values: {'redirect-uri': redirectURI, profile, etc, 'node-modules': nodeModules}} = parseArgs({options: {
    'redirect-uri': {type: 'string'},
    profile: {type: 'string', default: 'azure'},
    etc: {type: 'string', default: 'build/provider'},
    'node-modules': {type: 'string'},
}});
if (redirectURI === undefined || !URL.canParse(redirectURI)) {
    console.error('Give the redirect URI of your program, for example --redirect-uri https://localhost/sso.cgi');
    process.exit(2);
}
if (!['azure', 'websphere'].includes(profile)) {
    console.error('Unknown profile. Use azure or websphere.');
    process.exit(2);
}

const folder = mkdtempSync(path.join(tmpdir(), 'provider-'));
const authority = makeAuthority(folder);
const users = makeUsers(USERS);
const clients = makeClients({redirectURI, logoutURI: new URL('/webman/ssoclient/relay.html', redirectURI).href});
const provider = await startProvider({
    nodeModules: path.resolve(nodeModules),
    tenant: clients[0].tenant,
    clients,
    users,
    certificate: authority.issue('provider', 'IP:127.0.0.1'),
    report: ({method, path: asked, status}) => console.log(`${method} ${asked}: ${status}`),
});
mkdirSync(path.join(etc, 'ssoclient'), {recursive: true});
writeSettings({provider, clients}, etc);
useProfile(profile, true, etc);
writeDomains({'corp.example.net': 'ACME'}, etc);

console.log(`Serving profile ${profile} until Ctrl-C. Each start uses a new port, authority, secrets and passwords.

  issuer         ${provider.address}
  redirect URI   ${redirectURI}
  authority      ${authority.file}

Install the configuration files and the authority:

  sudo mkdir -p /usr/tavo/etc /usr/tavo/var
  sudo cp -r ${path.resolve(etc)}/. /usr/tavo/etc/
  sudo cp ${authority.file} /usr/local/share/ca-certificates/tavosso-provider.crt
  sudo update-ca-certificates

Make the browser trust the authority, too. Users:
`);
for (const [login, {password, uniqueName}] of users) {
    console.log(`  ${login.padEnd(6)} password ${password}  (${uniqueName})`);
}
for (const signal of ['SIGINT', 'SIGTERM']) {
    process.once(signal, () => {
        provider.stop();
        rmSync(folder, {recursive: true});
    });
}
