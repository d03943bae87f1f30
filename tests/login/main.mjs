// Signs users in at a real OpenID provider through the front end, or serves both until it is ended. Runs as root of
// private namespaces; see `run`.
import assert from 'node:assert/strict';
import {copyFileSync, readFileSync, rmSync} from 'node:fs';

import {useProfile, writeSettings} from '../site/appliance.mjs';
import {makeUsers, startSite} from '../site/site.mjs';
import {Report} from './report.mjs';
import {Walk} from './walk.mjs';

const USERS = {alice: 'alice@corp.example.net', bob: 'bob@corp.example.net', carol: 'carol@elsewhere.example.org'};

async function startEverything(webroot, nodeModules) {
    const asked = [];
    const report = new Report();
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

async function walkAzure(walk, report) {
    useProfile('azure');
    report.title('Profile azure: alice signs in');
    const browser = walk.newBrowser();
    await walk.openSite(browser);
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

async function walkReadmeProgram(walk, report, {provider, clients}) {
    writeSettings({provider, clients: clients.map((client) => ({...client, redirectURI: client.otherRedirectURI}))});
    for (const [profile, login, name] of [['azure', 'alice', 'ACME\\alice'], ['websphere', 'bob', 'bob']]) {
        useProfile(profile);
        report.title(`Profile ${profile}: ${login} signs in through the program of the README`);
        assert.equal(await walk.signInThroughReadmeProgram(walk.newBrowser(), login), name);
    }
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
    await walkReadmeProgram(walk, report, running);
    report.title('Every step was as it should be. Signed in through a real OpenID provider:');
    report.fact(`azure      ${azureUser}`);
    report.fact(`websphere  ${websphereUser}`);
}

async function serve(running, profile, authorityFile) {
    useProfile(profile);
    copyFileSync(running.authority, authorityFile);
    console.log(`\nServing with profile ${profile}, until Ctrl-C:\n\n  ${running.origin}/\n`);
    console.log(`The browser has to trust this authority, made for this run:\n\n  ${authorityFile}\n`);
    console.log(`or else, with Chromium or Chrome, in a profile of its own:\n`);
    console.log(`  chromium --user-data-dir="$(mktemp -d)" ${running.chromiumTrust} ${running.origin}/\n\nUsers:\n`);
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
const running = await startEverything(webroot, nodeModules);
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
    await running.stop();
}
