// Explains the reason of a failed sign-in to the user.

const ASK = 'Contact your administrator.';

const TOO_LONG = 'Your sign-in took too long, or was already completed. Sign in again.';
const STOPPED = 'For your security, this sign-in was stopped. Sign in again.';
const NOT_SET_UP = `Single sign-on is not completely set up on this device. ${ASK}`;
const NOT_VERIFIED = `This device could not verify the response of your organisation. ${ASK}`;
const NOT_REACHED = `Your organisation's sign-in service is not available. Try again in a few minutes.`;
const NO_NAME = `Your organisation did not send a user name that this device can use. ${ASK}`;
const NOT_KNOWN = 'Something went wrong. Try again. If the problem persists, contact your administrator.';

// Keys are the beginnings of reasons; a provider may append text.
export const EXPLANATIONS = new Map([
    ['id_token expired.',
        'Your sign-in took too long. Try again. If the problem persists, the clock of this device may be wrong.'],
    ['This sign-in took too long', TOO_LONG],
    ['The provider refused: invalid_grant', TOO_LONG],
    ['The provider refused: expired_token', TOO_LONG],
    ['This sign-in was not started in this browser.',
        'This sign-in was not started in this browser, or was already completed. Sign in again.'],
    ['This sign-in was changed on its way.', STOPPED],
    ["The provider's answer belongs to another sign-in.", STOPPED],
    ['TAVOWinsUserNameFqdn2Netbios failed.', `This device does not recognise your account's domain. ${ASK}`],
    ['tenant ID invalid', `Your account belongs to an organisation that cannot use this device. ${ASK}`],
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
        'The settings of this device changed during your sign-in. Sign in again.'],
    ['Too many sign-ins are under way on this device.',
        'Too many users are signing in to this device. Try again in a few minutes.'],
    ['Too many users are signed in.', 'Too many users are signed in on this device. Try again later.'],
    ['parse json falied', NOT_REACHED],
    ["we cannot find key 'id_token' in response!",
        'Your organisation rejected this sign-in. Try again. If the problem persists, contact your administrator.'],
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

// This reason begins with the name of the token's algorithm.
const UNKNOWN_ALGORITHM = / algorithm is not supported$/;

export function explain(reason) {
    if (UNKNOWN_ALGORITHM.test(reason)) {
        return NOT_VERIFIED;
    }
    const known = [...EXPLANATIONS].find(([beginning]) => reason.startsWith(beginning));
    return known ? known[1] : NOT_KNOWN;
}
