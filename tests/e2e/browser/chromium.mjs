// Debian's Chromium, which asks nobody for anything on its own account.
import path from 'node:path';
import {pathToFileURL} from 'node:url';

const SWITCHES = [
    '--disable-background-networking', '--disable-component-update', '--disable-gpu', '--disable-quic',
    '--disable-sync', '--no-first-run',
];

/** `browserModules` is where the packages of this folder are installed; what it keeps is in `folder`. */
export async function startChromium({browserModules, folder, switches = []}) {
    const {chromium} = await import(pathToFileURL(path.join(browserModules, 'playwright-core/index.mjs')));
    return chromium.launch({
        executablePath: '/usr/bin/chromium',
        args: [...SWITCHES, ...switches],
        chromiumSandbox: false,
        env: {...process.env, HOME: folder, XDG_CONFIG_HOME: folder, XDG_CACHE_HOME: folder},
    });
}
