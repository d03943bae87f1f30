// Starts Debian's Chromium without background requests.
import path from 'node:path';
import {pathToFileURL} from 'node:url';

const SWITCHES = [
    '--disable-background-networking', '--disable-component-update', '--disable-gpu', '--disable-quic',
    '--disable-sync', '--no-first-run',
];

/** `browserModules` is the folder with the npm packages, `folder` that of the browser's files. */
export async function startChromium({browserModules, folder, switches = []}) {
    const {chromium} = await import(pathToFileURL(path.join(browserModules, 'playwright-core/index.mjs')));
    return chromium.launch({
        executablePath: '/usr/bin/chromium',
        args: [...SWITCHES, ...switches],
        chromiumSandbox: false,
        env: {...process.env, HOME: folder, XDG_CONFIG_HOME: folder, XDG_CACHE_HOME: folder},
    });
}
