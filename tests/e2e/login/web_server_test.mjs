// Attacks on the web server: request bodies, other paths, missing headers, header injection and environment variables.
// Runs as root of private namespaces.
import assert from 'node:assert/strict';
import {execFileSync} from 'node:child_process';
import {once} from 'node:events';
import {cpSync, mkdtempSync, readdirSync, readFileSync, watch, writeFileSync} from 'node:fs';
import http2 from 'node:http2';
import path from 'node:path';
import {after, before, describe, test} from 'node:test';

import {listen, startWebServer, useProfile, writeDomains, writeSettings} from '../site/front_end.mjs';
import {makeAuthority} from '../site/certificate_authority.mjs';
import {Browser} from './browser.mjs';
import {connect, withLimitOf} from './connection.mjs';

const PATIENCE = 20_000;
const SECRET = 'a secret of the web root';
const LOGIN_PAGE = '/webman/sso/login.cgi';
const RETURN_PAGE = '/webman/sso/return.cgi';
const PROTECTION = {
    'cache-control': 'no-store',
    'content-security-policy': "default-src 'none'; script-src 'self'; style-src 'self'; img-src 'self'; " +
        "base-uri 'none'; form-action 'self'; frame-ancestors 'none'",
    'referrer-policy': 'same-origin',
    'strict-transport-security': 'max-age=31536000',
    'x-content-type-options': 'nosniff',
};
const SERVED = [
    '/', '/index.cgi', '/account.cgi', '/webman/sso/login.cgi', '/webman/sso/return.cgi', '/webman/sso/logout.cgi',
    ...['error.html', 'language.js', 'mark.svg', 'messages/en.js', 'reasons.js', 'relay.html', 'relay.js', 'style.css']
        .map((name) => `/webman/ssoclient/${name}`),
];
// Files that a crash, an editor or an administrator may leave in the web root.
const PLANTED = [
    'core', 'index.html', '.profile', 'index.cgi~', 'webman/core', 'webman/sso/core', 'webman/sso/core.4711',
    'webman/sso/x', 'webman/sso/.hidden', 'webman/sso/login.cgi.orig', 'webman/ssoclient/core',
    'webman/ssoclient/relay.html.orig', 'webman/ssoclient/.hidden.js', 'webman/ssoclient/messages/core', 'webman/ssoclient/messages/de.js.orig',
];
const PLANTED_PROGRAMS = ['other.cgi', 'webman/other.cgi', 'webman/sso/.cgi', 'webman/sso/Core.cgi',
    'webman/sso/copy.of.login.cgi', 'webman/ssoclient/other.cgi'];

const [webroot] = process.argv.slice(2);

function plant(root) {
    const write = (name, text) => writeFileSync(path.join(root, name), text, {mode: 0o755});
    PLANTED.forEach((name) => write(name, SECRET));
    PLANTED_PROGRAMS.forEach((name) => write(name, `#!/bin/sh\nprintf 'Content-Type: text/plain\\n\\n${SECRET}'\n`));
    write('webman/sso/environment.cgi', "#!/bin/sh\nprintf 'Content-Type: text/plain\\n\\n'\nenv\n");
    write('webman/sso/stuck.cgi', '#!/bin/sh\nexec tail -f /dev/null\n');
}

async function startSite() {
    const folder = mkdtempSync('/tmp/web-server-');
    const authority = makeAuthority(folder);
    const served = path.join(folder, 'webroot');
    cpSync(webroot, served, {recursive: true});
    plant(served);
    const socket = await listen();
    const origin = `https://localhost:${socket.address().port}`;
    const server = startWebServer({
        socket,
        webroot: served,
        certificate: authority.issue('appliance', 'DNS:localhost'),
        folder,
        frontEndSettings: withLimitOf(1, folder),
    });
    const endpoint = 'https://provider.invalid/';
    const endpoints = {discovery: endpoint, authorization: endpoint, token: endpoint, logout: endpoint};
    const client = {id: 'the client', secret: 'a secret', redirectURI: origin + RETURN_PAGE};
    writeDomains({});
    writeSettings({provider: {endpoints}, clients: [{...client, tenant: 'the tenant'}, client]});
    useProfile('websphere');
    return {origin, authority: readFileSync(authority.file), ...server};
}

/** Splits at every line end that some client accepts. */
function parseAnswer(text) {
    const [head, ...body] = text.split('\r\n\r\n');
    const [statusLine, ...lines] = head.split(/\r\n|\r|\n/);
    const headers = lines.map((line) => /^([^:]*): ?(.*)$/.exec(line)?.slice(1) ?? [line, '']);
    return {
        status: Number(/^HTTP\/1\.[01] (\d{3}) /.exec(statusLine)?.[1]),
        headers: headers.map(([name, value]) => [name.toLowerCase(), value]),
        body: body.join('\r\n\r\n'),
    };
}

const valuesOf = ({headers}, wanted) => headers.filter(([name]) => name === wanted).map(([, value]) => value);

function request(target, {method = 'GET', headers = {}, body = ''} = {}) {
    const all = Object.entries({Host: 'localhost', Connection: 'close', ...headers});
    return `${method} ${target} HTTP/1.1\r\n${all.map(([name, value]) => `${name}: ${value}\r\n`).join('')}\r\n${body}`;
}

// Versions of lighttpd differ in some statuses. Measured: 1.4.69, 1.4.79 and 1.4.85.
const [, patch] = /1\.4\.(\d+)/.exec(execFileSync('/usr/sbin/lighttpd', ['-v'], {encoding: 'utf8'}));
const BODY_WITHOUT_LENGTH_OVER_HTTP2 = patch < 79 ? 411 : 413;
const UNKNOWN_VERSION = patch < 79 ? 505 : 400;
const RAW_CR_IN_QUERY = patch < 85 ? [200, 302, 405] : [200, 302, 400, 405];

describe('The web server', () => {
    let site;
    before(async () => {
        site = await startSite();
    });
    after(() => site.stop());

    /** The answer to a request that is sent byte for byte. */
    async function send(bytes) {
        const socket = await connect(site.authority, site);
        socket.setTimeout(PATIENCE, () => socket.destroy(new Error('the server does not answer')));
        socket.write(bytes, 'latin1');
        let text = '';
        for await (const chunk of socket.setEncoding('latin1')) {
            text += chunk;
        }
        return parseAnswer(text);
    }

    /** The status of the answer to an HTTP/2 request with an unfinished body. */
    async function statusOverHttp2(headers, body) {
        const address = `https://127.0.0.1:${new URL(site.origin).port}`;
        const session = http2.connect(address, {ca: site.authority, servername: 'localhost'});
        try {
            const stream = session.request(headers, {endStream: false});
            stream.on('error', () => {}); // The server may reset it after its answer.
            stream.write(body);
            const [{':status': status}] = await once(stream, 'response');
            return status;
        } finally {
            session.destroy();
        }
    }

    describe('stores no request body', () => {
        const part = 'x'.repeat(100_000);
        const bodies = {
            'of a huge length': {headers: {'Content-Length': '1000000000000'}, body: part},
            'in a huge chunk': {headers: {'Transfer-Encoding': 'chunked'}, body: `10000000\r\n${part}`},
            'in many chunks': {
                headers: {'Transfer-Encoding': 'chunked'},
                body: `400\r\n${'x'.repeat(1024)}\r\n`.repeat(100),
            },
        };

        async function expectNothingStored(expected, sendAndReadStatus) {
            const watcher = watch(site.uploads);
            const stored = once(watcher, 'change').then(([, name]) => assert.fail(`the server stores ${name}`));
            try {
                assert.equal(await Promise.race([sendAndReadStatus(), stored]), expected);
                assert.deepEqual(readdirSync(site.uploads), []);
            } finally {
                watcher.close();
            }
        }

        for (const [kind, {headers, body}] of Object.entries(bodies)) {
            for (const target of ['/index.cgi', '/webman/sso/logout.cgi']) {
                test(`${kind}, at ${target}`, () => expectNothingStored(413, async () =>
                    (await send(request(target, {method: 'POST', headers, body}))).status));
            }
        }

        test('of a huge length, over HTTP/2', () => expectNothingStored(413, () =>
            statusOverHttp2({':method': 'POST', ':path': '/index.cgi', 'content-length': '1000000000000'}, part)));
        test('of no length, over HTTP/2', () => expectNothingStored(BODY_WITHOUT_LENGTH_OVER_HTTP2, () =>
            statusOverHttp2({':method': 'POST', ':path': '/index.cgi'}, part)));
    });

    describe('serves', () => {
        for (const target of SERVED) {
            test(`${target}`, async () => {
                const {status} = await send(request(target));
                assert.ok([200, 302, 405].includes(status), `status ${status}`);
            });
        }
    });

    describe('rejects', () => {
        const encode = (name) => encodeURIComponent(name).replaceAll('%2F', '/');
        const others = [
            // Path info.
            '/index.cgi/extra', '/index.cgi/', '/account.cgi/extra', '/webman/sso/login.cgi/extra',
            '/webman/sso/return.cgi/relay.html',
            // Other spellings.
            '/webman/sso/%63ore', '/webman//sso/core', '/webman/./sso/core', '/webman/ssoclient/../sso/core',
            '/webman/sso%2fcore', '/webman/sso/login.cgi/../core', '/webman/ssoclient/%2e%2e/sso/core',
            '/webman/sso/core?/index.cgi', '/webman/sso/core%00.cgi', '/webman/sso/core%0a.cgi', '/core%23/index.cgi',
            // Folders and other names.
            '/webman', '/webman/', '/webman/sso/', '/webman/ssoclient/', '/INDEX.CGI', '/index.cgi%00', '/favicon.ico',
        ];
        for (const target of [...[...PLANTED, ...PLANTED_PROGRAMS].map((name) => `/${encode(name)}`), ...others]) {
            test(`${target}`, async () => {
                const {status, body} = await send(request(target));
                assert.ok(!body.includes(SECRET), 'the file is served');
                assert.ok(status === 403 || status === 404, `status ${status}`);
            });
        }
    });

    describe('sends security headers', () => {
        const huge = {'Content-Length': '1000000000000'};
        const post = (headers, body) => request('/index.cgi', {method: 'POST', headers, body});
        const answers = [
            [200, 'a page', request('/index.cgi')],
            [200, 'a file', request('/webman/ssoclient/relay.html')],
            [200, 'a range beyond the file',
                request('/webman/ssoclient/relay.html', {headers: {Range: 'bytes=1000000-'}})],
            [302, 'a sign-in', request(LOGIN_PAGE)],
            [400, 'an invalid request', 'nonsense\r\n\r\n'],
            [400, 'no host', 'GET / HTTP/1.1\r\n\r\n'],
            [400, 'an invalid host', request('/', {headers: {Host: 'local<host'}})],
            [400, 'a control character in a header', request('/', {headers: {Cookie: 'a\x01b'}})],
            [400, 'an invalid chunk', post({'Transfer-Encoding': 'chunked'}, 'nonsense\r\n')],
            [403, 'a path that is not served', request('/webman/sso/core')],
            [403, 'a path that is not served, not modified', request('/webman/sso/core', {headers: {'If-None-Match': '*'}})],
            [404, 'a missing program', request('/webman/sso/nowhere.cgi')],
            [405, 'a method that the program rejects', request('/webman/sso/logout.cgi')],
            [411, 'a body without a length', post({})],
            [413, 'a large body', post(huge)],
            [413, 'a large body with Expect', post({...huge, Expect: '100-continue'})],
            [431, 'a long address', request(`/index.cgi?${'x'.repeat(10_000)}`)],
            [431, 'a long header', request('/index.cgi', {headers: {Cookie: 'x'.repeat(10_000)}})],
            [501, 'an unknown method', request('/index.cgi', {method: 'NONSENSE'})],
            [504, 'a program that does not answer', request('/webman/sso/stuck.cgi')],
            [UNKNOWN_VERSION, 'an unknown version', 'GET / HTTP/4.2\r\nHost: localhost\r\n\r\n'],
        ];
        for (const [status, kind, bytes] of answers) {
            test(`${status}: ${kind}`, async () => {
                const answer = await send(bytes);
                assert.equal(answer.status, status);
                const found = answer.headers.filter(([name]) => name in PROTECTION).sort();
                assert.deepEqual(found, Object.entries(PROTECTION));
            });
        }
    });

    describe('prevents header injection', () => {
        const injected = 'Injected: yes';
        const breaks = {
            '%0D%0A': 'CR LF',
            '%0A': 'LF',
            '%0D': 'CR',
            '%250D%250A': 'CR LF, encoded twice',
            '\r': 'a raw CR',
        };
        const targets = SERVED.flatMap((target) =>
            ['code', 'error', 'error_description', 'origin', 'state'].map((name) => `${target}?${name}=`));

        for (const [lineBreak, kind] of Object.entries(breaks)) {
            test(`${kind} in the query of each path`, async () => {
                for (const target of targets) {
                    const answer = await send(request(`${target}/x${lineBreak}${injected.replace(' ', '%20')}`));
                    assert.deepEqual(valuesOf(answer, 'injected'), [], target);
                    const statuses = lineBreak === '\r' ? RAW_CR_IN_QUERY : [200, 302, 405];
                    assert.ok(statuses.includes(answer.status), `${target}: status ${answer.status}`);
                }
            });
        }

        for (const [lineBreak, kind] of [['\r\n', 'a raw CR LF'], ['\n', 'a raw LF']]) {
            test(`${kind} in the query`, async () => {
                const answer = await send(request(`${RETURN_PAGE}?state=x${lineBreak}${injected}`));
                assert.equal(answer.status, 400);
                assert.deepEqual(valuesOf(answer, 'injected'), []);
            });
        }

        test('CR LF in the path', async () => {
            const answer = await send(request(`${RETURN_PAGE}%0D%0A${injected.replace(' ', '%20')}`));
            assert.equal(answer.status, 403);
            assert.deepEqual(valuesOf(answer, 'injected'), []);
        });

        test("CR LF in the provider's error", async () => {
            const browser = new Browser(site.authority, () => {});
            const {next} = await browser.request('GET', new URL(site.origin + LOGIN_PAGE));
            const query = new URLSearchParams({
                error: 'access_denied',
                error_description: `first line\r\n${injected}\r\n\r\n<script>alert(1)</script>`,
                state: next.searchParams.get('state'),
            });
            const cookies = browser.cookies.for(new URL(site.origin)).map(({name, value}) => `${name}=${value}`);
            const answer = await send(request(`${RETURN_PAGE}?${query}`, {headers: {Cookie: cookies.join('; ')}}));
            assert.equal(answer.status, 302);
            assert.deepEqual(valuesOf(answer, 'injected'), []);
            const [location] = valuesOf(answer, 'location');
            const {pathname, hash} = new URL(location, site.origin);
            assert.equal(pathname, '/webman/ssoclient/relay.html');
            const reason = new URLSearchParams(hash.slice(1)).get('reason');
            assert.match(reason, /access_denied.*first line {2}Injected: yes/);
            assert.doesNotMatch(reason, /\p{Cc}/u);
        });
    });

    test('maps client headers only to HTTP_* variables', async () => {
        const variables = async (headers) => {
            const {status, body} = await send(request('/webman/sso/environment.cgi', {headers}));
            assert.equal(status, 200);
            const found = Object.fromEntries(body.trim().split('\n').map((line) => /^(\w+)=(.*)$/.exec(line).slice(1)));
            delete found.REMOTE_PORT; // differs with each connection
            return found;
        };
        const names = [
            'Proxy', 'HTTP_PROXY', 'http_proxy', 'https_proxy', 'all_proxy', 'no_proxy', 'All-Proxy', 'ALL_PROXY',
            'LD_PRELOAD', 'LD_LIBRARY_PATH', 'PATH', 'HOME', 'CURL_HOME', 'SSL_CERT_FILE', 'Ssl-Cert-File',
            'SSLKEYLOGFILE', 'OPENSSL_CONF', 'MALLOC_PERTURB_', 'REMOTE_USER', 'REMOTE_ADDR', 'REQUEST_METHOD',
            'QUERY_STRING', 'HTTPS', 'SCRIPT_FILENAME', 'DOCUMENT_ROOT', 'REDIRECT_STATUS', 'Redirect-Status',
        ];
        const plain = await variables({});
        const attacked = await variables(Object.fromEntries(names.map((name) => [name, 'attack'])));
        const others = Object.entries(attacked).filter(([name]) => !name.startsWith('HTTP_') || name in plain);
        assert.deepEqual(Object.fromEntries(others), plain);
        assert.ok(!('HTTP_PROXY' in attacked), 'the header Proxy is passed');
        assert.ok('HTTP_LD_PRELOAD' in attacked, 'the headers do not reach the program');
    });
});
