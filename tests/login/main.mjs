// Signs users in at a real OpenID provider through the front end, or serves both until it is ended. Runs as root of
// private namespaces; see `run`.
import assert from 'node:assert/strict';
import {randomBytes, randomUUID} from 'node:crypto';
import {copyFileSync, mkdtempSync, readFileSync, rmSync} from 'node:fs';
import path from 'node:path';

import {configure, listen, startWebServer, useProfile} from './appliance.mjs';
import {makeAuthority} from './authority.mjs';
import {startProvider} from './provider.mjs';
import {Report} from './report.mjs';
import {collectSystemLog} from './system_log.mjs';
import {Walk} from './walk.mjs';

const SYSTEM_BUNDLE = '/etc/ssl/certs/ca-certificates.crt';
const DOMAINS = {'corp.example.net': 'ACME'};

const randomSecret = () => randomBytes(24).toString('base64url');
const randomPassword = () => randomBytes(9).toString('base64url');

function makeUsers() {
    const named = {alice: 'alice@corp.example.net', bob: 'bob@corp.example.net', carol: 'carol@elsewhere.example.org'};
    const entries = Object.entries(named).map(([login, uniqueName]) => [login, {uniqueName, password: randomPassword()}]);
    return new Map(entries);
}

function makeClients(origin, tenant) {
    const common = {redirectURI: `${origin}/webman/sso/return.cgi`, logoutURI: `${origin}/webman/ssoclient/relay.html`};
    return [
        {id: 'appliance-azure', secret: randomSecret(), algorithm: 'RS256', tenant, ...common},
        {id: 'appliance-websphere', secret: randomSecret(), algorithm: 'HS256', ...common},
    ];
}

async function startEverything({webroot, nodeModules, folder}) {
    const running = {asked: [], users: makeUsers(), steps: []};
    const authority = makeAuthority(folder);
    running.authority = authority.file;
    copyFileSync(authority.file, SYSTEM_BUNDLE);

    const socket = await listen();
    running.origin = `https://localhost:${socket.address().port}`;
    const tenant = randomUUID();
    const clients = makeClients(running.origin, tenant);
    running.provider = await startProvider({
        nodeModules,
        tenant,
        clients,
        users: running.users,
        certificate: authority.issue('provider', 'IP:127.0.0.1'),
        report(request) {
            running.asked.push(request);
            running.report.applianceAsked(request);
        },
    });
    running.report = new Report(new Map([[running.origin, 'appliance'], [running.provider.address, 'provider']]));
    running.log = await collectSystemLog((line) => running.report.logged(line));
    configure({provider: running.provider, clients, domains: DOMAINS});
    const certificate = authority.issue('appliance', 'DNS:localhost');
    running.webServer = startWebServer({socket, webroot, certificate, folder});
    return running;
}

async function stopEverything({webServer, provider, log}) {
    await webServer.stop();
    provider.stop();
    log.stop();
}

async function walkAzure(walk, report) {
    useProfile('azure');
    report.title('Profile azure: alice signs in');
    const browser = walk.newBrowser();
    const user = await walk.signIn(browser, 'alice');
    assert.equal(user, 'ACME\\alice');

    report.title('The same answer of the provider a second time: refused before the code is used, alice stays signed in');
    const again = walk.goAgain(browser, walk.lastReturnAddress(browser));
    assert.equal(await walk.refusedBeforeTheTokenRequest(again), 'This sign-in was not started in this browser.');
    assert.equal(await walk.userOf(browser), user);

    report.title('Profile azure: alice signs out, here and at the provider');
    assert.equal(await walk.signOut(browser), '/webman/ssoclient/relay.html');

    report.title('Profile azure: carol, whose domain the appliance does not know, is told why she cannot sign in');
    assert.equal(await walk.failToSignIn(walk.newBrowser(), 'carol'), 'TAVOWinsUserNameFqdn2Netbios failed.');

    report.title('Profile azure: a user cancels at the provider');
    assert.equal(
        await walk.refusedBeforeTheTokenRequest(walk.cancel(walk.newBrowser())),
        'The provider refused: access_denied (The user cancelled.)');

    report.title("Login CSRF: a victim's browser is sent to the return address of someone else's sign-in");
    const foreign = await walk.startSignIn(walk.newBrowser(), 'alice');
    const victim = walk.newBrowser();
    assert.equal(
        await walk.refusedBeforeTheTokenRequest(walk.goAgain(victim, foreign)),
        'This sign-in was not started in this browser.');
    assert.equal(await walk.userOf(victim), undefined);

    report.title('Forged relay addresses: the page stays on its own site');
    for (const origin of ['//evil.example', '/\\evil.example', 'https://evil.example/', 'javascript:alert(1)', '/\t/evil']) {
        report.fact(`origin ${JSON.stringify(origin)}:`);
        const fragment = new URLSearchParams({origin, success: 'true'}).toString();
        assert.equal(await walk.followForgedFragment(victim, fragment), '/index.cgi');
    }
    return user;
}

async function walkWebsphere(walk, report) {
    useProfile('websphere');
    report.title('Profile websphere: bob signs in');
    const browser = walk.newBrowser();
    const user = await walk.signIn(browser, 'bob');
    assert.equal(user, 'bob');

    report.title('Profile websphere: bob signs out');
    assert.equal(await walk.signOut(browser), '/index.cgi');
    return user;
}

async function walkEverything(running) {
    const {report} = running;
    const walk = new Walk({
        origin: running.origin,
        provider: running.provider.address,
        passwords: new Map([...running.users].map(([login, {password}]) => [login, password])),
        authority: readFileSync(running.authority),
        asked: running.asked,
        log: running.log,
        report,
    });
    const azureUser = await walkAzure(walk, report);
    const websphereUser = await walkWebsphere(walk, report);
    report.title('Every step was as it should be. Signed in through a real OpenID provider:');
    report.fact(`azure      ${azureUser}`);
    report.fact(`websphere  ${websphereUser}`);
}

async function serve(running, profile, authorityFile) {
    useProfile(profile);
    copyFileSync(running.authority, authorityFile);
    console.log(`\nServing with profile ${profile}, until Ctrl-C:\n\n  ${running.origin}/\n`);
    console.log(`The browser has to trust this authority, made for this run:\n\n  ${authorityFile}\n\nUsers:\n`);
    for (const [login, {password, uniqueName}] of running.users) {
        console.log(`  ${login.padEnd(6)} password ${password}  (${uniqueName})`);
    }
    console.log();
    await new Promise((resolve) => {
        process.once('SIGINT', resolve);
        process.once('SIGTERM', resolve);
    });
    rmSync(authorityFile);
}

const [webroot, nodeModules, profile, authorityFile] = process.argv.slice(2);
const folder = mkdtempSync('/tmp/login-');
const running = await startEverything({webroot, nodeModules, folder});
try {
    if (profile) {
        await serve(running, profile, authorityFile);
    } else {
        await walkEverything(running);
    }
} catch (failure) {
    console.error(`\nFAILED: ${failure.message}\n\nThe web server's own log:\n${running.webServer.log()}`);
    process.exitCode = 1;
} finally {
    await stopEverything(running);
}
