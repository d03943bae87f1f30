// The OpenID provider: a certified implementation over TLS, with users of its own and a sign-in page of its own.
import {generateKeyPairSync, randomBytes} from 'node:crypto';
import {once} from 'node:events';
import https from 'node:https';
import path from 'node:path';
import {pathToFileURL} from 'node:url';

const SIGN_IN = '/sign-in/';
const SIGN_OUT = '/sign-out';

function signingKeys() {
    const {privateKey} = generateKeyPairSync('rsa', {modulusLength: 2048});
    return {keys: [{...privateKey.export({format: 'jwk'}), kid: randomBytes(8).toString('hex'), use: 'sig'}]};
}

function registration({id, secret, algorithm, redirectURI, logoutURI}) {
    return {
        client_id: id,
        client_secret: secret,
        redirect_uris: [redirectURI],
        post_logout_redirect_uris: [logoutURI],
        grant_types: ['authorization_code'],
        response_types: ['code'],
        token_endpoint_auth_method: 'client_secret_post',
        id_token_signed_response_alg: algorithm,
    };
}

function configuration({MemoryAdapter, clients, users, tenant}) {
    return {
        // Nothing outlives the run; under a name of our own the provider does not warn of that.
        adapter: class extends MemoryAdapter {},
        clients: clients.map(registration),
        enabledJWA: {idTokenSigningAlgValues: ['RS256', 'HS256']},
        pkce: {required: () => false},
        claims: {openid: ['sub', 'tid', 'unique_name'], profile: [], email: []},
        cookies: {keys: [randomBytes(32).toString('hex')]},
        features: {
            devInteractions: {enabled: false},
            rpInitiatedLogout: {logoutSource: showSignOutForm},
        },
        interactions: {url: (context, interaction) => SIGN_IN + interaction.uid},
        jwks: signingKeys(),
        ttl: {AccessToken: 600, Grant: 600, IdToken: 600, Interaction: 600, Session: 3600},
        findAccount: (context, login) => ({
            accountId: login,
            claims: () => ({sub: login, tid: tenant, unique_name: users.get(login).uniqueName}),
        }),
        loadExistingGrant: grantEverything,
    };
}

// The appliance belongs to the organisation: its users are not asked whether they trust it.
async function grantEverything({oidc}) {
    const grant = new oidc.provider.Grant({accountId: oidc.session.accountId, clientId: oidc.client.clientId});
    grant.addOIDCScope('openid profile email');
    await grant.save();
    return grant;
}

const page = (content) =>
    `<!DOCTYPE html><html lang="en"><title>Example organisation</title><main>${content}</main></html>`;

function showSignOutForm(context, form) {
    context.body = page(`<h1>Sign out of Example organisation?</h1>${form}
<button type="submit" form="op.logoutForm" name="logout" value="yes" autofocus>Sign out</button>`);
}

function sendPage(response, status, content) {
    response.writeHead(status, {'Content-Type': 'text/html; charset=utf-8', 'Cache-Control': 'no-store'});
    response.end(page(content));
}

function sendSignInForm(response, status, uid, hint) {
    sendPage(response, status, `<h1>Sign in to Example organisation</h1><p>${hint}</p>
<form method="post" action="${SIGN_IN}${uid}">
<p><label>Name <input name="login" autocomplete="username" autofocus></label></p>
<p><label>Password <input name="password" type="password" autocomplete="current-password"></label></p>
<p><button name="action" value="sign-in">Sign in</button> <button name="action" value="cancel">Cancel</button></p>
</form>`);
}

async function readForm(request) {
    let body = '';
    for await (const chunk of request) {
        body += chunk;
    }
    return new URLSearchParams(body);
}

async function signIn(provider, users, request, response) {
    const {uid} = await provider.interactionDetails(request, response);
    if (request.method !== 'POST') {
        sendSignInForm(response, 200, uid, '');
        return;
    }
    const form = await readForm(request);
    const user = users.get(form.get('login'));
    if (form.get('action') === 'cancel') {
        const error = {error: 'access_denied', error_description: 'The user cancelled.'};
        await provider.interactionFinished(request, response, error);
    } else if (user?.password === form.get('password')) {
        await provider.interactionFinished(request, response, {login: {accountId: form.get('login')}});
    } else {
        sendSignInForm(response, 401, uid, 'Name and password do not match.');
    }
}

// Directory providers send the browser back after a logout without asking which client it comes from; this one wants to
// know.
function signOut(clientID, request, response) {
    const {searchParams} = new URL(request.url, 'https://provider');
    searchParams.set('client_id', clientID);
    response.writeHead(303, {Location: `/session/end?${searchParams}`}).end();
}

// What the appliance, not the browser, asks; told before the answer goes out.
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
 * Starts the provider on a port of the kernel's choice.
 *
 * `users` is a map from login to {password, uniqueName}; `describeClients` gets the provider's address and gives the
 * clients to register; `report` is called for each request of an appliance.
 */
export async function startProvider({nodeModules, certificate, users, tenant, clients, report}) {
    const load = (file) => import(pathToFileURL(path.join(nodeModules, 'oidc-provider/lib', file)));
    const {Provider} = await load('index.js');
    const {default: MemoryAdapter} = await load('adapters/memory_adapter.js');
    const server = https.createServer(certificate);
    server.listen(0, '127.0.0.1');
    await once(server, 'listening');
    const address = `https://127.0.0.1:${server.address().port}`;

    const provider = new Provider(address, configuration({MemoryAdapter, clients, users, tenant}));
    provider.use(reporting(report));
    const answer = provider.callback();
    server.on('request', (request, response) => {
        if (request.url.startsWith(SIGN_IN)) {
            signIn(provider, users, request, response).catch(() => {
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
