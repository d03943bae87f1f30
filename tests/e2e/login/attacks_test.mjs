// Attacks on the running site. Runs as root of private namespaces.
import assert from 'node:assert/strict';
import {once} from 'node:events';
import {copyFileSync, readFileSync, readdirSync, rmSync, truncateSync} from 'node:fs';
import https from 'node:https';
import net from 'node:net';
import {after, before, beforeEach, describe, test} from 'node:test';

import {useProfile, writeSettings} from '../site/front_end.mjs';
import {makeUsers, startSite} from '../site/site.mjs';
import {Browser} from './browser.mjs';

const FRONT_END = '/usr/tavo/var/frontend';
const SESSION_COOKIE = '__Host-session';
const PROGRAMS = ['/index.cgi', '/account.cgi', '/webman/sso/login.cgi', '/webman/sso/return.cgi'];
// The facility and levels of syslog.
const [AUTH, ERR, WARNING, INFO] = [32, 3, 4, 6];
const LOGOUT = '/webman/sso/logout.cgi';
const RETURN = '/webman/sso/return.cgi';
const USERS = {
    alice: 'alice@corp.example.net',
    nul: 'alice\u0000mallory@corp.example.net',
    reversed: 'alice\u202e@corp.example.net',
    chosen: undefined,
    verified: undefined,
};
const CLAIMS = {
    alice: {name: 'Alice Example'},
    chosen: {email: 'alice@corp.example.net'},
    verified: {email: 'alice@corp.example.net', email_verified: true},
};

const [webroot, nodeModules] = process.argv.slice(2);

function makeUsersWithClaims() {
    const users = makeUsers(USERS);
    for (const [login, claims] of Object.entries(CLAIMS)) {
        users.get(login).claims = claims;
    }
    return users;
}

describe('An attacker', () => {
    let site;
    let tokenRequests;
    const logged = [];
    before(async () => {
        site = await startSite({
            webroot,
            nodeModules,
            users: makeUsersWithClaims(),
            onRequest({path}) {
                tokenRequests += path === '/token' ? 1 : 0;
            },
            onLog: (line, priority) => logged.push({line, priority}),
        });
    });
    after(() => site.stop());
    beforeEach(() => {
        rmSync(FRONT_END, {recursive: true, force: true});
        writeSettings(site);
        useProfile('azure');
        tokenRequests = 0;
        logged.length = 0;
    });

    const wasLogged = (priority, line) =>
        assert.deepEqual(logged.filter((each) => each.line === line), [{line, priority}]);
    const newBrowser = () => new Browser(readFileSync(site.authority), () => {});
    const at = (path) => new URL(path, site.origin);
    const cookiesOf = (browser) => browser.cookies.for(at('/')).map(({name}) => name);

    /** Signs in at the provider. Returns the return address, without opening it. */
    async function stopBeforeReturn(browser, login) {
        const form = await browser.open(at('/webman/sso/login.cgi'));
        const isReturn = (url) => url.pathname === RETURN;
        return (await browser.submit(form, {login, password: site.users.get(login).password}, isReturn)).next;
    }

    /** Opens an address. Returns the parameters of the relay page. */
    async function comeBack(browser, address) {
        const relay = await browser.open(address);
        return Object.fromEntries(new URLSearchParams(relay.url.hash.slice(1)));
    }

    async function signIn(browser, login) {
        return comeBack(browser, await stopBeforeReturn(browser, login));
    }

    const isSignedIn = async (browser) => (await browser.request('GET', at('/account.cgi'))).status === 200;
    const sessionFile = (browser) =>
        `${FRONT_END}/sessions/${browser.cookies.for(at('/')).find(({name}) => name === SESSION_COOKIE).value}`;

    test('cannot finish a login in a browser that did not start it', async () => {
        const address = await stopBeforeReturn(newBrowser(), 'alice');
        const victim = newBrowser();
        assert.equal((await comeBack(victim, address)).reason, 'This sign-in was not started in this browser.');
        assert.equal(tokenRequests, 0);
        assert.equal(await isSignedIn(victim), false);
    });

    test('cannot fill the cookie header with many logins', async () => {
        const browser = newBrowser();
        for (let i = 0; i < 150; ++i) {
            assert.equal((await browser.request('GET', at('/webman/sso/login.cgi'))).status, 302);
        }
        assert.equal(cookiesOf(browser).length, 16);
        assert.equal((await browser.request('GET', at('/index.cgi'))).status, 200);
    });

    test('cannot use other request methods', async () => {
        for (const program of PROGRAMS) {
            for (const method of ['POST', 'PUT', 'DELETE', 'OPTIONS']) {
                const {status, headers} = await newBrowser().request(method, at(program));
                assert.deepEqual({status, allow: headers.allow}, {status: 405, allow: 'GET, HEAD'}, `${method} ${program}`);
            }
        }
        for (const method of ['GET', 'HEAD', 'PUT']) {
            const {status, headers} = await newBrowser().request(method, at(LOGOUT));
            assert.deepEqual({status, allow: headers.allow}, {status: 405, allow: 'POST'}, method);
        }
    });

    test('cannot start or finish a login with HEAD', async () => {
        const browser = newBrowser();
        const {next} = await browser.request('HEAD', at('/webman/sso/login.cgi'));
        assert.equal(next.pathname, '/index.cgi');
        assert.deepEqual(cookiesOf(browser), []);
        const address = await stopBeforeReturn(browser, 'alice');
        assert.equal((await browser.request('HEAD', address)).next.pathname, '/index.cgi');
        assert.equal(tokenRequests, 0);
        assert.equal((await comeBack(browser, address)).success, 'true');
    });

    for (const [login, reason] of [
        ['nul', "The provider's name for this user cannot be used."],
        ['reversed', "The provider's name for this user cannot be used."],
        ['chosen', "The provider has not verified this user's e-mail address."],
    ]) {
        test(`cannot sign in with the claims of ${login}`, async () => {
            const browser = newBrowser();
            assert.deepEqual(await signIn(browser, login), {reason, origin: '/index.cgi', success: 'false'});
            assert.equal(await isSignedIn(browser), false);
        });
    }

    test('does not affect users with a verified e-mail address', async () => {
        const browser = newBrowser();
        assert.equal((await signIn(browser, 'verified')).success, 'true');
        wasLogged(AUTH | INFO, 'return.cgi: frontend: signed in: ACME\\alice');
        assert.match((await browser.open(at('/account.cgi'))).text, /<bdi>ACME\\alice<\/bdi>/);
    });

    test('cannot use a truncated session file', async () => {
        const browser = newBrowser();
        await signIn(browser, 'alice');
        assert.match((await browser.open(at('/account.cgi'))).text, /<dt>Name<\/dt>\n<dd><bdi>Alice Example<\/bdi><\/dd>/);
        truncateSync(sessionFile(browser));
        assert.equal(await isSignedIn(browser), false);
    });

    test('cannot use a pending login as a session', async () => {
        const browser = newBrowser();
        await signIn(browser, 'alice');
        await stopBeforeReturn(newBrowser(), 'alice');
        const [pending] = readdirSync(`${FRONT_END}/logins`).filter((name) => name !== 'counter');
        copyFileSync(`${FRONT_END}/logins/${pending}`, sessionFile(browser));
        assert.equal(await isSignedIn(browser), false);
    });

    test('gets no code after a change of the profile', async () => {
        const browser = newBrowser();
        const address = await stopBeforeReturn(browser, 'alice');
        useProfile('websphere');
        const {reason} = await comeBack(browser, address);
        assert.equal(reason, 'The settings of this device were changed during this sign-in.');
        assert.equal(tokenRequests, 0);
    });

    for (const [change, profile, enable] of [['another profile', 'websphere', true], ['single sign-on disabled', 'azure', false]]) {
        test(`loses the session with ${change}`, async () => {
            const browser = newBrowser();
            await signIn(browser, 'alice');
            assert.equal(await isSignedIn(browser), true);
            useProfile(profile, enable);
            assert.equal(await isSignedIn(browser), false);
            useProfile('azure');
            assert.equal(await isSignedIn(browser), false);
        });
    }

    test('cannot write unprintable characters to the log', async () => {
        const browser = newBrowser();
        const {next} = await browser.request('GET', at('/webman/sso/login.cgi'));
        const returned = at(RETURN);
        returned.search = new URLSearchParams({
            error: 'a\u009b31mb\u202ec\u2066d', error_description: 'e\u0085f\u2028g', state: next.searchParams.get('state'),
        });
        const {reason} = await comeBack(browser, returned);
        assert.equal(reason, 'The provider refused: a 31mb c d (e f g)');
        wasLogged(AUTH | WARNING, `return.cgi: frontend: sign-in failed: ${reason}`);
    });

    test('cannot report an error with a foreign state', async () => {
        const browser = newBrowser();
        const own = (await browser.request('GET', at('/webman/sso/login.cgi'))).next.searchParams.get('state');
        const foreign = (await newBrowser().request('GET', at('/webman/sso/login.cgi'))).next.searchParams.get('state');
        const withError = (state) => at(`${RETURN}?${new URLSearchParams({error: 'access_denied', state})}`);
        assert.equal((await comeBack(browser, withError(foreign))).reason, 'This sign-in was not started in this browser.');
        assert.equal((await comeBack(browser, withError(own))).reason, 'The provider refused: access_denied');
    });

    for (const scheme of ['http', 'gopher', 'dict', 'ftp']) {
        test(`cannot reach an internal service through ${scheme}:`, async () => {
            let connections = 0;
            const internal = net.createServer((connection) => {
                ++connections;
                connection.destroy();
            }).listen(0, '127.0.0.1');
            await once(internal, 'listening');
            const keys = `${scheme}://127.0.0.1:${internal.address().port}/keys`;
            const discovery = https.createServer(site.providerCertificate, (request, response) =>
                response.end(JSON.stringify({jwks_uri: keys}))).listen(0, '127.0.0.1');
            await once(discovery, 'listening');
            try {
                const endpoints = {
                    ...site.provider.endpoints, discovery: `https://127.0.0.1:${discovery.address().port}/`,
                };
                writeSettings({...site, provider: {endpoints}});
                const {reason} = await signIn(newBrowser(), 'alice');
                assert.equal(reason, 'kid does not exist in Azure verified kyes');
                assert.equal(connections, 0);
                wasLogged(AUTH | ERR, 'return.cgi: frontend: jwks_uri of the discovery document is not an https:// URL');
            } finally {
                internal.close();
                discovery.close();
                discovery.closeAllConnections();
            }
        });
    }

    test('cannot sign a user out from another site', async () => {
        const browser = newBrowser();
        await signIn(browser, 'alice');
        const cookie = browser.cookies.for(at('/')).map(({name, value}) => `${name}=${value}`).join('; ');
        for (const headers of [{}, {Origin: 'https://evil.example'}, {Origin: 'null'}, {'Sec-Fetch-Site': 'cross-site'},
            {'Sec-Fetch-Site': 'same-site'}]) {
            const options = {
                method: 'POST', headers: {Cookie: cookie, ...headers}, ca: readFileSync(site.authority), family: 4, agent: false,
            };
            const request = https.request(at(LOGOUT), options).end();
            const [response] = await once(request, 'response');
            response.resume();
            assert.equal(response.statusCode, 403, JSON.stringify(headers));
        }
        assert.equal(await isSignedIn(browser), true);
        const start = await browser.open(at('/index.cgi'));
        await browser.submit(start, {}, () => true);
        assert.equal(await isSignedIn(browser), false);
    });
});
