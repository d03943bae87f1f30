import assert from 'node:assert/strict';
import {it} from 'node:test';

const PROFILES = [['azure', 'ACME\\alice', 'ACME\\bob'], ['websphere', 'alice', 'bob']];
const DEEP_LINK = '/account.cgi?view=all&name=%C3%A4%22';

export function defineSignIns(stage) {
    for (const [profile, alice, bob] of PROFILES) {
        it(`succeeds (${profile})`, () => stage.visit(async (visitor) => {
            stage.reset(profile);
            await visitor.isSignedOut();
            await visitor.signIn('alice');
            assert.equal(visitor.path(), '/index.cgi');
            await visitor.isSignedInAs(alice);
            assert.equal(stage.tokenRequests(), 1);
        }));

        it(`returns to the requested page (${profile})`, () => stage.visit(async (visitor) => {
            stage.reset(profile);
            await visitor.open(DEEP_LINK);
            await visitor.seesHeading('Sign in');
            await visitor.followSignIn();
            await visitor.giveNameAndPassword('alice');
            await visitor.seesHeading('Your account');
            assert.equal(visitor.path(), DEEP_LINK);
            assert.equal(await visitor.page.getByRole('definition').first().textContent(), alice);
        }));

        it(`separates two users (${profile})`, () => stage.visit(async (first, second) => {
            stage.reset(profile);
            await Promise.all([first.goToProvider(), second.goToProvider()]);
            await Promise.all([first.giveNameAndPassword('alice'), second.giveNameAndPassword('bob')]);
            await Promise.all([first.seesHeading('Welcome'), second.seesHeading('Welcome')]);
            await first.isSignedInAs(alice);
            await second.isSignedInAs(bob);
        }));
    }

    it('works with the keyboard only', () => stage.visit(async ({page, ...visitor}) => {
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

    it('ends by signing out at the appliance and the provider', () => stage.visit(async (visitor) => {
        await visitor.signIn('alice');
        await visitor.press('Sign out');
        await visitor.seesHeading('Sign out of Example organisation?');
        await visitor.press('Sign out');
        await visitor.seesHeading('You are signed out');
        await visitor.page.getByRole('link', {name: 'Continue', exact: true}).click();
        await visitor.seesHeading('Sign in');
        await visitor.followSignIn();
    }));

    it('ends by signing out without a page of the provider', () => stage.visit(async (visitor) => {
        stage.reset('websphere');
        await visitor.signIn('bob');
        await visitor.press('Sign out');
        await visitor.seesHeading('Sign in');
        await visitor.isSignedOut();
    }));

    it('works in two tabs at once', () => stage.visit(async (visitor) => {
        const tab = await visitor.openTab();
        await visitor.goToProvider();
        await tab.goToProvider();
        await visitor.giveNameAndPassword('alice');
        await visitor.seesHeading('Welcome');
        await tab.giveNameAndPassword('alice');
        await tab.seesHeading('Welcome');
        await visitor.isSignedInAs('ACME\\alice');
    }));

    it('persists when the user goes back', () => stage.visit(async (visitor) => {
        await visitor.signIn('alice');
        // The provider's form is used up; relay page and return address are not in the history.
        await visitor.page.goBack();
        await visitor.seesHeading('This sign-in has ended');
        await visitor.page.goBack();
        await visitor.seesHeading('Welcome');
        assert.equal(stage.tokenRequests(), 1);
    }, {expects: /status of 400/}));

    it('asks for consent if the provider requires it', () => stage.visit(async (visitor) => {
        await visitor.tryToSignIn('dora');
        await visitor.seesHeading('May the appliance know who you are?');
        await visitor.press('Allow');
        await visitor.seesHeading('Welcome');
        await visitor.isSignedInAs('ACME\\dora');
    }));
}
