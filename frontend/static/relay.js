// The relay page: shows the result of a login or logout and continues. Its input is the fragment of its address, which
// is untrusted: it shows text as text and follows only paths of this site.
import {explain} from './reasons.js';

const START_PAGE = '/index.cgi';
const SIGN_IN = '/webman/sso/login.cgi?origin=';
const LONGEST_REASON = 200;
const LONGEST_ORIGIN = 512;
// Control characters, format characters and line separators can break the text or change its direction.
const UNPRINTABLE = /[\p{Cc}\p{Cf}\p{Zl}\p{Zp}]/gu;
// A path of this site. Browsers can read "//", backslashes and control characters as the beginning of a host.
const OWN_PATH = /^\/(?!\/)[!#-[\]-~]*$/;

const ownPath = (origin) => (origin.length <= LONGEST_ORIGIN && OWN_PATH.test(origin) ? origin : START_PAGE);

function describeSuccess(origin) {
    return {
        headline: 'You are signed in',
        explanation: 'Opening the page that you requested.',
        reason: '',
        action: 'Continue',
        onward: ownPath(origin),
        atOnce: true,
    };
}

function describeFailure(reason, origin) {
    const shown = reason.slice(0, LONGEST_REASON).replace(UNPRINTABLE, ' ');
    return {
        headline: 'Sign-in failed',
        explanation: explain(shown),
        reason: shown,
        action: 'Try again',
        onward: SIGN_IN + encodeURIComponent(ownPath(origin)),
        atOnce: false,
    };
}

function describeLogout() {
    return {
        headline: 'You are signed out',
        explanation: 'You can close this page.',
        reason: '',
        action: 'Continue',
        onward: START_PAGE,
        atOnce: false,
    };
}

/** Returns what to show for a fragment ("#..."), and where to continue; `atOnce` after a success. */
export function describe(fragment) {
    const values = new URLSearchParams(fragment.replace(/^#/, ''));
    const origin = values.get('origin') ?? '';
    switch (values.get('success')) {
        case 'true':
            return describeSuccess(origin);
        case 'false':
            return describeFailure(values.get('reason') ?? '', origin);
        default:
            return describeLogout();
    }
}

function show({headline, explanation, reason, action, onward, atOnce}) {
    const element = (id) => document.getElementById(id);
    document.title = headline;
    element('headline').textContent = headline;
    element('explanation').textContent = explanation;
    element('reason').textContent = reason;
    element('details').hidden = reason === '';
    element('onward').textContent = action;
    element('onward').href = onward;
    element('back').hidden = onward === START_PAGE || atOnce;
    if (atOnce) {
        location.replace(onward);
    }
}

if (globalThis.document) {
    show(describe(location.hash));
}
