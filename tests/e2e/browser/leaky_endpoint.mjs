// A token endpoint whose error answers also contain tokens.
import {once} from 'node:events';
import https from 'node:https';

export const TOKEN = 'eyJhbGciOiJub25lIn0.c2VjcmV0.c2VjcmV0';

const ANSWER = {
    error: 'invalid_grant',
    error_description: 'used\r\nSet-Cookie: leaked=1\r\n\r\n<script>alert(1)</script>',
    access_token: TOKEN,
    id_token: TOKEN,
    refresh_token: TOKEN,
};

export async function startLeakyEndpoint(certificate) {
    const server = https.createServer(certificate, (request, response) => {
        request.resume();
        response.writeHead(400, {'Content-Type': 'application/json'}).end(JSON.stringify(ANSWER));
    });
    server.listen(0, '127.0.0.1');
    await once(server, 'listening');
    return {
        address: `https://127.0.0.1:${server.address().port}/token`,
        stop() {
            server.close();
            server.closeAllConnections();
        },
    };
}
