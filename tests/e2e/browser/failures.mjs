import assert from 'node:assert/strict';
import {it} from 'node:test';

import {useProfile} from '../site/front_end.mjs';

const REFUSED = /rejected this sign-in|does not accept this device/;

export function defineFailures(stage) {
    it('is explained if the user cancels', () => stage.visit(async (visitor) => {
        await visitor.goToProvider();
        await visitor.press('Cancel');
        const reason = await visitor.seesFailure(/The sign-in was cancelled/);
        assert.equal(reason, 'The provider refused: access_denied (The user cancelled.)');
        assert.equal(stage.tokenRequests(), 0);
        await visitor.isSignedOut();
    }));

    it('is explained if the user denies consent, and can be repeated', () => stage.visit(async (visitor) => {
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

    it('is explained if the domain is unknown', () => stage.visit(async (visitor) => {
        await visitor.tryToSignIn('carol');
        const reason = await visitor.seesFailure(/This device does not recognise your account's domain\./);
        assert.equal(reason, 'TAVOWinsUserNameFqdn2Netbios failed.');
        await visitor.isSignedOut();
    }));

    for (const profile of ['azure', 'websphere']) {
        const under = (what) => `${what} (${profile})`;

        it(under('is explained if the code has expired'), () => stage.visit(async (visitor) => {
            stage.reset(profile);
            stage.site.provider.lifetimes.code = -1;
            await visitor.tryToSignIn('alice');
            await visitor.seesFailure(profile === 'azure' ? /Your sign-in took too long/ : REFUSED);
            assert.equal(stage.tokenRequests(), 1);
            await visitor.isSignedOut();
        }));

        it(under('is explained if the token has expired'), () => stage.visit(async (visitor) => {
            stage.reset(profile);
            stage.site.provider.lifetimes.idToken = -1;
            await visitor.tryToSignIn('alice');
            assert.equal(await visitor.seesFailure(/Your sign-in took too long\./), 'id_token expired.');
            await visitor.isSignedOut();
        }));

        it(under('is explained if the client secret is wrong'), () => stage.visit(async (visitor) => {
            stage.reset(profile);
            stage.misconfigure({changes: {secret: 'another secret'}});
            await visitor.tryToSignIn('alice');
            await visitor.seesFailure(REFUSED);
            await visitor.isSignedOut();
        }));

        it(under('is explained if the provider stops'), () => stage.visit(async (visitor) => {
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

    it('is explained if single sign-on is switched off meanwhile', () => stage.visit(async (visitor) => {
        const held = await visitor.holdReturn();
        await visitor.tryToSignIn('alice');
        await held.address;
        useProfile('azure', false);
        await held.go();
        assert.equal(await visitor.seesFailure(/switched off on this device/), 'sso does not enable.');
        assert.equal(stage.tokenRequests(), 0);
    }));
}
