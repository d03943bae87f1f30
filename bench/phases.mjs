// Where the instructions of a verification go: what the library's own functions call, and what it takes them.
import {execFile} from 'node:child_process';
import {readFileSync} from 'node:fs';
import {promisify} from 'node:util';

const CASES = ['RS256, 2048 bits, 1024 B', 'HS256, 1024 B'];
const SUBJECTS = ['ours', 'floor'];
/** Under callgrind: what is made once, at the first verification, is then little for each. */
const SECONDS = 0.5;
const MEASURED = /\bVerifyBy/;
const OWN_OBJECT = /\/(libtavosso\.so[^/]*|bench_verification)$/;
/** What they call leads to the measured functions. */
const START = /^(main|_start|\(below main\)|Bench::RunBenchmarks\(.*)$/;

/** The first that fits names the phase of a called function. The benchmark has a malloc of its own, which counts. */
const PHASES = {
    memory: /^(malloc|calloc|realloc|free|operator (new|delete)\b.*)$/,
    cleansing: /^(explicit_bzero|OPENSSL_cleanse)$/,
    'error queue': /^ERR_/,
    base64: /^BIO_/,
    JSON: /\bJson::/,
    signature: /^(RSA_|EVP_|BN_|HMAC)/,
    strings: /^(std::__cxx11::basic_string\b|__(mem|str)\w+$)/,
    others: /(?:)/,
};
const OWN = 'own code';

function phaseOf(callee) {
    return Object.keys(PHASES).find((phase) => PHASES[phase].test(callee));
}

/** By its documented format, the lines of a file of callgrind's that have full names and line numbers. */
function* readCosts(text) {
    const caller = {};
    let callee = {};
    let calls = 0;
    for (const line of text.split('\n')) {
        const [, key, value] = /^(ob|fn|cob|cfn|calls)=(.*)$/.exec(line) ?? [];
        const [, cost] = /^\d+ (\d+)$/.exec(line) ?? [];
        if (key === 'ob' || key === 'fn') {
            caller[key] = value;
        } else if (key === 'calls') {
            calls = Number.parseInt(value);
        } else if (key) {
            callee[key.slice(1)] = value;
        } else if (cost && calls) {
            // Without an object of its own, a callee is in its caller's.
            yield {caller: {...caller}, callee: {...caller, ...callee}, calls, instructions: Number(cost)};
            callee = {};
            calls = 0;
        } else if (cost) {
            yield {caller: {...caller}, instructions: Number(cost)};
        }
    }
}

function isOwn({ob, fn}) {
    return OWN_OBJECT.test(ob) && !START.test(fn) && !PHASES.memory.test(fn);
}

/** The instructions of each phase, per verification. */
function sumPhases(text) {
    const sums = new Map([...Object.keys(PHASES), OWN].map((phase) => [phase, 0]));
    const costs = [...readCosts(text)];
    // Some calls go by way of a jump to the called function, which callgrind finds in no object.
    const jumps = new Map(costs.filter(({caller, callee}) => callee && caller.ob === '???')
        .map(({caller, callee}) => [caller.fn, callee.fn]));
    let verifications = 0;
    for (const {caller, callee, calls, instructions} of costs) {
        if (callee && MEASURED.test(callee.fn)) {
            verifications += calls;
        } else if (isOwn(caller) && !(callee && isOwn(callee))) {
            const phase = callee ? phaseOf(jumps.get(callee.fn) ?? callee.fn) : OWN;
            sums.set(phase, sums.get(phase) + instructions);
        }
    }
    return new Map([...sums].map(([phase, sum]) => [phase, sum / verifications]));
}

async function measureCase(build, which, subject) {
    const file = `/tmp/phases-${which}-${subject}`; // fresh inside
    await promisify(execFile)('/usr/bin/valgrind', [
        '--quiet', '--tool=callgrind', '--toggle-collect=*VerifyBy*', '--compress-strings=no', '--compress-pos=no',
        `--callgrind-out-file=${file}`, `${build}/bench/bench_verification`,
        `--benchmark_filter=^verification/${which}/${subject}$`, `--benchmark_min_time=${SECONDS}`,
    ], {env: {}});
    const about = {group: 'phases', subject, unit: 'instructions'};
    const sums = sumPhases(readFileSync(file, 'utf8'));
    return [...sums, ['all', [...sums.values()].reduce((a, b) => a + b)]]
        .map(([phase, value]) => ({...about, case: `${which}: ${phase}`, values: [value]}));
}

/** Runs inside tools/private-root, with `build`, the build's folder. */
export async function measure({build}) {
    const runs = CASES.flatMap((which) => SUBJECTS.map((subject) => measureCase(build, which, subject)));
    return (await Promise.all(runs)).flat();
}
