// A complete site: the appliance with the front end, a real OpenID provider, users, and an authority that both trust.
// Runs as root of private namespaces.
import {randomBytes, randomUUID} from 'node:crypto';
import {copyFileSync, mkdtempSync} from 'node:fs';

import {listen, startWebServer, writeDomains, writeSettings} from './front_end.mjs';
import {makeAuthority} from './certificate_authority.mjs';
import {startProvider} from './provider.mjs';
import {collectSystemLog} from './syslog_collector.mjs';

const SYSTEM_BUNDLE = '/etc/ssl/certs/ca-certificates.crt';
const DOMAINS = {'corp.example.net': 'ACME'};

const randomSecret = () => randomBytes(24).toString('base64url');
const randomPassword = () => randomBytes(9).toString('base64url');

/** Users by login, with random passwords. `named` maps logins to names at the provider. */
export function makeUsers(named) {
    return new Map(Object.entries(named).map(
        ([login, uniqueName]) => [login, {uniqueName, password: randomPassword()}]));
}

/** The clients of both profiles, as registered at the provider, with the addresses of the appliance. */
export function makeClients(addresses) {
    return [
        {id: randomUUID(), secret: randomSecret(), algorithm: 'RS256', tenant: randomUUID(), ...addresses},
        {id: 'appliance-websphere', secret: randomSecret(), algorithm: 'HS256', ...addresses},
    ];
}

/**
 * Calls `onRequest` for each request of the appliance to a provider and `onLog` for each log line. The returned
 * `chromiumTrust` is a switch that makes Chromium trust only the certificates of this run.
 */
export async function startSite({webroot, nodeModules, users, onRequest, onLog}) {
    const folder = mkdtempSync('/tmp/site-');
    const authority = makeAuthority(folder);
    copyFileSync(authority.file, SYSTEM_BUNDLE);

    const socket = await listen();
    const origin = `https://localhost:${socket.address().port}`;
    const clients = makeClients({
        redirectURI: `${origin}/webman/sso/return.cgi`,
        otherRedirectURI: `${origin}/webman/sso/sso.cgi`, // the README's program
        logoutURI: `${origin}/webman/ssoclient/relay.html`,
    });
    const [{tenant}] = clients;
    const providerCertificate = authority.issue('provider', 'IP:127.0.0.1');
    const applianceCertificate = authority.issue('appliance', 'DNS:localhost');
    const fingerprints = [providerCertificate, applianceCertificate].map(({fingerprint}) => fingerprint);
    const startAnotherProvider = () =>
        startProvider({nodeModules, tenant, clients, users, certificate: providerCertificate, report: onRequest});

    const provider = await startAnotherProvider();
    const log = await collectSystemLog(onLog);
    writeDomains(DOMAINS);
    writeSettings({provider, clients});
    const webServer = startWebServer({socket, webroot, certificate: applianceCertificate, folder});
    return {
        origin,
        users,
        clients,
        provider,
        providerCertificate,
        chromiumTrust: `--ignore-certificate-errors-spki-list=${fingerprints}`,
        authority: authority.file,
        folder,
        log,
        webServer,
        startAnotherProvider,
        async stop() {
            await webServer.stop();
            provider.stop();
            log.stop();
        },
    };
}
