// All that is measured, as one table.
//
//   report.mjs BUILD [--quick] [--json]
//
// Runs inside tools/private-root. Writes plots to BUILD/plots.
import {execFileSync} from 'node:child_process';
import {statSync, writeFileSync} from 'node:fs';
import {cpus} from 'node:os';
import {Collection} from './collection.mjs';
import {measure as measureBenchmarks} from './google.mjs';
import {measure as measureLogins} from './login/measure.mjs';
import {measure as measurePhases} from './phases.mjs';
import {plotGrowth} from './plot.mjs';
import {measure as measureStarts} from './start/measure.mjs';
import {formatReport} from './table.mjs';
import {judge} from './targets.mjs';

/** What is shipped has no symbols but those that programs call. */
function measureSize({build}) {
    const stripped = '/tmp/stripped'; // fresh inside
    execFileSync('/usr/bin/strip', ['-o', stripped, `${build}/libtavosso.so.6.0.0`]);
    const values = [statSync(stripped).size / 1024];
    return [{group: 'size', case: 'stripped library', subject: 'ours', unit: 'kB', values}];
}

const MEASUREMENTS = {
    'verification, requests, growth': measureBenchmarks,
    'the phases of a verification': measurePhases,
    logins: measureLogins,
    'starts of processes': measureStarts,
    'the size of the library': measureSize,
};

const [build, ...flags] = process.argv.slice(2);
const quick = flags.includes('--quick');
const series = [];
for (const [what, measure] of Object.entries(MEASUREMENTS)) {
    process.stderr.write(`Measuring ${what}\n`);
    series.push(...await measure({build, bundle: `${build}/authorities.crt`, quick}));
}

const collection = new Collection(series);
for (const [name, svg] of Object.entries(plotGrowth(collection))) {
    writeFileSync(`${build}/plots/performance-${name}.svg`, svg);
}
const report = {
    machine: `${cpus()[0].model.trim()}, ${cpus().length} processors`,
    quick,
    rows: collection.rows,
    targets: judge(collection),
};
process.stdout.write(`${flags.includes('--json') ? JSON.stringify({...report, series}) : formatReport(report)}\n`);
