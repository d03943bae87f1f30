// A provider that sends an endless answer. Runs as root of private namespaces.
import assert from 'node:assert/strict';
import {once} from 'node:events';
import {readFileSync} from 'node:fs';
import https from 'node:https';
import {pipeline} from 'node:stream/promises';
import {after, before, describe, test} from 'node:test';

import {useProfile, writeSettings} from '../site/front_end.mjs';
import {makeUsers, startSite} from '../site/site.mjs';
import {Browser} from './browser.mjs';

const CHUNK = Buffer.alloc(1 << 20, 'x');
const MOST = 2 ** 31; // bytes; more would mean that the program has no limit

const [webroot, nodeModules] = process.argv.slice(2);

/** Sends chunks until the client closes the connection. Returns the number of bytes. */
async function sendWithoutEnd(response) {
    let sent = 0;
    function* chunks() {
        for (; sent < MOST; sent += CHUNK.length) {
            yield CHUNK;
        }
    }
    await pipeline(chunks, response).catch(() => {});
    return sent;
}

describe('An endless answer', () => {
    let site;
    before(async () => {
        const users = makeUsers({alice: 'alice@corp.example.net'});
        site = await startSite({webroot, nodeModules, users, onRequest() {}, onLog() {}});
    });
    after(() => site.stop());

    test('ends the sign-in without exhausting memory', async () => {
        let sent;
        const endless = https.createServer(site.providerCertificate, (request, response) => {
            sent = sendWithoutEnd(response);
        }).listen(0, '127.0.0.1');
        await once(endless, 'listening');
        try {
            const token = `https://127.0.0.1:${endless.address().port}/token`;
            writeSettings({...site, provider: {endpoints: {...site.provider.endpoints, token}}});
            useProfile('azure');
            const browser = new Browser(readFileSync(site.authority), () => {});
            const form = await browser.open(`${site.origin}/webman/sso/login.cgi`);
            const relay = await browser.submit(form, {login: 'alice', password: site.users.get('alice').password});
            assert.match(relay.url.hash, /success=false$/);
            assert.ok(await sent < MOST, `the program received ${await sent} bytes`);
        } finally {
            endless.close();
            endless.closeAllConnections();
        }
    });
});
