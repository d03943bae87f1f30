// Signs users in at a real OpenID provider through the front end, or serves both until interrupted. Runs as root of
// private namespaces; see `walk_logins`.
import assert from 'node:assert/strict';
import {copyFileSync, rmSync} from 'node:fs';

import {Controller} from '../directory/controller.mjs';
import {useProfile, writeDomains, writeSettings} from '../site/front_end.mjs';
import {makeWalk, startEverything} from './login_stage.mjs';
import {README_PROGRAM} from './walk.mjs';

async function walkAzure(walk, report) {
    useProfile('azure');
    report.title('Profile azure: alice signs in');
    const browser = walk.newBrowser();
    await walk.openSite(browser);
    const user = await walk.signIn(browser, 'alice');
    assert.equal(user, 'ACME\\alice');

    report.title('The same return a second time: rejected before the token request; alice stays signed in');
    const again = walk.goAgain(browser, walk.lastReturnAddress(browser));
    assert.equal(await walk.expectNoTokenRequest(again), 'This sign-in was not started in this browser.');
    assert.equal(await walk.userOf(browser), user);

    report.title('Profile azure: alice signs out of the appliance and of the provider');
    assert.equal(await walk.signOut(browser), '/webman/ssoclient/relay.html');

    report.title('Profile azure: carol fails to sign in, because the appliance does not know her domain');
    assert.equal(await walk.failToSignIn(walk.newBrowser(), 'carol'), 'TAVOWinsUserNameFqdn2Netbios failed.');

    report.title('Profile azure: a user cancels at the provider');
    assert.equal(
        await walk.expectNoTokenRequest(walk.cancel(walk.newBrowser())),
        'The provider refused: access_denied (The user cancelled.)');

    report.title("Login CSRF: a victim's browser opens the return address of another user's sign-in");
    const foreign = await walk.startSignIn(walk.newBrowser(), 'alice');
    const victim = walk.newBrowser();
    assert.equal(
        await walk.expectNoTokenRequest(walk.goAgain(victim, foreign)),
        'This sign-in was not started in this browser.');
    assert.equal(await walk.userOf(victim), undefined);

    report.title('Forged relay addresses: the page stays on this site');
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
        const browser = walk.newBrowser();
        assert.equal(await walk.signInThroughReadmeProgram(browser, login), name);
        await walk.isRefusedByReadmeProgram(walk.newBrowser(), walk.lastReturnAddress(browser, README_PROGRAM));
    }
}

async function walkEverything(running) {
    const {report} = running;
    const walk = makeWalk(running);
    const azureUser = await walkAzure(walk, report);
    const websphereUser = await walkWebsphere(walk, report);
    await walkReadmeProgram(walk, report, running);
    report.title('All steps passed. Signed in through a real OpenID provider:');
    report.fact(`azure      ${azureUser}`);
    report.fact(`websphere  ${websphereUser}`);
}

async function serve(running, profile, authorityFile) {
    useProfile(profile);
    copyFileSync(running.authority, authorityFile);
    console.log(`\nServing profile ${profile} until Ctrl-C:\n\n  ${running.origin}/\n`);
    console.log(`The browser must trust this authority, which is new for each run:\n\n  ${authorityFile}\n`);
    console.log(`Or start Chromium or Chrome with a temporary profile:\n`);
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

/** The same walk with an empty domains.conf: the directory knows the domain. */
async function walkWithDirectory(running) {
    const controller = await Controller.start();
    try {
        running.report.title(`A domain controller of CORP.EXAMPLE.NET, NetBIOS name ACME, started in ${controller.seconds} s`);
        writeDomains({});
        running.report.fact('domains.conf is empty; winbindd converts the domain');
        await walkEverything(running);
        running.report.fact('directory  winbindd converted CORP.EXAMPLE.NET to ACME');
    } finally {
        await controller.stop();
    }
}

const [webroot, nodeModules, mode, authorityFile] = process.argv.slice(2);
const running = await startEverything(webroot, nodeModules);
try {
    if (mode === 'directory') {
        await walkWithDirectory(running);
    } else if (mode) {
        await serve(running, mode, authorityFile);
    } else {
        await walkEverything(running);
    }
} catch (failure) {
    console.error(`\nFAILED: ${failure.message}\n\nThe web server's log:\n${running.webServer.log()}`);
    process.exitCode = 1;
} finally {
    await running.stop();
}
