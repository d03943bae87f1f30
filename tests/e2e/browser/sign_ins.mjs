import assert from 'node:assert/strict';
import {it} from 'node:test';

const PROFILES = [['azure', 'ACME\\alice', 'ACME\\bob'], ['websphere', 'alice', 'bob']];
const DEEP_LINK = '/account.cgi?view=all&name=%C3%A4%22';

export function defineSignIns(stage) {
    for (const [profile, alice, bob] of PROFILES) {
        it(`signs in under profile ${profile}`, () => stage.visit(async (visitor) => {
            stage.reset(profile);
            await visitor.isSignedOut();
            await visitor.signIn('alice');
            assert.equal(visitor.path(), '/index.cgi');
            await visitor.isSignedInAs(alice);
            assert.equal(stage.tokenRequests(), 1);
        }));

        it(`comes back to the page that was asked for, under profile ${profile}`, () => stage.visit(async (visitor) => {
            stage.reset(profile);
            await visitor.open(DEEP_LINK);
            await visitor.seesHeading('Sign in');
            await visitor.followSignIn();
            await visitor.giveNameAndPassword('alice');
            await visitor.seesHeading('Your account');
            assert.equal(visitor.path(), DEEP_LINK);
            assert.equal(await visitor.page.getByRole('definition').first().textContent(), alice);
        }));

        it(`keeps two users apart under profile ${profile}`, () => stage.visit(async (first, second) => {
            stage.reset(profile);
            await Promise.all([first.goToProvider(), second.goToProvider()]);
            await Promise.all([first.giveNameAndPassword('alice'), second.giveNameAndPassword('bob')]);
            await Promise.all([first.seesHeading('Welcome'), second.seesHeading('Welcome')]);
            await first.isSignedInAs(alice);
            await second.isSignedInAs(bob);
        }));
    }

    it('signs in by keyboard alone', () => stage.visit(async ({page, ...visitor}) => {
        const {keyboard} = page;
        await page.goto(stage.origin);
        await keyboard.press('Tab');
        assert.equal(await page.evaluate(() => document.activeElement.textContent), 'Sign in with your organisation account');
        await keyboard.press('Enter');
        await page.getByRole('textbox', {name: 'Name', exact: true}).waitFor();
        await keyboard.type('alice');
        await keyboard.press('Tab');
        await keyboard.type(visitor.stage.site.users.get('alice').password);
        await keyboard.press('Enter');
        await page.getByRole('heading', {name: 'Welcome'}).waitFor();
        await keyboard.press('Tab');
        await keyboard.press('Tab');
        assert.equal(await page.evaluate(() => document.activeElement.textContent), 'Sign out');
    }));

    it('signs out at the appliance and at the provider, back to the relay page', () => stage.visit(async (visitor) => {
        await visitor.signIn('alice');
        await visitor.press('Sign out');
        await visitor.seesHeading('Sign out of Example organisation?');
        await visitor.press('Sign out');
        await visitor.seesHeading('You are signed out');
        await visitor.page.getByRole('link', {name: 'Continue', exact: true}).click();
        await visitor.seesHeading('Sign in');
        await visitor.followSignIn();
    }));

    it('signs out under a profile whose provider has no page for it', () => stage.visit(async (visitor) => {
        stage.reset('websphere');
        await visitor.signIn('bob');
        await visitor.press('Sign out');
        await visitor.seesHeading('Sign in');
        await visitor.isSignedOut();
    }));

    it('signs in from two tabs at once', () => stage.visit(async (visitor) => {
        const tab = await visitor.openTab();
        await visitor.goToProvider();
        await tab.goToProvider();
        await visitor.giveNameAndPassword('alice');
        await visitor.seesHeading('Welcome');
        await tab.giveNameAndPassword('alice');
        await tab.seesHeading('Welcome');
        await visitor.isSignedInAs('ACME\\alice');
    }));

    it('stays signed in when the user goes back', () => stage.visit(async (visitor) => {
        await visitor.signIn('alice');
        // The form at the provider has been used; neither the relay page nor the return address is in the history.
        await visitor.page.goBack();
        await visitor.seesHeading('This sign-in has ended');
        await visitor.page.goBack();
        await visitor.seesHeading('Welcome');
        assert.equal(stage.tokenRequests(), 1);
    }, {expects: /status of 400/}));

    it('asks a user who decides alone, and signs in when they allow it', () => stage.visit(async (visitor) => {
        await visitor.tryToSignIn('dora');
        await visitor.seesHeading('May the appliance know who you are?');
        await visitor.press('Allow');
        await visitor.seesHeading('Welcome');
        await visitor.isSignedInAs('ACME\\dora');
    }));
}
