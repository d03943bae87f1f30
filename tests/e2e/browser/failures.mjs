import assert from 'node:assert/strict';
import {it} from 'node:test';

import {useProfile} from '../site/front_end.mjs';

const REFUSED = /rejected this sign-in|does not accept this device/;

export function defineFailures(stage) {
    it('is explained when the user cancels at the provider, without a token request', () => stage.visit(async (visitor) => {
        await visitor.goToProvider();
        await visitor.press('Cancel');
        const reason = await visitor.seesFailure(/The sign-in was cancelled/);
        assert.equal(reason, 'The provider refused: access_denied (The user cancelled.)');
        assert.equal(stage.tokenRequests(), 0);
        await visitor.isSignedOut();
    }));

    it('is explained when the user does not consent, and can be tried again', () => stage.visit(async (visitor) => {
        await visitor.open('/account.cgi');
        await visitor.followSignIn();
        await visitor.giveNameAndPassword('dora');
        await visitor.seesHeading('May the appliance know who you are?');
        await visitor.press('Cancel');
        await visitor.seesFailure(/The sign-in was cancelled/);
        assert.equal(stage.tokenRequests(), 0);
        await visitor.page.getByRole('link', {name: 'Try again', exact: true}).click();
        await visitor.seesHeading('May the appliance know who you are?');
        await visitor.press('Allow');
        await visitor.seesHeading('Your account');
    }));

    it("is explained when the user's domain is not known", () => stage.visit(async (visitor) => {
        await visitor.tryToSignIn('carol');
        const reason = await visitor.seesFailure(/This device does not recognise your account's domain\./);
        assert.equal(reason, 'TAVOWinsUserNameFqdn2Netbios failed.');
        await visitor.isSignedOut();
    }));

    for (const profile of ['azure', 'websphere']) {
        const under = (what) => `${what}, under profile ${profile}`;

        it(under('is explained when the code has expired'), () => stage.visit(async (visitor) => {
            stage.reset(profile);
            stage.site.provider.lifetimes.code = -1;
            await visitor.tryToSignIn('alice');
            await visitor.seesFailure(profile === 'azure' ? /Your sign-in took too long/ : REFUSED);
            assert.equal(stage.tokenRequests(), 1);
            await visitor.isSignedOut();
        }));

        it(under("is explained when the clock is past the token's expiry"), () => stage.visit(async (visitor) => {
            stage.reset(profile);
            stage.site.provider.lifetimes.idToken = -1;
            await visitor.tryToSignIn('alice');
            assert.equal(await visitor.seesFailure(/Your sign-in took too long\./), 'id_token expired.');
            await visitor.isSignedOut();
        }));

        it(under('is explained when the client secret is wrong'), () => stage.visit(async (visitor) => {
            stage.reset(profile);
            stage.misconfigure({changes: {secret: 'another secret'}});
            await visitor.tryToSignIn('alice');
            await visitor.seesFailure(REFUSED);
            await visitor.isSignedOut();
        }));

        it(under('is explained when the provider stops in the middle'), () => stage.visit(async (visitor) => {
            stage.reset(profile);
            const provider = await stage.site.startAnotherProvider();
            try {
                stage.misconfigure({provider});
                const held = await visitor.holdReturn();
                await visitor.tryToSignIn('alice');
                await held.address;
                provider.stop();
                await held.go();
                assert.equal(await visitor.seesFailure(/sign-in service is not available/), 'parse json falied');
                await visitor.isSignedOut();
            } finally {
                provider.stop();
            }
        }));
    }

    it('is explained when single sign-on was switched off in the middle', () => stage.visit(async (visitor) => {
        const held = await visitor.holdReturn();
        await visitor.tryToSignIn('alice');
        await held.address;
        useProfile('azure', false);
        await held.go();
        assert.equal(await visitor.seesFailure(/switched off on this device/), 'sso does not enable.');
        assert.equal(stage.tokenRequests(), 0);
    }));
}
