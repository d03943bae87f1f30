// Connections to the web server for tests that wait for its time limit.
import {once} from 'node:events';
import {readFileSync, writeFileSync} from 'node:fs';
import path from 'node:path';
import tls from 'node:tls';

import {FRONT_END_SETTINGS} from '../site/front_end.mjs';

export const LIMIT = /"read-timeout" => (\d+)/;

/** The front end's settings with a shorter time limit. */
export function withLimitOf(seconds, folder) {
    const file = path.join(folder, 'front_end.conf');
    writeFileSync(file, readFileSync(FRONT_END_SETTINGS, 'utf8').replace(LIMIT, `"read-timeout" => ${seconds}`));
    return file;
}

/** The status file of a process; empty if it has ended. */
export function processStatus(pid) {
    try {
        return readFileSync(`/proc/${pid}/status`, 'utf8');
    } catch {
        return '';
    }
}

export async function until(condition) {
    while (!condition()) {
        await new Promise(setImmediate);
    }
}

/**
 * An open connection on which the web server waits. lighttpd 1.4.69 does not apply the limit to a request that arrives
 * before the server has waited for it.
 */
export async function connect(authority, {origin, pid}) {
    const {port} = new URL(origin);
    // In TLS 1.2 the server sends the last message of the handshake. In 1.3 the browser does, and the server may read
    // the request together with it.
    const maxVersion = 'TLSv1.2';
    const socket = tls.connect({host: '127.0.0.1', servername: 'localhost', port, ca: authority, maxVersion});
    await once(socket, 'secureConnect');
    await until(() => /^State:\tS/m.test(processStatus(pid)));
    return socket;
}
