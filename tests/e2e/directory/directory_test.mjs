// The stand-in's conversion of domain names, and logins that rest on it, against a real domain controller of
// CORP.EXAMPLE.NET, NetBIOS name ACME. Runs as root of private namespaces.
import assert from 'node:assert/strict';
import {spawn} from 'node:child_process';
import {once} from 'node:events';
import {readFileSync} from 'node:fs';
import readline from 'node:readline';
import {after, afterEach, before, beforeEach, describe, test} from 'node:test';

import {makeWalk, startEverything} from '../login/login_stage.mjs';
import {useProfile, writeDomains} from '../site/front_end.mjs';
import {Controller} from './controller.mjs';

const [webroot, nodeModules, convertProgram] = process.argv.slice(2);
const NOBODY = 65534;
const NOT_CONVERTED = 'TAVOWinsUserNameFqdn2Netbios failed.';
// Ids of others can be taken on where all of them are mapped: not by an ordinary user of the machine.
const mayBeAnyone = / 4294967295$/m.test(readFileSync('/proc/self/uid_map', 'utf8'));

const silent = {title() {}, fact() {}, browserAsked() {}, applianceAsked() {}, logged() {}, nameSite() {}};

/** A program that converts one name after the other. */
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

    /** Ends it with the test, also with one that has failed: it would keep this program waiting. */
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
    console.log(`a domain controller, provisioned and started: ${controller.seconds} s`);
});
after(() => controller.stop());

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

describe('The directory', () => {
    test('tells the NetBIOS name of its own domain, as it spells it, for the DNS name in any case', async () => {
        for (const domain of ['CORP.EXAMPLE.NET', 'corp.example.net', 'Corp.Example.Net']) {
            await expectConverted(`${domain}\\alice`, 'ACME\\alice');
        }
    });

    test('tells that of a domain that it trusts', async () => {
        await expectConverted('LAB.EXAMPLE.NET\\bob', 'LABOR\\bob');
        await expectConverted('lab.Example.net\\bob', 'LABOR\\bob');
    });

    test('knows no other domain, and no part of its own', async () => {
        for (const domain of [
            'ELSEWHERE.EXAMPLE.ORG', 'CORP', 'EXAMPLE.NET', 'CORP.EXAMPLE.NET.', 'CORP.EXAMPLE.NET ', ' ', 'C\u00d6RP',
            'LAB', '%s%n', 'x'.repeat(255),
        ]) {
            await expectRefused(domain, 'does not know it');
        }
    });

    test('is not believed about names that are none of the DNS', async () => {
        for (const domain of ['ACME', 'acme', 'LABOR', 'BUILTIN', 'DC1', 'NT AUTHORITY']) {
            await expectRefused(domain, 'does not know it');
        }
    });

    test('comes behind the table, for the domains that the table names', async () => {
        writeDomains({'corp.example.net': 'TABLE', 'elsewhere.example.org': 'ELSEWHERE', 'lab.example.net': ''});
        await expectConverted('CORP.EXAMPLE.NET\\alice', 'TABLE\\alice');
        await expectConverted('ELSEWHERE.EXAMPLE.ORG\\carol', 'ELSEWHERE\\carol');
        await expectConverted('LAB.EXAMPLE.NET\\bob', 'LABOR\\bob');
    });

    test('is asked whatever the environment says', async (context) => {
        const environment = {_NO_WINBINDD: '1', SELFTEST_WINBINDD_SOCKET_DIR: '/tmp'};
        const other = Converter.forTest(context, {environment});
        await expectConverted('CORP.EXAMPLE.NET\\alice', 'ACME\\alice', other);
    });

    test('answers an ordinary user as it does root', {skip: !mayBeAnyone && 'not run: needs the ids of other users'},
        async (context) => {
            const other = Converter.forTest(context, {args: [String(NOBODY)]});
            await expectConverted('CORP.EXAMPLE.NET\\alice', 'ACME\\alice', other);
            await expectConverted('LAB.EXAMPLE.NET\\bob', 'LABOR\\bob', other);
        });
});

describe('A program that converts names', () => {
    test('is told of a winbindd that hangs while it hangs', async () => {
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

    test('is told of a winbindd that is gone, and is answered by the next one', async () => {
        await expectConverted('CORP.EXAMPLE.NET\\alice', 'ACME\\alice');
        await controller.killWinbindd();
        await expectRefused('CORP.EXAMPLE.NET', 'is not available');
        await controller.startWinbindd();
        await expectConverted('CORP.EXAMPLE.NET\\alice', 'ACME\\alice');
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
        site.asked.splice(0); // the walk counts the requests of the login that it walks
    }

    test('ends under the NetBIOS name that the directory tells', async () => {
        assert.equal(await walk.signIn(walk.newBrowser(), 'alice'), 'ACME\\alice');
    });

    test('ends under the name of the table where that has the domain', async () => {
        writeDomains({'corp.example.net': 'TABLE'});
        assert.equal(await walk.signIn(walk.newBrowser(), 'alice'), 'TABLE\\alice');
    });

    test('is refused where neither knows the domain', () =>
        expectFailing('carol', /domain 'ELSEWHERE\.EXAMPLE\.ORG' is .* winbindd does not know it$/));

    test('ends while winbindd hangs', async () => {
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

    test('is refused without a winbindd, and succeeds again with the next one', async () => {
        await controller.killWinbindd();
        await expectFailing('alice', /domain 'CORP\.EXAMPLE\.NET' is .* winbindd is not available$/);
        await controller.startWinbindd();
        assert.equal(await walk.signIn(walk.newBrowser(), 'alice'), 'ACME\\alice');
    });
});
