// The site, users and report of a walk.
import {readFileSync} from 'node:fs';

import {makeUsers, startSite} from '../site/site.mjs';
import {Report} from './step_report.mjs';
import {Walk} from './walk.mjs';

const USERS = {alice: 'alice@corp.example.net', bob: 'bob@corp.example.net', carol: 'carol@elsewhere.example.org'};

export async function startEverything(webroot, nodeModules, report = new Report()) {
    const asked = [];
    const site = await startSite({
        webroot,
        nodeModules,
        users: makeUsers(USERS),
        onRequest(request) {
            asked.push(request);
            report.applianceAsked(request);
        },
        onLog: (line) => report.logged(line),
    });
    report.nameSite(site.origin, 'appliance');
    report.nameSite(site.provider.address, 'provider');
    return {...site, asked, report};
}

export function makeWalk(running) {
    return new Walk({
        origin: running.origin,
        provider: running.provider.address,
        passwords: new Map([...running.users].map(([login, {password}]) => [login, password])),
        authority: readFileSync(running.authority),
        asked: running.asked,
        log: running.log,
        report: running.report,
    });
}
