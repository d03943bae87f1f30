// A certificate authority for each run.
import {execFileSync} from 'node:child_process';
import {createHash, X509Certificate} from 'node:crypto';
import {readFileSync, writeFileSync} from 'node:fs';
import path from 'node:path';

const EXTENSIONS = {
    authority: 'basicConstraints = critical, CA:TRUE\nkeyUsage = critical, keyCertSign',
    server: 'basicConstraints = critical, CA:FALSE\nextendedKeyUsage = serverAuth',
};

// The fingerprint of the public key, by which Chromium can trust a server.
function fingerprint(certificate) {
    const key = new X509Certificate(certificate).publicKey.export({type: 'spki', format: 'der'});
    return createHash('sha256').update(key).digest('base64');
}

/**
 * Makes the authority in `folder`. Returns its file, and a function that issues a server certificate for "DNS:..." or
 * "IP:...".
 */
export function makeAuthority(folder) {
    const make = (name, extensions, ...options) => {
        const file = (suffix) => path.join(folder, name + suffix);
        const settings = `[req]\ndistinguished_name = dn\nprompt = no\nx509_extensions = extensions
[dn]\nCN = tavosso ${name}\n[extensions]\n${extensions}\n`;
        writeFileSync(file('.cnf'), settings);
        execFileSync('openssl', [
            'req', '-x509', '-config', file('.cnf'), '-newkey', 'ec', '-pkeyopt', 'ec_paramgen_curve:P-256', '-nodes',
            '-days', '60', '-keyout', file('.key'), '-out', file('.pem'), ...options,
        ], {stdio: ['ignore', 'ignore', 'pipe']});
        return {keyFile: file('.key'), certFile: file('.pem')};
    };
    const authority = make('authority', EXTENSIONS.authority);
    return {
        file: authority.certFile,
        issue(name, subject) {
            const issuer = ['-CA', authority.certFile, '-CAkey', authority.keyFile];
            const files = make(name, `${EXTENSIONS.server}\nsubjectAltName = ${subject}`, ...issuer);
            const cert = readFileSync(files.certFile);
            return {...files, key: readFileSync(files.keyFile), cert, fingerprint: fingerprint(cert)};
        },
    };
}
