// Finds the explanation of a failed sign-in.

// Beginnings of reasons, to which a provider may append text, and ids of messages.
export const EXPLANATIONS = new Map([
    ['id_token expired.', 'reason.token_expired'],
    ['This sign-in took too long', 'reason.login_expired'],
    ['The provider refused: invalid_grant', 'reason.login_expired'],
    ['The provider refused: expired_token', 'reason.login_expired'],
    ['This sign-in was not started in this browser.', 'reason.other_browser'],
    ['This sign-in was changed on its way.', 'reason.stopped'],
    ["The provider's answer belongs to another sign-in.", 'reason.stopped'],
    ['TAVOWinsUserNameFqdn2Netbios failed.', 'reason.unknown_domain'],
    ['tenant ID invalid', 'reason.other_tenant'],
    ['empty jwt part', 'reason.not_verified'],
    ['client ID invalid', 'reason.not_verified'],
    ['kid does not exist', 'reason.not_verified'],
    ['RSA public', 'reason.not_verified'],
    ['verify rsa signature failed', 'reason.not_verified'],
    ['verify hmac signature failed', 'reason.not_verified'],
    ['bad jwt', 'reason.not_verified'],
    ['token cannot be empty', 'reason.not_verified'],
    ['cannot find the user name!', 'reason.no_name'],
    ['cannot get the user name!', 'reason.no_name'],
    ["The provider's name for this user cannot be used.", 'reason.no_name'],
    ["The provider has not verified this user's e-mail address.", 'reason.unverified_email'],
    ['The settings of this device were changed during this sign-in.', 'reason.profile_changed'],
    ['Too many sign-ins are under way on this device.', 'reason.too_many_logins'],
    ['Too many users are signed in.', 'reason.too_many_sessions'],
    ['parse json falied', 'reason.not_reached'],
    ["we cannot find key 'id_token' in response!", 'reason.rejected'],
    ['The provider refused: temporarily_unavailable', 'reason.not_reached'],
    ['The provider refused: server_error', 'reason.not_reached'],
    ['The provider refused: access_denied', 'reason.cancelled'],
    ['The provider refused: invalid_client', 'reason.client_rejected'],
    ['The provider refused: unauthorized_client', 'reason.client_rejected'],
    ['sso does not enable.', 'reason.switched_off'],
    ['read profile file failed.', 'reason.not_set_up'],
    ['profile not support.', 'reason.not_set_up'],
    ['not specify sso profile', 'reason.not_set_up'],
    ['Single sign-on is not completely set up', 'reason.not_set_up'],
    ['This program may not read the configuration of single sign-on.', 'reason.not_set_up'],
    ['encode base64 failed.', 'reason.not_set_up'],
]);

// This reason begins with the name of the token's algorithm.
const UNKNOWN_ALGORITHM = / algorithm is not supported$/;

export function explain(reason) {
    if (UNKNOWN_ALGORITHM.test(reason)) {
        return 'reason.not_verified';
    }
    const known = [...EXPLANATIONS].find(([beginning]) => reason.startsWith(beginning));
    return known ? known[1] : 'reason.unknown';
}
