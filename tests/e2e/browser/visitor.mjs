// A user with a browser. Pages are read by the roles and names that screen readers use.
import assert from 'node:assert/strict';

const PATIENCE = 15_000;
export const RETURN_PAGE = '/webman/sso/return.cgi';
export const RELAY_PAGE = '/webman/ssoclient/relay.html';

export class Visitor {
    complaints = [];
    /** The codes in return addresses. */
    codes = new Set();

    static async arrive(stage, {expects, ...options}) {
        const context = await stage.browser.newContext({locale: 'en', ...options});
        context.setDefaultTimeout(PATIENCE);
        const visitor = new Visitor(stage, context);
        visitor.#listen(expects);
        visitor.page = await context.newPage();
        return visitor;
    }

    constructor(stage, context) {
        Object.assign(this, {stage, context});
    }

    #listen(expected) {
        const complain = (text) => {
            if (!expected?.test(text)) {
                this.complaints.push(text);
            }
        };
        this.context.on('request', (request) => {
            const url = new URL(request.url());
            if (!this.stage.isOfTheSite(url)) {
                complain(`asked for ${url}`);
            }
            if (url.pathname === RETURN_PAGE && url.searchParams.get('code')) {
                this.codes.add(url.searchParams.get('code'));
            }
        });
        this.context.on('console', (message) => message.type() === 'error' && complain(message.text()));
        this.context.on('weberror', (error) => complain(String(error.error())));
        this.context.on('dialog', (dialog) => {
            complain(`a dialog: ${dialog.message()}`);
            dialog.dismiss();
        });
    }

    leave() {
        return this.context.close();
    }

    /** Another tab of the same browser. */
    async openTab() {
        const tab = new Visitor(this.stage, this.context);
        tab.page = await this.context.newPage();
        return tab;
    }

    open(address, options) {
        return this.page.goto(new URL(address, this.stage.origin).href, options);
    }

    // Expectations.

    async seesHeading(name) {
        await this.page.getByRole('heading', {level: 1, name, exact: true}).waitFor();
    }

    async seesText(text) {
        await this.page.getByText(text).waitFor();
    }

    async isSignedInAs(user) {
        await this.open('/index.cgi');
        await this.seesHeading('Welcome');
        assert.equal(await this.page.getByRole('strong').textContent(), user);
    }

    async isSignedOut() {
        await this.open('/index.cgi');
        await this.seesHeading('Sign in');
    }

    /** Expects a failure on the relay page. Returns the text of "Details". */
    async seesFailure(explanation) {
        await this.seesHeading('Sign-in failed');
        assert.match(await this.page.getByRole('status').textContent(), explanation);
        await this.page.getByRole('link', {name: 'Try again', exact: true}).waitFor();
        // Hidden from screen readers until unfolded.
        const reason = this.page.getByRole('group').getByRole('paragraph');
        assert.equal(await reason.count(), 0);
        await this.page.getByText('Details', {exact: true}).click();
        return reason.textContent();
    }

    path() {
        const {pathname, search} = new URL(this.page.url());
        return pathname + search;
    }

    // Actions.

    async goToProvider() {
        await this.open('/index.cgi');
        await this.followSignIn();
    }

    async followSignIn() {
        await this.page.getByRole('link', {name: 'Sign in with your organisation account', exact: true}).click();
        await this.seesHeading('Sign in to Example organisation');
    }

    async giveNameAndPassword(login) {
        await this.page.getByRole('textbox', {name: 'Name', exact: true}).fill(login);
        await this.page.getByLabel('Password').fill(this.stage.site.users.get(login).password);
        // The next page may be held.
        await this.page.getByRole('button', {name: 'Sign in', exact: true}).click({noWaitAfter: true});
    }

    /** Submits name and password, and does not wait for the result. */
    async tryToSignIn(login) {
        await this.goToProvider();
        await this.giveNameAndPassword(login);
    }

    async signIn(login) {
        await this.tryToSignIn(login);
        await this.seesHeading('Welcome');
    }

    async press(name) {
        await this.page.getByRole('button', {name, exact: true}).click();
    }

    /** Signs in at the provider. Returns the return address, without opening it. */
    async stopBeforeReturn(login) {
        const held = await this.holdReturn();
        await this.tryToSignIn(login);
        const address = await held.address;
        await held.drop();
        return new URL(address);
    }

    /** Holds the return to the appliance. Playwright's routes do not see redirects. */
    async holdReturn() {
        const session = await this.context.newCDPSession(this.page);
        const pattern = `${this.stage.origin}${RETURN_PAGE}*`;
        await session.send('Fetch.enable', {patterns: [{urlPattern: pattern, requestStage: 'Request'}]});
        const paused = new Promise((resolve) => {
            session.once('Fetch.requestPaused', resolve);
        });
        const finish = (command, parameters) => async () => {
            const {requestId} = await paused;
            await session.send(command, {requestId, ...parameters});
            await session.detach();
        };
        return {
            address: paused.then(({request}) => request.url),
            go: finish('Fetch.continueRequest'),
            // An answer without content leaves the form on the screen.
            drop: finish('Fetch.fulfillRequest', {responseCode: 204}),
        };
    }
}
