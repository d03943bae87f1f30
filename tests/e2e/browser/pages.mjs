import assert from 'node:assert/strict';
import path from 'node:path';
import {it} from 'node:test';

import {useProfile} from '../site/front_end.mjs';
import {RELAY_PAGE} from './visitor.mjs';

const SCREENS = [360, 1280].flatMap((width) => ['light', 'dark'].map((colorScheme) => ({width, colorScheme})));
const PICTURE = {viewport: {width: 720, height: 560}, colorScheme: 'light'};
const DEEP_LINK = '/account.cgi?opened=after';
const SUCCESS = `${RELAY_PAGE}#${new URLSearchParams({origin: DEEP_LINK, success: 'true'})}`;
const FAILURE = `${RELAY_PAGE}#${new URLSearchParams({reason: 'TAVOWinsUserNameFqdn2Netbios failed.', success: 'false'})}`;

const PROTECTION = {
    'cache-control': 'no-store',
    'referrer-policy': 'same-origin',
    'x-content-type-options': 'nosniff',
    'content-security-policy': "default-src 'none'; script-src 'self'; style-src 'self'; img-src 'self'; " +
        "base-uri 'none'; form-action 'self'; frame-ancestors 'none'",
};

// Functions that open each page.
const PAGES = {
    'the start page': async (visitor) => {
        await visitor.isSignedOut();
    },
    'the start page, single sign-on off': async (visitor) => {
        useProfile('azure', false);
        await visitor.isSignedOut();
        await visitor.seesText('Single sign-on is switched off on this device.');
        assert.equal(await visitor.page.getByRole('link').count(), 0);
    },
    'the start page, single sign-on incomplete': async (visitor, stage) => {
        stage.misconfigure({changes: {secret: ''}});
        await visitor.isSignedOut();
        await visitor.seesText('Single sign-on is not completely set up on this device.');
        assert.equal(await visitor.page.getByRole('link').count(), 0);
    },
    "the provider's form": async (visitor) => {
        await visitor.goToProvider();
    },
    'the start page, signed in': async (visitor) => {
        await visitor.signIn('alice');
    },
    'the account page': async (visitor) => {
        await visitor.signIn('alice');
        await visitor.page.getByRole('link', {name: 'Your account', exact: true}).click();
        await visitor.seesHeading('Your account');
    },
    'the sign-out page': async (visitor, stage) => {
        await visitor.signIn('alice');
        await stayOn(visitor, `${stage.site.provider.address}/**`);
        await visitor.press('Sign out');
        await visitor.seesHeading('Signing out');
    },
    'the relay page after a success': async (visitor, stage) => {
        await stayOn(visitor, stage.origin + DEEP_LINK);
        // The page redirects before it has loaded.
        await visitor.open(SUCCESS, {waitUntil: 'commit'});
        await visitor.seesHeading('You are signed in');
    },
    'the relay page after a failure': async (visitor) => {
        await visitor.open(FAILURE);
        await visitor.seesFailure(/This device does not recognise your account's domain\./);
    },
    'the relay page after a sign-out': async (visitor) => {
        await visitor.open(RELAY_PAGE);
        await visitor.seesHeading('You are signed out');
    },
};

const TITLES = {
    'the start page': 'Sign in',
    'the start page, single sign-on off': 'Sign in',
    'the start page, single sign-on incomplete': 'Sign in',
    "the provider's form": 'Example organisation',
    'the start page, signed in': 'Welcome',
    'the account page': 'Your account',
    'the sign-out page': 'Signing out',
    'the relay page after a success': 'You are signed in',
    'the relay page after a failure': 'Sign-in failed',
    'the relay page after a sign-out': 'You are signed out',
};

// Blocks navigation: the browser stays on its page after an answer without content.
function stayOn(visitor, elsewhere) {
    return visitor.page.route(elsewhere, (route) => route.fulfill({status: 204}));
}

// Tags of HTML for the locales of browsers.
const LANGUAGES = {'en-GB': 'en', 'de-AT': 'de', 'fr-CA': 'fr', 'es-MX': 'es', 'ja-JP': 'ja', 'zh-CN': 'zh-Hans', 'nl-NL': 'en'};

async function findViolations(page) {
    const {violations} = await page.evaluate(() => globalThis.axe.run());
    return violations.map(({id, nodes}) => `${id}: ${nodes.map(({html}) => html).join(' ')}`);
}

function defineAccessibility(stage) {
    for (const [name, open] of Object.entries(PAGES)) {
        it(`is accessible on all screens: ${name}`, () => stage.visit(async (visitor) => {
            const {page} = visitor;
            await open(visitor, stage);
            assert.equal(await page.title(), TITLES[name]);
            await page.evaluate(stage.axe);
            for (const {width, colorScheme} of SCREENS) {
                await page.setViewportSize({width, height: 800});
                await page.emulateMedia({colorScheme});
                assert.deepEqual(await findViolations(page), [], `${width} pixels wide, ${colorScheme}`);
                assert.ok(await overhang(page) <= 0, `beyond the right edge of ${width}`);
            }
        }));
    }
}

async function overhang(page) {
    return page.evaluate(() => document.documentElement.scrollWidth - innerWidth);
}

function defineLanguages(stage) {
    for (const [locale, language] of Object.entries(LANGUAGES)) {
        it(`speaks the language of the browser: ${locale}`, () => stage.visit(async ({page}) => {
            const pages = {start: '/index.cgi', failure: FAILURE, 'sign-out': RELAY_PAGE};
            for (const [name, address] of Object.entries(pages)) {
                await page.goto(new URL(address, stage.origin).href);
                await page.locator(`html[lang="${language}"]`).waitFor();
                // The heading of the static relay page, which the script replaces.
                await page.getByText('Single sign-on', {exact: true}).waitFor({state: 'detached'});
                await page.evaluate(stage.axe);
                assert.deepEqual(await findViolations(page), [], name);
                await page.screenshot({path: path.join(stage.pictures, `${name}.${locale}.png`)});
                for (const direction of ['ltr', 'rtl']) {
                    await page.evaluate((dir) => {
                        document.documentElement.dir = dir;
                    }, direction);
                    assert.ok(await overhang(page) <= 0, `${name} is too wide, ${direction}`);
                }
                assert.equal(await page.title(), await page.getByRole('heading', {level: 1}).textContent());
                // about:blank in between, because a new fragment alone does not load the page.
                await page.goto('about:blank');
            }
        }, {locale, viewport: {width: 360, height: 640}}));
    }
}

function defineHeaders(stage) {
    const addresses = [
        '/', '/index.cgi', '/account.cgi', '/webman/sso/login.cgi', '/webman/sso/return.cgi', '/webman/sso/logout.cgi',
        ...['relay.html', 'relay.js', 'reasons.js', 'language.js', 'messages/en.js', 'style.css', 'mark.svg'].map((file) => `/webman/ssoclient/${file}`),
        '/webman/ssoclient/', '/nowhere', '/nowhere.cgi',
    ];
    it('has security headers', () => stage.visit(async (visitor) => {
        const seen = [];
        visitor.page.on('response', (response) => {
            if (response.url().startsWith(stage.origin)) {
                seen.push(response);
            }
        });
        for (const address of addresses) {
            await visitor.open(address);
        }
        assert.ok(seen.length > addresses.length);
        for (const response of seen) {
            const headers = await response.headersArray();
            for (const [name, value] of Object.entries(PROTECTION)) {
                const found = headers.filter((header) => header.name.toLowerCase() === name);
                assert.deepEqual(found.map((header) => header.value), [value], `${name} of ${response.url()}`);
            }
        }
    }, {expects: /status of 40[345]/}));

    it('cannot be framed', () => stage.visit(async (visitor) => {
        await visitor.goToProvider();
        const frame = await visitor.page.evaluate(async (address) => {
            const element = document.createElement('iframe');
            const loaded = new Promise((resolve) => {
                element.onload = resolve;
            });
            element.src = address;
            document.body.append(element);
            await loaded;
            return element.name;
        }, `${stage.origin}/index.cgi`);
        assert.equal(frame, '');
        const shown = visitor.page.frames().map((each) => each.url());
        assert.ok(!shown.includes(`${stage.origin}/index.cgi`), 'the start page was shown in a frame');
    }, {expects: /frame-ancestors|Refused to frame|Framing/}));
}

function definePictures(stage) {
    const pictures = {
        start: 'the start page',
        provider: "the provider's form",
        success: 'the relay page after a success',
        failure: 'the relay page after a failure',
    };
    for (const [file, name] of Object.entries(pictures)) {
        it(`is captured: ${name}`, () => stage.visit(async (visitor) => {
            await PAGES[name](visitor, stage);
            const picture = await visitor.page.screenshot({path: path.join(stage.pictures, `${file}.png`)});
            assert.ok(picture.length > 0);
        }, PICTURE));
    }
}

export function definePages(stage) {
    defineAccessibility(stage);
    defineLanguages(stage);
    defineHeaders(stage);
    definePictures(stage);
}
