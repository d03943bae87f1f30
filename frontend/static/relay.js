// The relay page: shows the result of a login or logout and continues. Its input is the fragment of its address, which
// is untrusted: it shows text as text and follows only paths of this site.
import {explain} from './reasons.js';
import {preferredLanguage} from './language.js';

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
        headline: 'success.title',
        explanation: 'success.text',
        reason: '',
        action: 'success.action',
        onward: ownPath(origin),
        atOnce: true,
    };
}

function describeFailure(reason, origin) {
    const shown = reason.slice(0, LONGEST_REASON).replace(UNPRINTABLE, ' ');
    return {
        headline: 'failure.title',
        explanation: explain(shown),
        reason: shown,
        action: 'failure.action',
        onward: SIGN_IN + encodeURIComponent(ownPath(origin)),
        atOnce: false,
    };
}

function describeLogout() {
    return {
        headline: 'signed_out.title',
        explanation: 'signed_out.text',
        reason: '',
        action: 'signed_out.action',
        onward: START_PAGE,
        atOnce: false,
    };
}

/**
 * Returns what to show for a fragment ("#..."), as ids of messages except for `reason`, and where to continue; `atOnce`
 * after a success.
 */
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

async function show({headline, explanation, reason, action, onward, atOnce}) {
    const element = (id) => document.getElementById(id);
    element('reason').textContent = reason;
    element('details').hidden = reason === '';
    element('onward').href = onward;
    element('back').hidden = onward === START_PAGE || atOnce;
    const {default: messages} = await import(`./messages/${preferredLanguage(navigator.languages)}.js`);
    document.documentElement.lang = messages.language;
    document.documentElement.dir = messages.direction;
    document.title = messages[headline];
    element('product').textContent = messages.product;
    element('headline').textContent = messages[headline];
    element('explanation').textContent = messages[explanation];
    element('unfold').textContent = messages['failure.details'];
    element('onward').textContent = messages[action];
    element('start').textContent = messages['account.back'];
}

if (globalThis.document) {
    const outcome = describe(location.hash);
    if (outcome.atOnce) {
        location.replace(outcome.onward);
    }
    await show(outcome);
}
