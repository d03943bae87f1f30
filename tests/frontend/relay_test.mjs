// The script of the relay page.
//
//   node relay_test.mjs DOCTOR
import assert from 'node:assert/strict';
import {execFileSync} from 'node:child_process';
import {readdirSync, readFileSync} from 'node:fs';
import {test} from 'node:test';

import {EXPLANATIONS} from '../../frontend/static/reasons.js';
import {preferredLanguage} from '../../frontend/static/language.js';
import {describe} from '../../frontend/static/relay.js';

const START_PAGE = '/index.cgi';
const SITE = 'https://appliance.example';
const MESSAGES = new URL('../../frontend/messages/', import.meta.url);
const catalogues = Object.fromEntries(readdirSync(MESSAGES).map(
    (file) => [file.replace(/\.json$/, ''), JSON.parse(readFileSync(new URL(file, MESSAGES)))]));
const {foreign, own} = JSON.parse(readFileSync(new URL('origins.json', import.meta.url)));

// Rows of the failure table that are not shown verbatim: the front end shows the error of a provider's answer, and some
// errors have a sentence.
const ALTERED = ['{... "error": ...}', 'The provider refused: REASON', 'a text of another library'];
const failures = JSON.parse(execFileSync(process.argv[2], ['explain', '--list', '--json'], {encoding: 'utf8'}))
    .explanations.filter(({table}) => ['exceptions of the library', 'reasons of the front end'].includes(table));

/** What the page shows in English. */
function after(values) {
    const {headline, explanation, action, ...others} = describe(`#${new URLSearchParams(values)}`);
    const {[headline]: title, [explanation]: text, [action]: button} = catalogues.en;
    return {headline: title, explanation: text, action: button, ...others};
}

test('replaces foreign origins with the start page', () => {
    assert.ok(foreign.length >= 200);
    for (const origin of foreign) {
        assert.equal(after({origin, success: 'true'}).onward, START_PAGE, JSON.stringify(origin));
    }
});

test('stays on this site with unencoded origins', () => {
    for (const origin of foreign) {
        const {onward} = describe(`#origin=${origin}&success=true`);
        assert.equal(new URL(onward, SITE).origin, SITE, JSON.stringify(origin));
    }
});

test('returns to a local path', () => {
    assert.ok(own.length >= 10);
    for (const origin of own) {
        const {onward} = after({origin, success: 'true'});
        assert.equal(onward, origin);
        assert.equal(new URL(onward, SITE).origin, SITE);
    }
});

test('keeps local origins for another try', () => {
    const tryAgain = (origin) => new URL(after({origin, success: 'false'}).onward, SITE);
    const signIn = `${SITE}/webman/sso/login.cgi`;
    for (const origin of foreign) {
        assert.equal(tryAgain(origin).href, `${signIn}?origin=%2Findex.cgi`);
    }
    for (const origin of own) {
        const {href, searchParams} = tryAgain(origin);
        assert.ok(href.startsWith(`${signIn}?`));
        assert.deepEqual([...searchParams], [['origin', origin]]);
    }
});

test('shows sentences that the doctor explains', () => {
    for (const id of EXPLANATIONS.values()) {
        execFileSync(process.argv[2], ['explain', catalogues.en[id]]); // fails if it does not
    }
});

test('explains known reasons and cuts long ones', () => {
    const {explanation, reason} = after({success: 'false', reason: 'TAVOWinsUserNameFqdn2Netbios failed.'});
    assert.match(explanation, /^This device does not recognise your account's domain\./);
    assert.equal(reason, 'TAVOWinsUserNameFqdn2Netbios failed.');
    assert.match(after({success: 'false', reason: 'id_token expired.'}).explanation, /^Your sign-in took too long\./);
    const unknown = after({success: 'false', reason: 'x'.repeat(100_000)});
    assert.equal(unknown.reason.length, 200);
    assert.match(unknown.explanation, /^Something went wrong/);
    assert.equal(after({success: 'false'}).reason, '');
});

test('ignores known texts in descriptions of the provider', () => {
    for (const known of ['id_token expired.', 'This sign-in took too long', 'The provider refused: access_denied']) {
        const {explanation} = after({success: 'false', reason: `The provider refused: other (${known})`});
        assert.match(explanation, /^Something went wrong/, known);
    }
});

test('replaces unprintable characters', () => {
    const {reason} = after({success: 'false', reason: 'a\u009bb\u202ec\u2028d\u200be\nf'});
    assert.equal(reason, 'a b c d e f');
});

test('shows each outcome with its links', () => {
    const shown = ({headline, explanation, action, onward, atOnce}) =>
        ({headline, explanation, action, onward, atOnce});
    assert.deepEqual(shown(after({success: 'true', origin: '/a'})), {
        headline: 'You are signed in', explanation: 'Opening the page that you requested.',
        action: 'Continue', onward: '/a', atOnce: true,
    });
    assert.deepEqual(shown(after({success: 'false', reason: 'This sign-in was changed on its way.', origin: '/a'})), {
        headline: 'Sign-in failed',
        explanation: 'For your security, this sign-in was stopped. Sign in again.',
        action: 'Try again', onward: '/webman/sso/login.cgi?origin=%2Fa', atOnce: false,
    });
    assert.deepEqual(shown(after({})), {
        headline: 'You are signed out', explanation: 'You can close this page.', action: 'Continue', onward: START_PAGE,
        atOnce: false,
    });
});

test('explains every unsupported algorithm', () => {
    for (const name of ['none', 'HS256', '', 'an odd one']) {
        const {explanation} = after({success: 'false', reason: `${name} algorithm is not supported`});
        assert.match(explanation, /^This device could not verify/, name);
    }
});

const UNEXPLAINED = [ // intentionally: only an administrator can fix them
    'A header must be one printable line.', 'FRONTEND_PENDING_LOGINS must be a number above 0.',
    "The provider's answer has no single NAME.", 'This request cannot start or complete a sign-in.',
    'unexpected failure', 'The digest of a cookie cannot be computed.',
];
const OF_SESSIONS = 'Too many users are signed in.';
const isUnexplained = ({about, 'thrown by': thrownBy = 'a login'}) =>
    about.endsWith(': SYSTEM') || !thrownBy.includes('login') || UNEXPLAINED.includes(about) || ALTERED.includes(about);

test('explains each login failure of the failure table', () => {
    const texts = failures.filter((failure) => !isUnexplained(failure)).map(({about}) => about);
    assert.ok(texts.length >= 30, `${texts.length} texts`);
    for (const text of texts) {
        assert.doesNotMatch(after({success: 'false', reason: text}).explanation, /^Something went wrong/, text);
    }
    // <tavosso/web.h> provides the same sentences.
    const ofLogins = failures.filter((failure) => !isUnexplained(failure) && failure.about !== OF_SESSIONS);
    for (const {about, sentence} of ofLogins) {
        assert.equal(after({success: 'false', reason: about}).explanation, sentence, about);
    }
    for (const text of UNEXPLAINED) {
        assert.ok(failures.some(({about}) => about === text), text);
        assert.match(after({success: 'false', reason: text}).explanation, /^Something went wrong/, text);
    }
});

test('explains only texts of the failure table', () => {
    const isOf = (beginning) => ({about}) => about.startsWith(beginning) ||
        (about.endsWith(': REASON') && beginning.startsWith(about.slice(0, -'REASON'.length)));
    for (const beginning of EXPLANATIONS.keys()) {
        assert.ok(failures.some(isOf(beginning)), beginning);
    }
});

test('has every message in every language', () => {
    const {en, ...others} = catalogues;
    assert.deepEqual(Object.keys(others).sort(), ['de', 'es', 'fr', 'ja', 'zh']);
    const sources = ['index', 'account', 'logout', 'cgi_program', 'page', 'static/relay.js', 'static/reasons.js'].map(
        (name) => readFileSync(new URL(`../../frontend/${name}${/\./.test(name) ? '' : '.cpp'}`, import.meta.url), 'utf8'));
    const used = /["']((?:start|signed_in|account|sign_out|method|success|failure|signed_out|reason)\.[a-z_]+)["']/g;
    for (const source of sources) {
        for (const [, id] of source.matchAll(used)) {
            assert.ok(id in en, `${id} is not in the catalogue`);
        }
    }
    for (const [id, text] of Object.entries(en)) {
        assert.ok(sources.some((source) => source.includes(id)), `${id} is not used`);
        for (const [language, texts] of Object.entries(others)) {
            const placeholder = /\{user\}/.test(text);
            assert.ok(texts[id], `${id} (${language})`);
            assert.equal(/\{user\}/.test(texts[id]), placeholder, `${id} (${language})`);
        }
    }
    for (const texts of Object.values(others)) {
        assert.deepEqual(Object.keys(texts), Object.keys(en));
    }
});

test('chooses the first language with messages', () => {
    assert.equal(preferredLanguage(['nl-NL', 'fr-CH', 'de']), 'fr');
    assert.equal(preferredLanguage(['zh-Hans-CN']), 'zh');
    assert.equal(preferredLanguage(['nl']), 'en');
    assert.equal(preferredLanguage([]), 'en');
    for (const language of Object.keys(catalogues)) {
        assert.equal(preferredLanguage([language]), language);
    }
});

test('ignores names of object members', () => {
    for (const reason of ['constructor', '__proto__', 'toString']) {
        assert.match(after({success: 'false', reason}).explanation, /^Something went wrong/);
    }
});

test('is smaller than 20 KB', () => {
    const size = (file) => readFileSync(new URL(`../../frontend/static/${file}`, import.meta.url)).length;
    const sizes = ['relay.html', 'relay.js', 'reasons.js', 'language.js', 'style.css', 'mark.svg'].map(size);
    const catalogueSizes = Object.values(catalogues).map((texts) => Buffer.byteLength(JSON.stringify(texts, null, 4)));
    assert.ok(sizes.reduce((sum, each) => sum + each, 0) + Math.max(...catalogueSizes) < 20_000);
});
