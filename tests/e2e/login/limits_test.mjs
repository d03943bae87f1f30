// A slow provider: the library waits, and the web server ends the sign-in. Runs as root of private namespaces.
import assert from 'node:assert/strict';
import {once} from 'node:events';
import {copyFileSync, mkdtempSync, readdirSync, readFileSync} from 'node:fs';
import https from 'node:https';
import {after, before, beforeEach, describe, test} from 'node:test';

import {
    FRONT_END_SETTINGS, listen, startWebServer, useProfile, writeDomains, writeSettings,
} from '../site/front_end.mjs';
import {makeAuthority} from '../site/certificate_authority.mjs';
import {collectSystemLog} from '../site/syslog_collector.mjs';
import {Browser} from './browser.mjs';
import {connect, LIMIT, processStatus, until, withLimitOf} from './connection.mjs';

const SYSTEM_BUNDLE = '/etc/ssl/certs/ca-certificates.crt';
const PROGRAM = 'return.cgi';
const SECOND = 1000;

const [webroot] = process.argv.slice(2);

/** Accepts requests. The test answers them. */
class SlowProvider {
    constructor(server) {
        this.server = server;
        server.on('request', (request, response) => {
            // A killed program closes the connection without a TLS close_notify.
            const closed = new Promise((resolve) => request.socket.once('close', resolve));
            request.resume().on('end', () => this.asked({path: request.url, closed, response}));
        });
    }

    static async start(certificate) {
        const server = https.createServer(certificate);
        server.listen(0, '127.0.0.1');
        await once(server, 'listening');
        return new SlowProvider(server);
    }

    get endpoints() {
        const address = `https://127.0.0.1:${this.server.address().port}`;
        return {
            discovery: `${address}/discovery`,
            authorization: `${address}/auth`,
            token: `${address}/token`,
            logout: `${address}/logout`,
        };
    }

    /** The next request, once complete. */
    nextRequest() {
        return new Promise((resolve) => {
            this.asked = resolve;
        });
    }

    stop() {
        this.server.close();
        this.server.closeAllConnections();
    }
}

function runningPrograms() {
    const runs = (text) => text.startsWith(`Name:\t${PROGRAM}\n`) && !/^State:\t[ZX]/m.test(text);
    return readdirSync('/proc').filter((name) => /^\d+$/.test(name) && runs(processStatus(name)));
}

async function startEverything() {
    const folder = mkdtempSync('/tmp/limits-');
    const authority = makeAuthority(folder);
    copyFileSync(authority.file, SYSTEM_BUNDLE);
    const certificate = authority.issue('appliance', 'DNS:localhost');
    const provider = await SlowProvider.start(authority.issue('provider', 'IP:127.0.0.1'));
    const log = await collectSystemLog(() => {});
    const start = async (frontEndSettings) => {
        const socket = await listen();
        const origin = `https://localhost:${socket.address().port}`;
        const own = mkdtempSync('/tmp/limits-server-');
        return {origin, ...startWebServer({socket, webroot, certificate, folder: own, frontEndSettings})};
    };
    const servers = {shipped: await start(FRONT_END_SETTINGS), impatient: await start(withLimitOf(1, folder))};

    const common = {id: 'the client', secret: 'a secret', redirectURI: 'https://localhost/webman/sso/return.cgi'};
    writeDomains({});
    writeSettings({provider, clients: [{...common, tenant: 'the tenant'}, common]});
    const trusted = readFileSync(authority.file);
    return {
        authority: trusted,
        newBrowser: () => new Browser(trusted, () => {}),
        provider,
        servers,
        async stop() {
            await Promise.all(Object.values(servers).map((server) => server.stop()));
            provider.stop();
            log.stop();
        },
    };
}

/** The return address with a code, and the cookies of the browser. */
async function comeBack({newBrowser}, {origin}) {
    const browser = newBrowser();
    const start = await browser.request('GET', new URL(`${origin}/webman/sso/login.cgi`));
    const state = start.next.searchParams.get('state');
    const address = new URL(`${origin}/webman/sso/${PROGRAM}?${new URLSearchParams({code: 'a code', state})}`);
    return {address, cookies: browser.cookies.for(address).map(({name, value}) => `${name}=${value}`).join('; ')};
}

async function open({authority, ...stage}, server) {
    const {address, cookies} = await comeBack(stage, server);
    const socket = await connect(authority, server);
    const request = https.get(address, {createConnection: () => socket, headers: {Cookie: cookies}});
    return {socket, answer: once(request, 'response').then(([response]) => response.resume())};
}

describe('A sign-in with a slow provider', () => {
    let stage;
    before(async () => {
        stage = await startEverything();
    });
    after(() => stage.stop());
    beforeEach(() => useProfile('websphere'));

    // Starts a sign-in until the program waits for the provider.
    async function startWaiting(server) {
        const request = stage.provider.nextRequest();
        const opened = await open(stage, server);
        const asked = await request;
        assert.equal(asked.path, '/token');
        assert.equal(runningPrograms().length, 1);
        return {...opened, ...asked};
    }

    async function expectProgramEnded(closed) {
        await closed;
        // The connection closes shortly before the program ends.
        await until(() => runningPrograms().length === 0);
    }

    async function expectEnded({answer, closed}) {
        const {statusCode, headers} = await answer;
        assert.equal(statusCode, 504);
        assert.equal(headers['cache-control'], 'no-store');
        assert.match(headers['content-security-policy'], /^default-src 'none';/);
        await expectProgramEnded(closed);
    }

    test('times out if the provider never answers', async () => {
        await expectEnded(await startWaiting(stage.servers.impatient));
    });

    test('waits until the time limit', async () => {
        const {response, answer} = await startWaiting(stage.servers.shipped);
        response.end('{"error": "gone"}');
        assert.match((await answer).headers.location, /success=false$/);
    });

    test('times out if the provider answers slowly', async () => {
        const waiting = await startWaiting(stage.servers.impatient);
        waiting.response.writeHead(200, {'Content-Length': 1000});
        waiting.response.flushHeaders();
        const drip = setInterval(() => waiting.response.write(' '), SECOND);
        try {
            await expectEnded(waiting);
        } finally {
            clearInterval(drip);
        }
    });

    test('ends when the browser disconnects', async () => {
        const {socket, answer, closed} = await startWaiting(stage.servers.shipped);
        socket.destroy();
        await assert.rejects(answer);
        await expectProgramEnded(closed);
    });

    test('has a limit in the shipped settings', () => {
        const [, seconds] = LIMIT.exec(readFileSync(FRONT_END_SETTINGS, 'utf8'));
        assert.ok(Number(seconds) > 0 && Number(seconds) <= 60, `a limit of ${seconds} s`);
    });
});
