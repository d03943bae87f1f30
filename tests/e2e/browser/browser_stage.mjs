// What every test plays on: the site, and one Chromium that trusts the site's certificates and no others.
import assert from 'node:assert/strict';
import {readFileSync} from 'node:fs';
import path from 'node:path';

import {useProfile, writeSettings} from '../site/front_end.mjs';
import {makeUsers, startSite} from '../site/site.mjs';
import {startChromium} from './chromium.mjs';
import {Visitor} from './visitor.mjs';

export const HTML_LOGIN = '<img src=x onerror=alert(1)>';

const USERS = {
    alice: 'alice@corp.example.net',
    bob: 'bob@corp.example.net',
    carol: 'carol@elsewhere.example.org',
    dora: 'dora@corp.example.net',
    [HTML_LOGIN]: `${HTML_LOGIN}@corp.example.net`,
};

class Stage {
    constructor(properties) {
        Object.assign(this, properties);
        this.origin = this.site.origin;
    }

    /** A working site with the given profile. */
    reset(profile = 'azure') {
        useProfile(profile);
        writeSettings(this.site);
        Object.assign(this.site.provider.lifetimes, {code: 60, idToken: 600});
        this.asked.splice(0);
        this.logged.splice(0);
    }

    /** Leaves the appliance with other settings of the clients than the provider has, or with another provider. */
    misconfigure({changes = {}, provider = this.site.provider}) {
        writeSettings({provider, clients: this.site.clients.map((client) => ({...client, ...changes}))});
    }

    /** Whether an address is the appliance's or, all of them having one host, a provider's. */
    isOfTheSite(url) {
        return url.protocol === 'data:' || url.origin === this.origin || url.hostname === '127.0.0.1';
    }

    /** How often the appliance asked the provider for a token. */
    tokenRequests() {
        return this.asked.filter(({path: asked}) => asked === '/token').length;
    }

    /**
     * Lets visitors with a browser context of their own act, then holds against each that the pages logged an error or
     * asked another site for something, or that the appliance logged a code. `options` are Playwright's, and `expects`,
     * a pattern of errors that belong to the test.
     */
    async visit(act, options = {}) {
        const visitors = [];
        for (let i = 0; i < act.length; ++i) {
            visitors.push(await Visitor.arrive(this, options));
        }
        try {
            await act(...visitors);
            visitors.forEach((visitor) => this.#holdAgainst(visitor));
        } finally {
            await Promise.all(visitors.map((visitor) => visitor.leave()));
        }
    }

    #holdAgainst({complaints, codes}) {
        assert.deepEqual(complaints, []);
        const told = [...codes].filter((code) => this.logged.some((line) => line.includes(code)));
        assert.equal(told.length, 0, 'a code was logged');
    }

    async stop() {
        await this.browser.close();
        await this.site.stop();
    }
}

export async function startStage({webroot, siteModules, browserModules, pictures}) {
    const asked = [];
    const logged = [];
    const users = makeUsers(USERS);
    users.get('dora').decidesAlone = true;
    const site = await startSite({
        webroot,
        nodeModules: siteModules,
        users,
        onRequest: (request) => asked.push(request),
        onLog: (line) => logged.push(line),
    });
    const browser = await startChromium({browserModules, folder: site.folder, switches: [site.chromiumTrust]});
    const axe = readFileSync(path.join(browserModules, 'axe-core/axe.min.js'), 'utf8');
    return new Stage({site, browser, axe, asked, logged, pictures});
}
