import assert from 'node:assert/strict';
import {readdirSync, readFileSync, utimesSync} from 'node:fs';
import {it} from 'node:test';

import {startLeakyEndpoint, TOKEN} from './leaky_endpoint.mjs';
import {HTML_LOGIN} from './browser_stage.mjs';
import {RELAY_PAGE, RETURN_PAGE} from './visitor.mjs';

const PENDING_LOGINS = '/usr/tavo/var/frontend/logins';
const NOT_STARTED_HERE = /This sign-in was not started in this browser/;
const STOPPED = /For your security, this sign-in was stopped/;
const START_PAGE = '/index.cgi';
const {foreign} = JSON.parse(readFileSync(new URL('../../frontend/origins.json', import.meta.url)));

const returnWith = (values) => `${RETURN_PAGE}?${new URLSearchParams(values)}`;
const relayWith = (values) => `${RELAY_PAGE}#${new URLSearchParams(values)}`;
const stateOf = (address) => address.searchParams.get('state');
const codeOf = (address) => address.searchParams.get('code');
const readState = (state) => JSON.parse(Buffer.from(state, 'base64'));
const writeState = (object) => Buffer.from(`${JSON.stringify(object)}\n`).toString('base64');
const sessionOf = async (visitor) => (await visitor.context.cookies()).find(({name}) => name === '__Host-session');

function makePendingLoginsOld() {
    const names = readdirSync(PENDING_LOGINS);
    assert.notEqual(names.length, 0);
    const past = Date.now() / 1000 - 601;
    names.forEach((name) => utimesSync(`${PENDING_LOGINS}/${name}`, past, past));
}

function defineLoginCsrf(stage) {
    it('a state of another browser (login CSRF)', () => stage.visit(async (attacker, victim) => {
        const address = await attacker.stopBeforeReturn('bob');
        await victim.goToProvider();
        await victim.open(address);
        await victim.seesFailure(NOT_STARTED_HERE);
        assert.equal(stage.tokenRequests(), 0);
        await victim.isSignedOut();
    }));

    it('a missing or repeated state (login CSRF)', () => stage.visit(async (attacker, victim) => {
        const address = await attacker.stopBeforeReturn('bob');
        const own = stateOf(await victim.stopBeforeReturn('alice'));
        const code = codeOf(address);
        for (const values of [{code}, {code, state: ''}, [['code', code], ['state', own], ['state', stateOf(address)]]]) {
            await victim.open(returnWith(values));
            assert.equal(await victim.seesFailure(/Something went wrong/), "The provider's answer has no single state.");
        }
        assert.equal(stage.tokenRequests(), 0);
        await victim.isSignedOut();
    }));

    it('a used state (login CSRF)', () => stage.visit(async (visitor) => {
        const address = await visitor.stopBeforeReturn('alice');
        const cookies = await visitor.context.cookies();
        await visitor.open(address);
        await visitor.seesHeading('Welcome');
        await visitor.press('Sign out');
        await visitor.seesHeading('Sign out of Example organisation?');
        // The cookie alone must not suffice.
        await visitor.context.addCookies(cookies);
        await visitor.open(address);
        await visitor.seesFailure(/took too long, or was already completed/);
        assert.equal(stage.tokenRequests(), 1);
        await visitor.isSignedOut();
    }));

    it('an expired state (login CSRF)', () => stage.visit(async (visitor) => {
        const address = await visitor.stopBeforeReturn('alice');
        makePendingLoginsOld();
        await visitor.open(address);
        await visitor.seesFailure(/took too long, or was already completed/);
        assert.equal(stage.tokenRequests(), 0);
        await visitor.isSignedOut();
    }));
}

function defineStolenTokens(stage) {
    for (const profile of ['azure', 'websphere']) {
        it(`a stolen code (${profile})`, () =>
            stage.visit(async (victim, attacker) => {
                stage.reset(profile);
                const stolen = await victim.stopBeforeReturn('alice');
                const own = await attacker.stopBeforeReturn('bob');
                await attacker.open(returnWith({code: codeOf(stolen), state: stateOf(own)}));
                await attacker.seesFailure(STOPPED);
                assert.equal(stage.tokenRequests(), 1);
                await attacker.isSignedOut();
            }));
    }

    it('a stolen code with a forged nonce in the state', () =>
        stage.visit(async (victim, attacker) => {
            const stolen = await victim.stopBeforeReturn('alice');
            const own = readState(stateOf(await attacker.stopBeforeReturn('bob')));
            const state = writeState({...own, nonce: readState(stateOf(stolen)).nonce});
            await attacker.open(returnWith({code: codeOf(stolen), state}));
            await attacker.seesFailure(STOPPED);
            assert.equal(stage.tokenRequests(), 0);
            await attacker.isSignedOut();
        }));
}

function defineOpenRedirects(stage) {
    it('foreign origins in the relay script', () =>
        stage.visit(async (visitor) => {
            assert.ok(foreign.length >= 200);
            await visitor.open(RELAY_PAGE);
            const onward = await visitor.page.evaluate(async ({script, fragments}) => {
                const {describe} = await import(script);
                return fragments.map((fragment) => new URL(describe(fragment).onward, location).href);
            }, {
                script: RELAY_PAGE.replace(/html$/, 'js'),
                fragments: foreign.map((origin) => `#${new URLSearchParams({origin, success: 'true'})}`),
            });
            assert.deepEqual(onward, foreign.map(() => stage.origin + START_PAGE));
        }));

    it('foreign origins on the relay page', () => stage.visit(async (visitor) => {
        for (const origin of foreign.filter((each, index) => index % 12 === 0)) {
            await visitor.open(relayWith({origin, success: 'true'}));
            await visitor.page.waitForURL((url) => url.pathname !== RELAY_PAGE);
            assert.equal(visitor.page.url(), stage.origin + START_PAGE, JSON.stringify(origin));
        }
    }));

    it('foreign origins of a sign-in', () => stage.visit(async (visitor) => {
        for (const origin of ['//evil.example', 'https:evil.example', '/\\evil.example', 'javascript:alert(1)', '%2F%2Fevil.example']) {
            await visitor.context.clearCookies();
            await visitor.open(`/webman/sso/login.cgi?${new URLSearchParams({origin})}`);
            await visitor.giveNameAndPassword('alice');
            await visitor.seesHeading('Welcome');
            assert.equal(visitor.page.url(), stage.origin + START_PAGE);
        }
    }));
}

function defineInjections(stage) {
    const html = '"><img src=x onerror=alert(1)><script>alert(1)</script>';

    it('HTML and overlong text in the reason', () => stage.visit(async (visitor) => {
        await visitor.open(relayWith({success: 'false', reason: html + 'x'.repeat(50_000)}));
        const reason = await visitor.seesFailure(/Something went wrong/);
        assert.equal(reason.length, 200);
        assert.ok(reason.startsWith(html));
        assert.equal(await visitor.page.getByRole('img').count(), 0);
    }));

    it("HTML in the user's name", () => stage.visit(async (visitor) => {
        await visitor.signIn(HTML_LOGIN);
        await visitor.isSignedInAs(`ACME\\${HTML_LOGIN}`);
        assert.equal(await visitor.page.getByRole('img').count(), 0);
        await visitor.open('/account.cgi');
        assert.equal(await visitor.page.getByRole('definition').first().textContent(), `ACME\\${HTML_LOGIN}`);
        assert.equal(await visitor.page.getByRole('img').count(), 0);
    }));

    it('HTML in the origin', () => stage.visit(async (visitor) => {
        for (const origin of [`/account.cgi?${html}`, "/account.cgi?'><script>alert(1)</script>"]) {
            await visitor.open(`/index.cgi?${new URLSearchParams({origin})}`);
            await visitor.seesHeading('Sign in');
            assert.equal(await visitor.page.getByRole('link').count(), 1);
            assert.equal(await visitor.page.getByRole('img').count(), 0);
        }
    }));

    it('headers and HTML in code and state', () => stage.visit(async (visitor) => {
        const address = await visitor.stopBeforeReturn('alice');
        await visitor.open(returnWith({code: codeOf(address), state: html}));
        await visitor.seesFailure(NOT_STARTED_HERE);
        await visitor.open(returnWith({code: html, state: stateOf(address)}));
        await visitor.seesFailure(/Your sign-in took too long/);
        const lines = 'x\r\nSet-Cookie: injected=1\r\n\r\n';
        for (const values of [{code: lines, state: stateOf(address)}, {code: codeOf(address), state: lines}]) {
            await visitor.open(returnWith(values));
            await visitor.seesFailure(NOT_STARTED_HERE);
        }
        assert.deepEqual((await visitor.context.cookies()).filter(({name}) => name === 'injected'), []);
    }));
}

function defineSessionAttacks(stage) {
    it('a planted session (session fixation)', () => stage.visit(async (attacker, victim) => {
        await attacker.signIn('bob');
        const planted = await sessionOf(attacker);
        await victim.context.addCookies([planted]);
        await victim.open('/webman/sso/login.cgi');
        await victim.giveNameAndPassword('alice');
        await victim.seesHeading('Welcome');
        await victim.isSignedInAs('ACME\\alice');
        assert.notEqual((await sessionOf(victim)).value, planted.value);
        await attacker.isSignedOut();
    }));

    it('access to the session cookie by scripts or other sites', () => stage.visit(async (visitor) => {
        await visitor.signIn('alice');
        const {secure, httpOnly, sameSite, path, expires, domain} = await sessionOf(visitor);
        assert.deepEqual(
            {secure, httpOnly, sameSite, path, expires, domain},
            {secure: true, httpOnly: true, sameSite: 'Lax', path: '/', expires: -1, domain: 'localhost'});
        assert.equal(await visitor.page.evaluate(() => document.cookie), '');
    }));

    it('a repeated code, and keeps the first session', () =>
        stage.visit(async (visitor) => {
            const first = await visitor.stopBeforeReturn('alice');
            await visitor.open(first);
            await visitor.seesHeading('Welcome');
            const held = await visitor.holdReturn();
            await visitor.page.evaluate(() => location.assign('/webman/sso/login.cgi'));
            const second = new URL(await held.address);
            await held.drop();
            await visitor.open(returnWith({code: codeOf(first), state: stateOf(second)}));
            const reason = await visitor.seesFailure(/Your sign-in took too long, or was already completed/);
            assert.match(reason, /^The provider refused: invalid_grant/);
            assert.equal(stage.tokenRequests(), 2);
            await visitor.isSignedInAs('ACME\\alice');
        }));
}

function defineLeaks(stage) {
    it("secrets in the provider's error answer", () =>
        stage.visit(async (visitor) => {
            const leaky = await startLeakyEndpoint(stage.site.providerCertificate);
            try {
                const {endpoints} = stage.site.provider;
                stage.misconfigure({provider: {endpoints: {...endpoints, token: leaky.address}}});
                const held = await visitor.holdReturn();
                await visitor.tryToSignIn('alice');
                const code = codeOf(new URL(await held.address));
                await held.go();
                const reason = await visitor.seesFailure(/Your sign-in took too long/);
                assert.match(reason, /^The provider refused: invalid_grant \(used {2}Set-Cookie: leaked=1/);
                const shown = [...stage.logged, visitor.page.url(), await visitor.page.content()].join('\n');
                assert.match(shown, /frontend: sign-in failed: The provider refused: invalid_grant/);
                for (const secret of [TOKEN, code, stage.site.clients[0].secret]) {
                    assert.ok(!shown.includes(secret), 'a secret was disclosed');
                }
            } finally {
                leaky.stop();
            }
        }));
}

function defineProviderErrors(stage) {
    const errors = [
        ['access_denied', /The sign-in was cancelled/],
        ['temporarily_unavailable', /Try again in a few minutes/],
        ['server_error', /Try again in a few minutes/],
        ['something_new', /Something went wrong/],
        ['', /Something went wrong/],
    ];
    for (const [error, explanation] of errors) {
        it(`a code next to the error ${error || 'without a name'}`, () =>
            stage.visit(async (visitor) => {
                const address = await visitor.stopBeforeReturn('alice');
                await visitor.open(returnWith({error, code: codeOf(address), state: stateOf(address)}));
                const reason = await visitor.seesFailure(explanation);
                assert.equal(reason, `The provider refused: ${error || 'unknown error'}`);
                assert.equal(stage.tokenRequests(), 0);
                await visitor.isSignedOut();
            }));
    }
}

export function defineAttacks(stage) {
    defineLoginCsrf(stage);
    defineStolenTokens(stage);
    defineOpenRedirects(stage);
    defineInjections(stage);
    defineSessionAttacks(stage);
    defineLeaks(stage);
    defineProviderErrors(stage);
}
