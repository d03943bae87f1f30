// What a CGI request costs in loading: processes that do nothing, with and without the library.
import {execFileSync, spawn, spawnSync} from 'node:child_process';
import {once} from 'node:events';
import {mkdirSync, readFileSync, writeFileSync} from 'node:fs';

const SETTINGS = '/usr/tavo/etc/ssoclient';
/** By the programs, of which the library's dependencies are what it cannot do without. */
const SUBJECTS = {empty: 'empty', dependencies: 'floor', library: 'ours'};
const UNITS = {wall: 'us wall', cpu: 'us CPU', faults: 'page faults'};
const AT_ONCE = [1, 2, 4, 8, 16, 32, 64];

/** Series by what they are about, each begun by its first value. */
class Collection {
    #series = new Map();

    add(value, about) {
        const key = JSON.stringify(about);
        if (!this.#series.has(key)) {
            this.#series.set(key, {...about, values: []});
        }
        this.#series.get(key).values.push(value);
    }

    get series() {
        return [...this.#series.values()];
    }
}

/** What the first request needs of the appliance. */
function configure() {
    mkdirSync(SETTINGS, {recursive: true});
    writeFileSync(`${SETTINGS}/azure.conf`, JSON.stringify({
        azure_sso_enable: true,
        azure_client_id: '6731de76-14a6-49ae-97bc-6eba6914391e',
        azure_client_secret: 'JqQX2PNo9bpM0uEihUPzyrh',
        azure_tenant_id: '8eaef023-2b34-4da1-9baa-8bc8c9d6a490',
        azure_authorization_endpoint: 'https://idp.example/authorize',
        azure_redirect_uri: 'https://nas.example/return',
    }));
}

/** Runs programs by turns, and gives what each took when the machine was not busy. */
function run(programs, names, {turns, atOnce = 1}) {
    const files = names.map((name) => `${programs}/start_${name}`);
    const args = [String(turns), String(atOnce), ...files];
    return JSON.parse(execFileSync(`${programs}/start_spawn`, args, {encoding: 'utf8', env: {}}));
}

/** A round of processes one after another. */
function measureProcesses(collection, programs, turns) {
    const results = run(programs, [...Object.keys(SUBJECTS), 'first_request'], {turns});
    for (const [key, unit] of Object.entries(UNITS)) {
        const [empty, dependencies, library, firstRequest] = results.map((result) => result[key]);
        const about = {group: 'start', unit};
        collection.add(empty, {...about, case: 'process', subject: 'empty'});
        collection.add(dependencies, {...about, case: 'process', subject: 'floor'});
        collection.add(library, {...about, case: 'process', subject: 'ours'});
        // What has only been loaded is the floor of what serves a request, too.
        collection.add(dependencies, {...about, case: 'a first request', subject: 'floor'});
        collection.add(firstRequest, {...about, case: 'a first request', subject: 'ours'});
    }
}

/** A round of processes that are started at once. */
function measureGrowth(collection, programs, most) {
    for (const x of AT_ONCE) {
        const turns = Math.ceil(most / x);
        const results = run(programs, ['dependencies', 'first_request'], {turns, atOnce: x});
        const about = {group: 'growth', case: 'CGI processes at once', x, unit: 'ms wall'};
        collection.add(results[0].wall / 1000, {...about, subject: 'floor'});
        collection.add(results[1].wall / 1000, {...about, subject: 'ours'});
    }
}

/** A process that has been loaded and waits. */
async function startWaiting(program) {
    const process = spawn(program, ['wait'], {stdio: ['pipe', 'pipe', 'inherit'], env: {}});
    const exit = once(process, 'exit');
    await once(process.stdout, 'data');
    return {
        /** Kilobytes of the names that `smaps_rollup` has. */
        memory(...names) {
            const rollup = readFileSync(`/proc/${process.pid}/smaps_rollup`, 'utf8');
            return names.map((name) => Number(new RegExp(`^${name}: +(\\d+) kB$`, 'm').exec(rollup)[1]))
                .reduce((a, b) => a + b, 0);
        },
        async end() {
            process.stdin.end();
            await exit;
        },
    };
}

/** Alone, a process has for its own what of its files nobody else has mapped. Another of its kind shares them. */
async function measureMemory(collection, programs) {
    for (const [program, subject] of Object.entries(SUBJECTS)) {
        const about = {group: 'start', subject, unit: 'kB'};
        const first = await startWaiting(`${programs}/start_${program}`);
        const own = () => first.memory('Private_Clean', 'Private_Dirty');
        collection.add(own(), {...about, case: 'private memory, alone'});
        const second = await startWaiting(`${programs}/start_${program}`);
        collection.add(own(), {...about, case: 'private memory, one of two'});
        collection.add(first.memory('Private_Dirty'), {...about, case: 'private memory written to'});
        await second.end();
        await first.end();
    }
}

function countRelocations(collection, programs) {
    for (const [program, subject] of Object.entries(SUBJECTS)) {
        const {stderr} = spawnSync(`${programs}/start_${program}`, {encoding: 'utf8', env: {LD_DEBUG: 'statistics'}});
        const [count, relative] = ['relocations', 'relative relocations']
            .map((name) => Number(new RegExp(`^ *\\d+:\\s+number of ${name}: (\\d+)$`, 'm').exec(stderr)[1]));
        const about = {group: 'start', subject, unit: 'relocations'};
        collection.add(count, {...about, case: 'relocations by name'});
        collection.add(relative, {...about, case: 'relocations by address'});
    }
}

/**
 * Runs inside tools/private-root.
 *
 *   build   the build's folder
 *   rounds  how many values a series has
 *   quick   for a look: in seconds
 */
export async function measure({build, quick = false, rounds = quick ? 3 : 11}) {
    const programs = `${build}/bench/start`;
    const collection = new Collection();
    configure();
    countRelocations(collection, programs);
    for (let round = 0; round < rounds; ++round) {
        measureProcesses(collection, programs, quick ? 8 : 120);
        measureGrowth(collection, programs, quick ? 2 : 16);
        await measureMemory(collection, programs);
    }
    return collection.series;
}
