// The relay page: tells how a login or logout went, and goes on. All that it knows is the fragment of its address,
// which anyone can write: text is shown as text, and only a path on this very site is followed.

const START_PAGE = '/index.cgi';
const LONGEST_REASON = 200;
// A path, not a host ("//") and nothing that a browser would turn into one (backslashes, control characters).
const OWN_PATH = /^\/(?!\/)[!#-[\]-~]*$/;

const ownPath = (origin) => (OWN_PATH.test(origin ?? '') ? origin : START_PAGE);

/** What to show for a fragment ("#..."), and where to go on to: at once where nothing has to be read. */
export function describe(fragment) {
    const values = new URLSearchParams(fragment.replace(/^#/, ''));
    switch (values.get('success')) {
        case 'true':
            return {headline: 'You are signed in', reason: '', onward: ownPath(values.get('origin')), atOnce: true};
        case 'false':
            return {
                headline: 'You could not be signed in',
                reason: (values.get('reason') ?? '').slice(0, LONGEST_REASON),
                onward: START_PAGE,
                atOnce: false,
            };
        default:
            return {headline: 'You are signed out', reason: '', onward: START_PAGE, atOnce: false};
    }
}

function show({headline, reason, onward, atOnce}) {
    document.title = headline;
    document.getElementById('headline').textContent = headline;
    document.getElementById('reason').textContent = reason;
    document.getElementById('onward').href = onward;
    if (atOnce) {
        location.replace(onward);
    }
}

if (globalThis.document) {
    show(describe(location.hash));
}
