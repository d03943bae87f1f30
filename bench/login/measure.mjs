// What a login takes by the library, beside what the bare transfers take that it is made of.
import {execFileSync, spawn} from 'node:child_process';
import {once} from 'node:events';
import {readFileSync, writeFileSync} from 'node:fs';

const TRUSTED = '/etc/ssl/certs/ca-certificates.crt';
const UNITS = {cpu: 'us CPU', wall: 'us wall', allocations: 'allocations', bytes: 'bytes allocated'};
const TRACED_LOGINS = 20;
const ATTEMPTS = 3;
const CALLS = '/tmp/calls'; // fresh inside

/** How often to log in at a time, for that to take a tenth of a second. */
const CASES = [
    {profile: 'azure', store: 'one authority', logins: 24},
    {profile: 'websphere', store: 'one authority', logins: 72},
    {profile: 'azure', store: 'all authorities', logins: 2},
    {profile: 'websphere', store: 'all authorities', logins: 5},
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

/** Per login: the calls of the process's start and end are in both runs. */
function callsOfLogin(command, profile) {
    const few = callsOf(command(profile, 1));
    const many = callsOf(command(profile, 1 + TRACED_LOGINS));
    return new Map([...many].map(([name, calls]) => [name, (calls - (few.get(name) ?? 0)) / TRACED_LOGINS]));
}

/** The least of each name: what an answer's being late makes a client do besides is not the program's. */
function leastOfEach(maps) {
    const names = [...maps[0].keys()].filter((name) => maps.every((map) => map.has(name)));
    return Object.fromEntries(names.map((name) => [name, Math.min(...maps.map((map) => map.get(name)))])
        .filter(([, value]) => value !== 0));
}

function sum(numbers) {
    return numbers.reduce((a, b) => a + b, 0);
}

function times(count, make) {
    return Array.from({length: count}, (_, i) => make(i));
}

/**
 * A round: what each program takes at its best of some attempts, since whatever else the machine does only adds. By
 * turns, so that the machine's moods meet both alike.
 */
function measureRound({profile, logins}, subjects) {
    const names = Object.keys(subjects);
    const attempts = times(ATTEMPTS, (i) => new Map((i % 2 === 0 ? names : [...names].reverse())
        .map((name) => [name, new Map(Object.entries(JSON.parse(run(subjects[name](profile, logins)))))])));
    return Object.fromEntries(names.map((name) => [name, leastOfEach(attempts.map((attempt) => attempt.get(name)))]));
}

/**
 * What a round gives for one program is best compared with what it gives for the other. A series of system calls has
 * them by name besides, in `byName`.
 */
function measureCase(which, subjects, {rounds, quick}) {
    const about = {group: 'login', case: `${which.profile}, ${which.store}`};
    const results = times(rounds, () => measureRound(which, subjects));
    return Object.entries(subjects).flatMap(([subject, command]) => {
        const byName = leastOfEach(times(quick ? 1 : ATTEMPTS, () => callsOfLogin(command, which.profile)));
        return [
            ...Object.entries(UNITS).map(([key, unit]) => (
                {...about, subject, unit, values: results.map((result) => result[subject][key])})),
            {...about, subject, unit: 'system calls', values: [sum(Object.values(byName))], byName},
        ];
    });
}

/**
 * Runs inside tools/private-root.
 *
 *   build   the build's folder
 *   bundle  a copy of the machine's authorities that can be read there
 *   rounds  how many values a series has
 *   quick   for a look: in seconds
 */
export async function measure({build, bundle, quick = false, rounds = quick ? 2 : 41}) {
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
