// An Active Directory domain controller with winbindd: Samba, provisioned for each run. Runs as root of private
// namespaces with their own /run, so programs find winbindd at its usual place.
import {execFile, spawn} from 'node:child_process';
import {once} from 'node:events';
import {mkdirSync, mkdtempSync, readdirSync, readFileSync} from 'node:fs';
import path from 'node:path';
import {fileURLToPath} from 'node:url';
import {promisify} from 'node:util';

const run = promisify(execFile);
const PROVISION = fileURLToPath(new URL('provision.py', import.meta.url));
const TRUSTED_DOMAIN = 'LAB.EXAMPLE.NET';

/** A server process in the foreground. */
class Server {
    #ended;

    constructor(program, ...args) {
        this.program = program;
        this.process = spawn(`/usr/sbin/${program}`, [...args, '--foreground', '--no-process-group'], {stdio: 'ignore'});
        this.#ended = once(this.process, 'exit');
    }

    get pid() {
        return this.process.pid;
    }

    get isRunning() {
        return this.process.exitCode === null && this.process.signalCode === null;
    }

    async end(signal) {
        if (this.isRunning) {
            this.process.kill(signal);
        }
        await this.#ended;
    }
}

function state(pid) {
    return /^State:\t(.)/m.exec(readFileSync(`/proc/${pid}/status`, 'utf8'))[1];
}

export class Controller {
    #folder;
    #settings;
    #samba;
    #winbindd;

    constructor(folder) {
        this.#folder = folder;
        this.#settings = `--configfile=${folder}/smb.conf`;
    }

    /** Starts the controller. `seconds` is the duration of the start. */
    static async start() {
        const began = performance.now();
        const controller = new Controller(mkdtempSync('/tmp/dc-')); // contains a socket, whose path must be short
        await run('/usr/bin/python3', [PROVISION, controller.#folder]);
        mkdirSync('/run/samba', {mode: 0o755});
        controller.#samba = new Server('samba', controller.#settings);
        try {
            await controller.startWinbindd();
        } catch (failure) {
            await controller.stop();
            throw failure;
        }
        controller.seconds = ((performance.now() - began) / 1000).toFixed(1);
        return controller;
    }

    async startWinbindd() {
        // On a domain controller, winbindd starts only with this option.
        this.#winbindd = new Server('winbindd', this.#settings, `--log-basename=${this.#folder}`,
            '--option=server role check:inhibit=yes');
        await this.#until(() => run('wbinfo', ['--ping']));
        // The first query for another domain is slow, because it looks for its controllers.
        await run('wbinfo', [`--domain-info=${TRUSTED_DOMAIN}`]);
    }

    async #until(attempt) {
        for (;;) {
            try {
                return await attempt();
            } catch (failure) {
                for (const server of [this.#samba, this.#winbindd]) {
                    if (!server.isRunning) {
                        throw new Error(`${server.program} has ended:\n${this.#logs()}`, {cause: failure});
                    }
                }
            }
        }
    }

    #logs() {
        return readdirSync(this.#folder).filter((name) => name.startsWith('log.'))
            .map((name) => readFileSync(path.join(this.#folder, name), 'utf8')).join('\n');
    }

    /** Simulates a crash. */
    async killWinbindd() {
        await this.#winbindd.end('SIGKILL');
    }

    /** Makes winbindd accept connections without answering. */
    async stopWinbindd() {
        this.#winbindd.process.kill('SIGSTOP');
        while (!this.isWinbinddStopped) {
            await new Promise(setImmediate);
        }
    }

    continueWinbindd() {
        this.#winbindd.process.kill('SIGCONT');
    }

    get isWinbinddStopped() {
        return state(this.#winbindd.pid) === 'T';
    }

    async stop() {
        await this.#winbindd.end('SIGKILL');
        await this.#samba.end('SIGTERM');
    }
}
