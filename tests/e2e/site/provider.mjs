// The OpenID provider: a certified implementation with TLS, test users and a sign-in page.
import {generateKeyPairSync, randomBytes} from 'node:crypto';
import {once} from 'node:events';
import https from 'node:https';
import path from 'node:path';
import {pathToFileURL} from 'node:url';

const SIGN_IN = '/sign-in/';
const SIGN_OUT = '/sign-out';
const SCOPE = 'openid profile email';

function signingKeys() {
    const {privateKey} = generateKeyPairSync('rsa', {modulusLength: 2048});
    return {keys: [{...privateKey.export({format: 'jwk'}), kid: randomBytes(8).toString('hex'), use: 'sig'}]};
}

function registration({id, secret, algorithm, redirectURI, otherRedirectURI, logoutURI}) {
    return {
        client_id: id,
        client_secret: secret,
        redirect_uris: [redirectURI, otherRedirectURI].filter(Boolean),
        post_logout_redirect_uris: [logoutURI],
        grant_types: ['authorization_code'],
        response_types: ['code'],
        token_endpoint_auth_method: 'client_secret_post',
        id_token_signed_response_alg: algorithm,
    };
}

function configuration({MemoryAdapter, clients, users, tenant, lifetimes}) {
    return {
        // In memory only. The subclass avoids the provider's warning about it.
        adapter: class extends MemoryAdapter {},
        clients: clients.map(registration),
        enabledJWA: {idTokenSigningAlgValues: ['RS256', 'HS256']},
        pkce: {required: () => false},
        claims: {
            openid: ['sub', 'tid', 'unique_name', 'name', 'email', 'email_verified'],
            profile: [],
            email: [],
        },
        cookies: {keys: [randomBytes(32).toString('hex')]},
        features: {
            devInteractions: {enabled: false},
            rpInitiatedLogout: {logoutSource: showSignOutForm},
        },
        interactions: {url: (context, interaction) => SIGN_IN + interaction.uid},
        jwks: signingKeys(),
        ttl: {
            AccessToken: 600,
            AuthorizationCode: () => lifetimes.code,
            Grant: 600,
            IdToken: () => lifetimes.idToken,
            Interaction: 600,
            Session: 3600,
        },
        findAccount: (context, login) => ({
            accountId: login,
            claims: () => ({
                sub: login, tid: tenant, unique_name: users.get(login).uniqueName, ...users.get(login).claims,
            }),
        }),
        loadExistingGrant: (context) => findGrant(context.oidc, users),
    };
}

// Consent is granted automatically, except for users with `decidesAlone`.
async function findGrant({provider, client, session, result}, users) {
    if (users.get(session.accountId).decidesAlone) {
        const agreed = result?.consent?.grantId ?? session.grantIdFor(client.clientId);
        return agreed && provider.Grant.find(agreed);
    }
    return makeGrant(provider, session.accountId, client.clientId);
}

async function makeGrant(provider, accountId, clientId) {
    const grant = new provider.Grant({accountId, clientId});
    grant.addOIDCScope(SCOPE);
    await grant.save();
    return grant;
}

const STYLE = `
:root { color-scheme: light dark; font: 1rem/1.6 system-ui, sans-serif; background: light-dark(#eef0f7, #14161f); }
body { margin: 0 auto; max-width: 24rem; padding: clamp(1rem, 12vh, 7rem) 1rem 2rem; }
main { background: light-dark(#fff, #1e2130); border-top: 4px solid #4f5bd5; padding: 1.5rem; }
h1 { font-size: 1.4rem; line-height: 1.3; margin: 0 0 1rem; }
label { display: block; font-weight: 600; }
input { box-sizing: border-box; font: inherit; padding: 0.5rem; width: 100%; }
button { background: #3d49c4; border: 0; color: #fff; cursor: pointer; font: inherit; padding: 0.5rem 1.25rem; }
button[value=cancel] { background: none; color: light-dark(#3d49c4, #b6bdff); }
`;

const page = (content) => `<!DOCTYPE html><html lang="en"><head><meta charset="utf-8">
<meta name="viewport" content="width=device-width, initial-scale=1"><title>Example organisation</title>
<link rel="icon" href="data:,"><style>${STYLE}</style></head><body><main>${content}</main></body></html>`;

function showSignOutForm(context, form) {
    context.body = page(`<h1>Sign out of Example organisation?</h1>${form}
<button type="submit" form="op.logoutForm" name="logout" value="yes" autofocus>Sign out</button>`);
}

function sendPage(response, status, content) {
    response.writeHead(status, {'Content-Type': 'text/html; charset=utf-8', 'Cache-Control': 'no-store'});
    response.end(page(content));
}

function sendSignInForm(response, uid, hint) {
    sendPage(response, 200, `<h1>Sign in to Example organisation</h1>${hint && `<p role="alert">${hint}</p>`}
<form method="post" action="${SIGN_IN}${uid}">
<p><label>Name <input name="login" autocomplete="username" autofocus></label></p>
<p><label>Password <input name="password" type="password" autocomplete="current-password"></label></p>
<p><button name="action" value="sign-in">Sign in</button> <button name="action" value="cancel">Cancel</button></p>
</form>`);
}

function sendConsentForm(response, uid) {
    sendPage(response, 200, `<h1>May the appliance know who you are?</h1>
<form method="post" action="${SIGN_IN}${uid}">
<p><button name="action" value="allow">Allow</button> <button name="action" value="cancel">Cancel</button></p>
</form>`);
}

async function readForm(request) {
    let body = '';
    for await (const chunk of request) {
        body += chunk;
    }
    return new URLSearchParams(body);
}

async function interact(provider, users, request, response) {
    const {uid, prompt, params, session} = await provider.interactionDetails(request, response);
    const finish = (result) =>
        provider.interactionFinished(request, response, result, {mergeWithLastSubmission: !result.error});
    const isAsked = request.method !== 'POST';
    const form = isAsked ? new URLSearchParams() : await readForm(request);
    if (form.get('action') === 'cancel') {
        await finish({error: 'access_denied', error_description: 'The user cancelled.'});
    } else if (prompt.name === 'consent') {
        await askForConsent({provider, uid, params, session, isAsked, response, finish});
    } else {
        await askForPassword({users, uid, form, isAsked, response, finish});
    }
}

async function askForConsent({provider, uid, params, session, isAsked, response, finish}) {
    if (isAsked) {
        sendConsentForm(response, uid);
        return;
    }
    const grant = await makeGrant(provider, session.accountId, params.client_id);
    await finish({consent: {grantId: grant.jti}});
}

async function askForPassword({users, uid, form, isAsked, response, finish}) {
    const login = form.get('login');
    if (isAsked) {
        sendSignInForm(response, uid, '');
    } else if (users.get(login)?.password === form.get('password')) {
        await finish({login: {accountId: login}});
    } else {
        sendSignInForm(response, uid, 'Name and password do not match.');
    }
}

// Directory providers do not require the client id for a logout; this one does.
function signOut(clientID, request, response) {
    const {searchParams} = new URL(request.url, 'https://provider');
    searchParams.set('client_id', clientID);
    response.writeHead(303, {Location: `/session/end?${searchParams}`}).end();
}

// Reports the requests of the appliance, before the answer is sent.
function reporting(report) {
    return async (context, next) => {
        await next();
        if (['token', 'jwks', 'discovery'].includes(context.oidc?.route)) {
            report({
                method: context.method,
                path: context.path,
                parameters: Object.keys(context.oidc.body ?? {}),
                status: context.status,
            });
        }
    };
}

/**
 * Starts the provider on a port that the kernel chooses.
 *
 * `users` maps logins to {password, uniqueName}, with optional `decidesAlone` (asked for consent) and `claims`
 * (additional claims of the ID token). `report` is called for each request of an appliance. The returned `lifetimes` of
 * codes and ID tokens, in seconds, can be changed; negative values make them expired when issued.
 */
export async function startProvider({nodeModules, certificate, users, tenant, clients, report}) {
    const load = (file) => import(pathToFileURL(path.join(nodeModules, 'oidc-provider/lib', file)));
    const {Provider} = await load('index.js');
    const {default: MemoryAdapter} = await load('adapters/memory_adapter.js');
    const server = https.createServer(certificate);
    server.listen(0, '127.0.0.1');
    await once(server, 'listening');
    const address = `https://127.0.0.1:${server.address().port}`;

    const lifetimes = {code: 60, idToken: 600};
    const provider = new Provider(address, configuration({MemoryAdapter, clients, users, tenant, lifetimes}));
    provider.use(reporting(report));
    const answer = provider.callback();
    server.on('request', (request, response) => {
        if (request.url.startsWith(SIGN_IN)) {
            interact(provider, users, request, response).catch(() => {
                sendPage(response, 400, '<h1>This sign-in has ended</h1>');
            });
        } else if (request.url.startsWith(SIGN_OUT)) {
            signOut(clients[0].id, request, response);
        } else {
            answer(request, response);
        }
    });
    return {
        address,
        lifetimes,
        endpoints: {
            discovery: `${address}/.well-known/openid-configuration`,
            authorization: `${address}/auth`,
            token: `${address}/token`,
            logout: address + SIGN_OUT,
        },
        stop() {
            server.close();
            server.closeAllConnections();
        },
    };
}
