// Reads the log lines that programs write to /dev/log.
import {once} from 'node:events';
import net from 'node:net';

const PATIENCE = 20_000;

/** Collects the log. Calls `report` with each line without its date, and its priority (RFC 3164, section 4.1.1). */
export async function collectSystemLog(report) {
    let unread = [];
    let lookForAwaited = () => {};
    const add = (record) => {
        const [, priority, rest] = /^<(\d+)>\w+ +\d+ [\d:]+ (.*)$/s.exec(record.toString());
        const line = rest.trimEnd();
        report(line, Number(priority));
        unread.push(line);
        lookForAwaited();
    };
    // Node has no Unix datagram sockets. On a stream, the C library terminates each record with a NUL.
    const server = net.createServer((connection) => {
        let unparsed = Buffer.alloc(0);
        connection.on('data', (chunk) => {
            unparsed = Buffer.concat([unparsed, chunk]);
            for (let end; (end = unparsed.indexOf(0)) >= 0; unparsed = unparsed.subarray(end + 1)) {
                add(unparsed.subarray(0, end));
            }
        });
        connection.on('error', () => {});
    });
    server.listen('/dev/log');
    await once(server, 'listening');
    return {
        /** Waits for a line. Discards it and all earlier lines. */
        until(pattern) {
            return new Promise((resolve, reject) => {
                const patience = setTimeout(() => reject(new Error(`no log line ${pattern}`)), PATIENCE);
                lookForAwaited = () => {
                    const found = unread.findIndex((line) => pattern.test(line));
                    if (found >= 0) {
                        clearTimeout(patience);
                        lookForAwaited = () => {};
                        const line = unread[found];
                        unread = unread.slice(found + 1);
                        resolve(line);
                    }
                };
                lookForAwaited();
            });
        },
        stop() {
            server.close();
        },
    };
}
