// The appliance: configuration files, and a web server with the front end.
import {spawn} from 'node:child_process';
import {once} from 'node:events';
import {mkdirSync, readFileSync, writeFileSync} from 'node:fs';
import net from 'node:net';
import path from 'node:path';
import {fileURLToPath} from 'node:url';

const ETC = '/usr/tavo/etc';
// If the front end is installed, the settings of the system's web server are used.
const INSTALLED_SETTINGS = process.env.INSTALLED_LIGHTTPD_CONF;
export const FRONT_END_SETTINGS = fileURLToPath(new URL('../../../frontend/lighttpd.conf', import.meta.url));

function writeJson(file, settings, mode) {
    writeFileSync(file, `${JSON.stringify(settings, null, 4)}\n`, {mode});
}

/** The platform's domain table: DNS names and NetBIOS names. */
export function writeDomains(domains, etc = ETC) {
    mkdirSync(`${etc}/ssoclient`, {recursive: true, mode: 0o755});
    writeJson(`${etc}/domains.conf`, domains, 0o644);
}

/** The configuration files of both clients. */
export function writeSettings({provider, clients}, etc = ETC) {
    const [azure, websphere] = clients;
    writeJson(`${etc}/ssoclient/azure.conf`, {
        azure_sso_enable: true,
        azure_wellknown: provider.endpoints.discovery,
        azure_client_id: azure.id,
        azure_client_secret: azure.secret,
        azure_tenant_id: azure.tenant,
        azure_authorization_endpoint: provider.endpoints.authorization,
        azure_token_endpoint: provider.endpoints.token,
        azure_redirect_uri: azure.redirectURI,
        azure_logout_endpoint: provider.endpoints.logout,
    }, 0o600);
    writeJson(`${etc}/ssoclient/websphere.conf`, {
        websphere_wellknown: provider.endpoints.discovery,
        websphere_client_id: websphere.id,
        websphere_client_secret: websphere.secret,
        websphere_authorization_endpoint: provider.endpoints.authorization,
        websphere_token_endpoint: provider.endpoints.token,
        websphere_redirect_uri: websphere.redirectURI,
        websphere_logout_endpoint: provider.endpoints.logout,
    }, 0o600);
}

export function useProfile(name, enable = true, etc = ETC) {
    writeJson(`${etc}/ssoclient/profile.conf`, {sso_enable: enable, sso_profile: name}, 0o644);
}

/**
 * A listening socket for `startWebServer`. The kernel chooses the port, which must be known before the server starts.
 */
export async function listen() {
    const socket = net.createServer();
    socket.listen(0, '127.0.0.1');
    await once(socket, 'listening');
    // Otherwise a failed start would keep the process alive.
    socket.unref();
    return socket;
}

/** `frontEndSettings` is the path of the front end's settings. */
export function startWebServer({socket, webroot, certificate, folder, frontEndSettings = FRONT_END_SETTINGS}) {
    const settings = path.join(folder, 'lighttpd.conf');
    const log = path.join(folder, 'lighttpd.log');
    const uploads = path.join(folder, 'uploads');
    mkdirSync(uploads);
    mkdirSync('/usr/tavo/var', {recursive: true}); // the front end creates its folder here
    const served = INSTALLED_SETTINGS
        ? `include "${INSTALLED_SETTINGS}"`
        : `server.document-root = "${webroot}"\ninclude "${frontEndSettings}"`;
    writeFileSync(settings, `
${served}
server.systemd-socket-activation := "enable"
server.bind := "127.0.0.1"
server.port := ${socket.address().port}
server.errorlog := "${log}"
server.errorlog-use-syslog := "disable"
server.breakagelog := "${log}"
server.upload-dirs := ( "${uploads}" )
server.modules += ( "mod_openssl" )
ssl.engine := "enable"
# Also for a client that needs TLS 1.2: newer versions of lighttpd accept only 1.3 by default.
ssl.openssl.ssl-conf-cmd := ( "MinProtocol" => "TLSv1.2" )
ssl.pemfile := "${certificate.certFile}"
ssl.privkey := "${certificate.keyFile}"
`);
    // Socket activation needs the server's process id, which the shell knows before exec. Node has no public name for
    // the descriptor of a listening socket.
    const server = spawn('sh', ['-c', 'LISTEN_FDS=1 LISTEN_PID=$$ exec /usr/sbin/lighttpd -D -f "$0"', settings], {
        stdio: ['ignore', 'inherit', 'inherit', socket._handle.fd],
    });
    socket.close();
    return {
        pid: server.pid,
        uploads,
        log: () => readFileSync(log, 'utf8'),
        async stop() {
            if (server.exitCode === null && server.kill()) {
                await once(server, 'exit');
            }
        },
    };
}
