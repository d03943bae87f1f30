// The relay page: tells how a login or logout went, and goes on. All that it knows is the fragment of its address,
// which anyone can write: text is shown as text, and only a path on this very site is followed.
import {explain} from './reasons.js';

const START_PAGE = '/index.cgi';
const SIGN_IN = '/webman/sso/login.cgi?origin=';
const LONGEST_REASON = 200;
const LONGEST_ORIGIN = 512;
// Controls, format characters and line separators could break the text or change its direction.
const UNPRINTABLE = /[\p{Cc}\p{Cf}\p{Zl}\p{Zp}]/gu;
// A path, not a host ("//") and nothing that a browser would turn into one (backslashes, control characters).
const OWN_PATH = /^\/(?!\/)[!#-[\]-~]*$/;

const ownPath = (origin) => (origin.length <= LONGEST_ORIGIN && OWN_PATH.test(origin) ? origin : START_PAGE);

function describeSuccess(origin) {
    return {
        headline: 'You are signed in',
        explanation: 'One moment: the page that you asked for is opening.',
        reason: '',
        action: 'Continue',
        onward: ownPath(origin),
        atOnce: true,
    };
}

function describeFailure(reason, origin) {
    const shown = reason.slice(0, LONGEST_REASON).replace(UNPRINTABLE, ' ');
    return {
        headline: 'You could not be signed in',
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
        explanation: 'You have been signed out.',
        reason: '',
        action: 'Continue',
        onward: START_PAGE,
        atOnce: false,
    };
}

/** What to show for a fragment ("#..."), and where to go on to: at once where nothing has to be read. */
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
