// The commands and programs of a guide, run with the addresses of a test instead of the examples.
import {spawn} from 'node:child_process';
import {once} from 'node:events';
import {readFileSync} from 'node:fs';
import {createInterface} from 'node:readline';
import {fileURLToPath} from 'node:url';

const GUIDE = readFileSync(fileURLToPath(new URL('../../../docs/providers.md', import.meta.url)), 'utf8');
const READY = 'ready';

/** The code blocks of a section in one language. */
export function blocks(heading, language) {
    const section = GUIDE.split(/^## /m).find((text) => text.startsWith(`${heading}\n`));
    const found = [...(section ?? '').matchAll(/^```(\w+)\n(.*?)^```$/gms)].filter(([, name]) => name === language);
    if (found.length === 0) {
        throw new Error(`the guide has no ${language} in "${heading}"`);
    }
    return found.map(([, , text]) => text);
}

/**
 * Runs shell commands in `folder` until `stop` is called. Returns when all of them have ended or run in the background,
 * with the values of the shell variables `names`. `replacements` maps texts of the guide to texts of this run.
 */
export async function run({commands, folder, replacements, names}) {
    const script = replacements.reduce((text, [from, to]) => text.replaceAll(from, to), commands.join('\n'));
    const values = names.map((name) => `echo "${name}=$${name}"`).join('\n');
    // Detached, so that the provider in the background can be ended with the shell.
    const shell = spawn('bash', ['-euo', 'pipefail', '-c', `sudo() { "$@"; }\n${script}\n${values}\necho ${READY}\nwait`], {
        cwd: folder, detached: true, stdio: ['ignore', 'pipe', 'inherit'],
    });
    const ended = once(shell, 'exit');
    const printed = new Map();
    for await (const line of createInterface(shell.stdout)) {
        if (line === READY) {
            return {
                values: printed,
                async stop() {
                    process.kill(-shell.pid);
                    await ended;
                },
            };
        }
        const [name, value] = line.split(/=(.*)/s);
        printed.set(name, value);
    }
    throw new Error('a command of the guide failed');
}
