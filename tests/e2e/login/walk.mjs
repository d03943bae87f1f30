// Steps of a user at the appliance and at the provider. Each step is verified.
import assert from 'node:assert/strict';

import {Browser} from './browser.mjs';

const START_PAGE = '/index.cgi';
const RELAY_PAGE = '/webman/ssoclient/relay.html';
const RETURN_PAGE = '/webman/sso/return.cgi';
const AUTHORIZATION_PARAMETERS = ['client_id', 'nonce', 'redirect_uri', 'response_type', 'scope', 'state'];
export const README_PROGRAM = '/webman/sso/sso.cgi';
const COOKIE = /^__Host-[\w-]+=[0-9a-f]*; Path=\/; Secure; HttpOnly; SameSite=Lax(; Max-Age=\d+)?$/;

export class Walk {
    /**
     * `origin` is the address of the appliance, `provider` that of the provider, `passwords` those of the users,
     * `authority` the trusted certificate, `asked` the list of the appliance's requests to the provider.
     */
    constructor({origin, provider, passwords, authority, asked, log, report}) {
        Object.assign(this, {origin, provider, passwords, authority, asked, log, report});
    }

    newBrowser() {
        return new Browser(this.authority, (exchange) => {
            this.report.browserAsked(exchange);
            if (exchange.url.origin === this.origin && exchange.url.pathname !== README_PROGRAM) {
                this.#checkApplianceAnswer(exchange.answer);
            }
        });
    }

    /** Signs a user in. Returns the name on the appliance. */
    async signIn(browser, login) {
        const relay = await this.#goToRelayPage(browser, login);
        const view = await this.#runRelayScript(browser, relay);
        assert.equal(view.headline, 'You are signed in');
        assert.equal(view.onward, START_PAGE);
        await this.log.until(/^return\.cgi: frontend: signed in: /);
        assert.equal(this.#tokenRequests(), 1);
        return this.userOf(browser);
    }

    /** The same through the README's program. It opens no session, so the name is read from the log. */
    async signInThroughReadmeProgram(browser, login) {
        const form = await browser.open(this.origin + README_PROGRAM);
        const relay = await browser.submit(form, {login, password: this.passwords.get(login)});
        const view = await this.#runRelayScript(browser, relay);
        assert.equal(view.headline, 'You are signed in');
        const line = await this.log.until(/^sso\.cgi: signed in: /);
        assert.equal(this.#tokenRequests(), 1);
        return line.replace('sso.cgi: signed in: ', '');
    }

    /** Opens a foreign return address, which the README's program must reject. */
    async isRefusedByReadmeProgram(browser, address) {
        const view = await this.#runRelayScript(browser, await browser.open(address));
        assert.equal(view.headline, 'Sign-in failed');
        await this.log.until(/^sso\.cgi: sign-in failed \(other_browser\): /);
        assert.equal(this.#tokenRequests(), 0, 'a token request was made');
    }

    /** Opens the address without a path, as a user types it. */
    async openSite(browser) {
        const site = await browser.open(`${this.origin}/`);
        const start = await browser.open(this.origin + START_PAGE);
        assert.equal(site.url.href, `${this.origin}/`);
        assert.equal(site.text, start.text, 'the address without a path does not show the start page');
    }

    /** The user that the start page shows. */
    async userOf(browser) {
        const start = await browser.open(this.origin + START_PAGE);
        return /<strong><bdi>(.*)<\/bdi><\/strong>/.exec(start.text)?.[1];
    }

    /** Fails to sign in after the provider's page. Returns the reason that the user reads. */
    async failToSignIn(browser, login) {
        const relay = await this.#goToRelayPage(browser, login);
        return this.#readReason(browser, relay);
    }

    /** Cancels at the provider. */
    async cancel(browser) {
        const form = await this.#openSignInForm(browser);
        return this.#readReason(browser, await browser.submit(form, {action: 'cancel'}));
    }

    /** Opens a return address again. */
    async goAgain(browser, address) {
        return this.#readReason(browser, await browser.open(address));
    }

    /** The return address of the last login in the browser's history. */
    lastReturnAddress(browser, page = RETURN_PAGE) {
        return browser.history.findLast(({url}) => url.pathname === page && url.searchParams.has('state')).url;
    }

    /** Signs in at the provider. Returns the return address, without opening it. */
    async startSignIn(browser, login) {
        const form = await this.#openSignInForm(browser);
        const isReturn = (url) => url.pathname === RETURN_PAGE;
        const last = await browser.submit(form, {login, password: this.passwords.get(login)}, isReturn);
        return last.next;
    }

    async signOut(browser) {
        const start = await browser.open(this.origin + START_PAGE);
        let page = await browser.submit(start, {});
        if (page.url.origin === this.provider) {
            page = await browser.submit(page, {logout: 'yes'});
        }
        if (page.url.pathname === RELAY_PAGE) {
            const view = await this.#runRelayScript(browser, page);
            assert.equal(view.headline, 'You are signed out');
        }
        assert.equal(await this.userOf(browser), undefined);
        return page.url.pathname;
    }

    /** The number of token requests since the last call. */
    #tokenRequests() {
        return this.asked.splice(0).filter(({path}) => path === '/token').length;
    }

    async #openSignInForm(browser) {
        const start = await browser.open(this.origin + START_PAGE);
        const link = start.link('Sign in with your organisation account');
        assert.ok(link, 'the start page has no link to sign in');
        const form = await browser.open(link);
        const request = browser.history.findLast(({url}) => url.origin === this.provider && url.pathname === '/auth');
        assert.deepEqual([...request.url.searchParams.keys()], AUTHORIZATION_PARAMETERS);
        assert.ok(form.hasForm, 'the provider shows no form to sign in');
        return form;
    }

    async #goToRelayPage(browser, login) {
        const form = await this.#openSignInForm(browser);
        return browser.submit(form, {login, password: this.passwords.get(login)});
    }

    async #readReason(browser, relay) {
        const view = await this.#runRelayScript(browser, relay);
        assert.equal(view.headline, 'Sign-in failed');
        const line = await this.log.until(/^return\.cgi: frontend: sign-in failed: /);
        assert.ok(line.endsWith(`: ${view.reason}`), 'the log and the page show different reasons');
        return view.reason;
    }

    async expectNoTokenRequest(refusal) {
        this.#tokenRequests();
        const reason = await refusal;
        assert.equal(this.#tokenRequests(), 0, 'a token request was made');
        return reason;
    }

    /** The target of the relay page for a forged fragment. */
    async followForgedFragment(browser, fragment) {
        const page = await browser.open(`${this.origin}${RELAY_PAGE}#${fragment}`);
        return (await this.#runRelayScript(browser, page)).onward;
    }

    // Runs the served script.
    async #runRelayScript(browser, page) {
        assert.equal(page.url.origin + page.url.pathname, this.origin + RELAY_PAGE);
        const source = /<script type="module" src="([^"]+)"><\/script>/.exec(page.text)[1];
        const load = async (file) => import(await this.#fetchModule(browser, new URL(file, page.url)));
        const {describe} = await load(source);
        const {default: messages} = await load('messages/en.js');
        const {headline, explanation, ...others} = describe(page.url.hash);
        const view = {headline: messages[headline], explanation: messages[explanation], ...others};
        const details = view.reason && `, details "${view.reason}"`;
        this.report.fact(`the relay page shows "${view.headline}. ${view.explanation}"${details}; it links to ${view.onward}`);
        return view;
    }

    // A data URL of the module and its imports.
    async #fetchModule(browser, url) {
        const script = await browser.open(url);
        assert.match(script.headers['content-type'], /^text\/javascript/);
        let {text} = script;
        for (const [whole, specifier] of script.text.matchAll(/(?<=^import .* from ')([^']+)(?=';$)/gm)) {
            text = text.replace(whole, await this.#fetchModule(browser, new URL(specifier, url)));
        }
        return `data:text/javascript;base64,${Buffer.from(text).toString('base64')}`;
    }

    #checkApplianceAnswer({status, headers}) {
        assert.ok(status === 200 || status === 302, `the appliance answers ${status}`);
        assert.equal(headers['cache-control'], 'no-store');
        assert.equal(headers['referrer-policy'], 'same-origin');
        assert.equal(headers['x-content-type-options'], 'nosniff');
        assert.match(headers['content-security-policy'], /^default-src 'none';.* frame-ancestors 'none'$/);
        for (const cookie of headers['set-cookie'] ?? []) {
            assert.match(cookie, COOKIE, 'unprotected cookie');
        }
    }
}
