// What a login takes by the library, beside what the bare transfers take that it is made of.
import {execFileSync, spawn} from 'node:child_process';
import {once} from 'node:events';
import {readFileSync, writeFileSync} from 'node:fs';

const TRUSTED = '/etc/ssl/certs/ca-certificates.crt';
const UNITS = {cpu: 'us CPU', wall: 'us wall', allocations: 'allocations', bytes: 'bytes allocated'};
const TRACED_LOGINS = 40;
const CALLS = '/tmp/calls'; // fresh inside

/** How often to log in per round, for that to take a quarter of a second. */
const CASES = [
    {profile: 'azure', store: 'one authority', logins: 60},
    {profile: 'websphere', store: 'one authority', logins: 180},
    {profile: 'azure', store: 'all authorities', logins: 4},
    {profile: 'websphere', store: 'all authorities', logins: 12},
];

/** The provider, started with the appliance configured for it. */
async function startProvider(programs) {
    const process = spawn(`${programs}/login_provider`, {stdio: ['pipe', 'pipe', 'inherit']});
    const exit = once(process, 'exit');
    const [line] = await Promise.race([once(process.stdout, 'data'), exit]);
    if (!(line instanceof Buffer)) {
        throw new Error('the provider has not started');
    }
    return {
        address: line.toString().trim(),
        async stop() {
            process.stdin.end();
            await exit;
        },
    };
}

/** What is run to log in: without an environment, which might name a proxy. */
function commands(programs, address) {
    return {
        ours: (profile, logins) => [`${programs}/login_library`, profile, String(logins)],
        floor: (profile, logins) => [`${programs}/login_bare`, profile, String(logins), address],
    };
}

function run([program, ...args]) {
    return execFileSync(program, args, {encoding: 'utf8', env: {}});
}

/** How often a whole run makes each system call. */
function callsOf(command) {
    run(['/usr/bin/strace', '-f', '-c', '-U', 'name,calls', '-o', CALLS, ...command]);
    const rows = readFileSync(CALLS, 'utf8').matchAll(/^(\w+) +(\d+)$/gm);
    return new Map([...rows].map(([, name, calls]) => [name, Number(calls)]).filter(([name]) => name !== 'total'));
}

/** The system calls of a login, by their names: those of the process's start and end are in both runs. */
function systemCalls(command, profile) {
    const few = callsOf(command(profile, 1));
    const many = callsOf(command(profile, 1 + TRACED_LOGINS));
    return Object.fromEntries([...many].map(([name, calls]) => [name, (calls - (few.get(name) ?? 0)) / TRACED_LOGINS])
        .filter(([, calls]) => calls !== 0));
}

function sum(numbers) {
    return numbers.reduce((a, b) => a + b, 0);
}

/**
 * Both programs by turns, so that the machine's moods meet both alike: what a round gives for one is best compared with
 * what it gives for the other. A series of system calls has them by name besides, in `byName`.
 */
function measureCase({profile, store, logins}, subjects, {rounds, quick}) {
    const series = [];
    const begin = (unit, subject, values, more = {}) => {
        series.push({group: 'login', case: `${profile}, ${store}`, subject, unit, values, ...more});
        return values;
    };
    const values = Object.fromEntries(Object.keys(subjects).map((subject) => [
        subject, Object.fromEntries(Object.entries(UNITS).map(([key, unit]) => [key, begin(unit, subject, [])])),
    ]));
    for (let round = 0; round < rounds; ++round) {
        const order = Object.keys(subjects);
        for (const subject of round % 2 === 0 ? order : order.reverse()) {
            const result = JSON.parse(run(subjects[subject](profile, Math.ceil(logins / (quick ? 2 : 1)))));
            Object.entries(result).forEach(([key, value]) => values[subject][key].push(value));
        }
    }
    for (const [subject, command] of Object.entries(subjects)) {
        const byName = systemCalls(command, profile);
        begin('system calls', subject, [sum(Object.values(byName))], {byName});
    }
    return series;
}

/**
 * Runs inside tools/private-root.
 *
 *   build   the build's folder
 *   bundle  a copy of the machine's authorities that can be read there
 *   rounds  how many values a series has
 *   quick   for a look: in seconds
 */
export async function measure({build, bundle, quick = false, rounds = quick ? 5 : 61}) {
    const programs = `${build}/bench/login`;
    const provider = await startProvider(programs);
    try {
        const own = readFileSync(TRUSTED, 'utf8');
        const stores = {'one authority': own, 'all authorities': readFileSync(bundle, 'utf8') + own};
        const subjects = commands(programs, provider.address);
        return CASES.flatMap((each) => {
            writeFileSync(TRUSTED, stores[each.store]);
            return measureCase(each, subjects, {rounds, quick});
        });
    } finally {
        await provider.stop();
    }
}
