// What the reasons of a failed sign-in mean to a user, who can act on some of them and ask for help about the others.

const ASK = 'Please ask your administrator for help.';

const TOO_LONG = 'Your sign-in took too long, or was already completed. Please start again.';
const NOT_SET_UP = `Single sign-on is not completely set up on this device. ${ASK}`;
const NOT_VERIFIED = `This device could not verify the answer of your organisation. ${ASK}`;
const NOT_REACHED = `Your organisation's sign-in service gave no usable answer. Please try again in a few minutes.`;
const NO_NAME = `Your organisation gave no name that this device can use. ${ASK}`;
const NOT_KNOWN = `Something went wrong on the way. Please try again; if it happens again, tell your administrator.`;

// By how a reason begins: a provider adds words of its own.
export const EXPLANATIONS = new Map([
    ['id_token expired.', `Your sign-in took too long. Please try again; if it happens again, the clock of this device may be wrong.`],
    ['This sign-in took too long', TOO_LONG],
    ['The provider refused: invalid_grant', TOO_LONG],
    ['The provider refused: expired_token', TOO_LONG],
    ['This sign-in was not started in this browser.',
        'This sign-in was not started in this browser, or was already completed. Please start it here.'],
    ['This sign-in was changed on its way.', 'For your safety this sign-in was stopped: it was changed on its way.'],
    ["The provider's answer belongs to another sign-in.",
        'For your safety this sign-in was stopped: the answer belongs to another one.'],
    ['TAVOWinsUserNameFqdn2Netbios failed.', `Your account's domain is not known to this device. ${ASK}`],
    ['tenant ID invalid', `Your account belongs to an organisation that this device does not serve. ${ASK}`],
    ['empty jwt part', NOT_VERIFIED],
    ['client ID invalid', NOT_VERIFIED],
    ['kid does not exist', NOT_VERIFIED],
    ['RSA public', NOT_VERIFIED],
    ['verify rsa signature failed', NOT_VERIFIED],
    ['verify hmac signature failed', NOT_VERIFIED],
    ['bad jwt', NOT_VERIFIED],
    ['token cannot be empty', NOT_VERIFIED],
    ['cannot find the user name!', NO_NAME],
    ['cannot get the user name!', NO_NAME],
    ["The provider's name for this user cannot be used.", NO_NAME],
    ["The provider has not verified this user's e-mail address.",
        `Your organisation has not verified your e-mail address. ${ASK}`],
    ['The settings of this device were changed during this sign-in.',
        'The settings of this device were changed during your sign-in. Sign in again.'],
    ['Too many sign-ins are under way on this device.',
        'Too many sign-ins are under way on this device. Try again in a few minutes.'],
    ['Too many users are signed in.', 'Too many users are signed in on this device. Try again later.'],
    ['parse json falied', NOT_REACHED],
    ["we cannot find key 'id_token' in response!",
        `Your organisation's sign-in service did not accept this sign-in. Please try again; if it happens again, tell your administrator.`],
    ['The provider refused: temporarily_unavailable', NOT_REACHED],
    ['The provider refused: server_error', NOT_REACHED],
    ['The provider refused: access_denied',
        'The sign-in was cancelled, or your organisation does not allow you to use this device.'],
    ['The provider refused: invalid_client', `Your organisation does not accept this device. ${ASK}`],
    ['The provider refused: unauthorized_client', `Your organisation does not accept this device. ${ASK}`],
    ['sso does not enable.', `Single sign-on is switched off on this device. ${ASK}`],
    ['read profile file failed.', NOT_SET_UP],
    ['profile not support.', NOT_SET_UP],
    ['not specify sso profile', NOT_SET_UP],
    ['Single sign-on is not completely set up', NOT_SET_UP],
    ['This program may not read the configuration of single sign-on.', NOT_SET_UP],
    ['encode base64 failed.', NOT_SET_UP],
]);

// This one begins with what the token calls its algorithm.
const UNKNOWN_ALGORITHM = / algorithm is not supported$/;

export function explain(reason) {
    if (UNKNOWN_ALGORITHM.test(reason)) {
        return NOT_VERIFIED;
    }
    const known = [...EXPLANATIONS].find(([beginning]) => reason.startsWith(beginning));
    return known ? known[1] : NOT_KNOWN;
}
