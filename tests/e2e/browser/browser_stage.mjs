// The site, and a Chromium that trusts only the site's certificates.
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

    /** Restores a working site with this profile. */
    reset(profile = 'azure') {
        useProfile(profile);
        writeSettings(this.site);
        Object.assign(this.site.provider.lifetimes, {code: 60, idToken: 600});
        this.asked.splice(0);
        this.logged.splice(0);
    }

    /** Gives the appliance other client settings or another provider. */
    misconfigure({changes = {}, provider = this.site.provider}) {
        writeSettings({provider, clients: this.site.clients.map((client) => ({...client, ...changes}))});
    }

    /** Whether an address belongs to the appliance or a provider; providers share a host. */
    isOfTheSite(url) {
        return url.protocol === 'data:' || url.origin === this.origin || url.hostname === '127.0.0.1';
    }

    /** The number of token requests. */
    tokenRequests() {
        return this.asked.filter(({path: asked}) => asked === '/token').length;
    }

    /**
     * Runs `act` with visitors, each with its own browser context. Then requires that their pages logged no errors and
     * sent no requests to other sites, and that the appliance logged no code. `options` are Playwright's, and
     * `expects`, a pattern of expected errors.
     */
    async visit(act, options = {}) {
        const visitors = [];
        for (let i = 0; i < act.length; ++i) {
            visitors.push(await Visitor.arrive(this, options));
        }
        try {
            await act(...visitors);
            visitors.forEach((visitor) => this.#expectNoComplaints(visitor));
        } finally {
            await Promise.all(visitors.map((visitor) => visitor.leave()));
        }
    }

    #expectNoComplaints({complaints, codes}) {
        assert.deepEqual(complaints, []);
        const logged = [...codes].filter((code) => this.logged.some((line) => line.includes(code)));
        assert.equal(logged.length, 0, 'a code was logged');
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
