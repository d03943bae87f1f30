// What programs of Google Benchmark's measure.
import {execFileSync} from 'node:child_process';
import {median} from './statistics.mjs';

const PROGRAMS = ['bench_verification', 'bench_requests', 'bench_growth'];
const MICROSECONDS = {ns: 1e-3, us: 1, ms: 1e3, s: 1e6};
const MOST_OUTPUT = 1 << 28;

/** `GROUP/CASE/SUBJECT`, and where something grows, `GROUP/CASE/X/SUBJECT`. */
function parseName(name) {
    const match = /^(?<group>[^/]+)\/(?<which>[^/]+)(\/(?<x>\d+))?\/(?<subject>[^/]+)$/.exec(name);
    if (!match) {
        throw new Error(`not the name of a benchmark: ${name}`);
    }
    const {group, which, x, subject} = match.groups;
    return {group, case: which, ...(x && {x: Number(x)}), subject};
}

/** The repetitions of each benchmark, by its name, in the program's own order. */
function run(program, {repetitions, seconds}) {
    const output = execFileSync(program, [
        '--benchmark_format=json',
        '--benchmark_enable_random_interleaving=true',
        `--benchmark_repetitions=${repetitions}`,
        `--benchmark_min_time=${seconds}`,
    ], {encoding: 'utf8', env: {}, maxBuffer: MOST_OUTPUT});
    const results = new Map();
    const repetitionsOfAll = JSON.parse(output).benchmarks.filter((each) => each.run_type === 'iteration')
        .sort((a, b) => a.family_index - b.family_index);
    for (const result of repetitionsOfAll) {
        if (result.error_occurred) {
            throw new Error(`${result.name}: ${result.error_message}`);
        }
        results.set(result.run_name, [...results.get(result.run_name) ?? [], result]);
    }
    if (results.size === 0) {
        throw new Error(`${program} has measured nothing`);
    }
    return results;
}

/** What a round has of one benchmark: on a busy machine the median has proved steadier than the least. */
function valuesOf(repetitions) {
    const times = repetitions.map((each) => each.cpu_time * MICROSECONDS[each.time_unit]);
    return {
        'us CPU': median(times),
        allocations: median(repetitions.map((each) => each.allocations)),
    };
}

/**
 *   build   the build's folder
 *   rounds  how many values a series has
 *   quick   for a look: in seconds
 */
export function measure({build, quick = false, rounds = quick ? 3 : 15}) {
    const options = quick ? {repetitions: 3, seconds: 0.002} : {repetitions: 5, seconds: 0.02};
    const series = new Map();
    for (let round = 0; round < rounds; ++round) {
        for (const program of PROGRAMS) {
            const results = run(`${build}/bench/${program}`, options);
            for (const [name, repetitions] of results) {
                for (const [unit, value] of Object.entries(valuesOf(repetitions))) {
                    const key = `${name}/${unit}`;
                    const known = series.get(key) ?? {...parseName(name), unit, values: []};
                    series.set(key, known);
                    known.values.push(value);
                }
            }
        }
    }
    return [...series.values()];
}
