// The stand-in's conversion of domain names, and logins that use it, with a real domain controller for CORP.EXAMPLE.NET
// (NetBIOS name ACME). Runs as root of private namespaces.
import assert from 'node:assert/strict';
import {spawn, spawnSync} from 'node:child_process';
import {once} from 'node:events';
import {readFileSync} from 'node:fs';
import readline from 'node:readline';
import {after, afterEach, before, beforeEach, describe, test} from 'node:test';

import {makeWalk, startEverything} from '../login/login_stage.mjs';
import {useProfile, writeDomains} from '../site/front_end.mjs';
import {Controller} from './controller.mjs';

const [webroot, nodeModules, convertProgram, platformCheck, standIn] = process.argv.slice(2);
const NOBODY = 65534;
const NOT_CONVERTED = 'TAVOWinsUserNameFqdn2Netbios failed.';
// Other ids are available only if the namespace maps all of them, which needs root.
const hasAllIds = / 4294967295$/m.test(readFileSync('/proc/self/uid_map', 'utf8'));

const silent = {title() {}, fact() {}, browserAsked() {}, applianceAsked() {}, logged() {}, nameSite() {}};

/** A process of the program `convert`. */
class Converter {
    constructor({environment = {}, args = []} = {}) {
        this.process = spawn(convertProgram, args, {
            stdio: ['pipe', 'pipe', 'inherit'],
            env: {...process.env, ...environment},
        });
        this.answers = readline.createInterface({input: this.process.stdout})[Symbol.asyncIterator]();
    }

    async convert(name) {
        this.process.stdin.write(`${name}\n`);
        const {value} = await this.answers.next();
        return JSON.parse(value);
    }

    /** Ends the process with the test, even after a failure, because this program would wait for it. */
    static forTest(context, options) {
        const converter = new Converter(options);
        context.after(() => converter.end());
        return converter;
    }

    async end() {
        this.process.stdin.end();
        const [status] = await once(this.process, 'exit');
        assert.equal(status, 0);
    }
}

let controller;
let converter;

before(async () => {
    controller = await Controller.start();
    console.log(`domain controller started in ${controller.seconds} s`);
});
after(() => controller?.stop());

beforeEach(() => {
    writeDomains({});
    converter = new Converter();
});
afterEach(() => converter.end());

async function expectConverted(name, expected, by = converter) {
    assert.deepEqual(await by.convert(name), {name: expected, log: []});
}

async function expectRefused(domain, why) {
    const line = `platform:N domain '${domain}' is not in domains.conf, and winbindd ${why}`;
    assert.deepEqual(await converter.convert(`${domain}\\alice`), {name: null, log: [line]});
}

describe('Domain lookup', () => {
    test('converts the DNS name of its domain, ignoring case', async () => {
        for (const domain of ['CORP.EXAMPLE.NET', 'corp.example.net', 'Corp.Example.Net']) {
            await expectConverted(`${domain}\\alice`, 'ACME\\alice');
        }
    });

    test('converts the DNS name of a trusted domain', async () => {
        await expectConverted('LAB.EXAMPLE.NET\\bob', 'LABOR\\bob');
        await expectConverted('lab.Example.net\\bob', 'LABOR\\bob');
    });

    test('rejects unknown domains and parts of known ones', async () => {
        for (const domain of [
            'ELSEWHERE.EXAMPLE.ORG', 'CORP', 'EXAMPLE.NET', 'CORP.EXAMPLE.NET.', 'CORP.EXAMPLE.NET ', ' ', 'C\u00d6RP',
            'LAB', '%s%n', 'x'.repeat(255),
        ]) {
            await expectRefused(domain, 'does not know it');
        }
    });

    test('rejects names that are not DNS names', async () => {
        for (const domain of ['ACME', 'acme', 'LABOR', 'BUILTIN', 'DC1', 'NT AUTHORITY']) {
            await expectRefused(domain, 'does not know it');
        }
    });

    test('prefers the table to the directory', async () => {
        writeDomains({'corp.example.net': 'TABLE', 'elsewhere.example.org': 'ELSEWHERE', 'lab.example.net': ''});
        await expectConverted('CORP.EXAMPLE.NET\\alice', 'TABLE\\alice');
        await expectConverted('ELSEWHERE.EXAMPLE.ORG\\carol', 'ELSEWHERE\\carol');
        await expectConverted('LAB.EXAMPLE.NET\\bob', 'LABOR\\bob');
    });

    test('ignores environment variables', async (context) => {
        const environment = {_NO_WINBINDD: '1', SELFTEST_WINBINDD_SOCKET_DIR: '/tmp'};
        const other = Converter.forTest(context, {environment});
        await expectConverted('CORP.EXAMPLE.NET\\alice', 'ACME\\alice', other);
    });

    test('works for an ordinary user', {skip: !hasAllIds && 'not run: needs the ids of other users'},
        async (context) => {
            const other = Converter.forTest(context, {args: [String(NOBODY)]});
            await expectConverted('CORP.EXAMPLE.NET\\alice', 'ACME\\alice', other);
            await expectConverted('LAB.EXAMPLE.NET\\bob', 'LABOR\\bob', other);
        });
});

describe('A running program', () => {
    test('reports a hanging winbindd and recovers', async () => {
        await controller.stopWinbindd();
        try {
            const began = performance.now();
            await expectRefused('CORP.EXAMPLE.NET', 'does not answer');
            console.log(`with a stopped winbindd, a conversion took ${Math.round(performance.now() - began)} ms`);
            assert.ok(controller.isWinbinddStopped);
        } finally {
            controller.continueWinbindd();
        }
        await expectConverted('CORP.EXAMPLE.NET\\alice', 'ACME\\alice');
    });

    test('reports a missing winbindd and recovers', async () => {
        await expectConverted('CORP.EXAMPLE.NET\\alice', 'ACME\\alice');
        await controller.killWinbindd();
        await expectRefused('CORP.EXAMPLE.NET', 'is not available');
        await controller.startWinbindd();
        await expectConverted('CORP.EXAMPLE.NET\\alice', 'ACME\\alice');
    });
});

describe('The stand-in', () => {
    function expectPromisesKept(args) {
        const {status, stdout} = spawnSync(platformCheck, [...args, standIn], {encoding: 'utf8'});
        assert.match(stdout, /\n\d+ promises: [1-9]\d* kept, 0 broken, /);
        assert.equal(status, 0);
    }

    test('keeps all promises of the platform', () =>
        expectPromisesKept(['--lookup', 'CORP.EXAMPLE.NET\\alice=ACME\\alice']));

    test('keeps its promises while winbindd hangs', async () => {
        await controller.stopWinbindd();
        try {
            expectPromisesKept([]);
            assert.ok(controller.isWinbinddStopped);
        } finally {
            controller.continueWinbindd();
        }
    });
});

describe('An Azure login', () => {
    let site;
    let walk;
    before(async () => {
        site = await startEverything(webroot, nodeModules, silent);
        walk = makeWalk(site);
    });
    after(() => site.stop());
    beforeEach(() => useProfile('azure'));

    async function expectFailing(login, line) {
        const reason = walk.failToSignIn(walk.newBrowser(), login);
        const logged = await site.log.until(/^return\.cgi: platform:\d+ /);
        assert.match(logged, line);
        assert.equal(await reason, NOT_CONVERTED);
        site.asked.splice(0); // the walk expects only requests of this login
    }

    test('uses the NetBIOS name from the directory', async () => {
        assert.equal(await walk.signIn(walk.newBrowser(), 'alice'), 'ACME\\alice');
    });

    test('prefers the name in the table', async () => {
        writeDomains({'corp.example.net': 'TABLE'});
        assert.equal(await walk.signIn(walk.newBrowser(), 'alice'), 'TABLE\\alice');
    });

    test('fails if neither knows the domain', () =>
        expectFailing('carol', /domain 'ELSEWHERE\.EXAMPLE\.ORG' is .* winbindd does not know it$/));

    test('fails while winbindd hangs', async () => {
        await controller.stopWinbindd();
        try {
            const began = performance.now();
            await expectFailing('alice', /domain 'CORP\.EXAMPLE\.NET' is .* winbindd does not answer$/);
            console.log(`with a stopped winbindd, a login took ${Math.round(performance.now() - began)} ms`);
            assert.ok(controller.isWinbinddStopped);
        } finally {
            controller.continueWinbindd();
        }
        assert.equal(await walk.signIn(walk.newBrowser(), 'alice'), 'ACME\\alice');
    });

    test('fails without winbindd and recovers', async () => {
        await controller.killWinbindd();
        await expectFailing('alice', /domain 'CORP\.EXAMPLE\.NET' is .* winbindd is not available$/);
        await controller.startWinbindd();
        assert.equal(await walk.signIn(walk.newBrowser(), 'alice'), 'ACME\\alice');
    });
});
