// Applies each change of mutations.txt alone to a copy of the library's sources, builds, and runs the quick suites.
// A change that no test notices is a survivor: named at the end, and the exit status tells of it, unless its reason
// says why it makes no difference.
//
//   node tests/mutation/run.mjs [FILE...]    only the changes to these sources
//
// Works in copies of what is committed, under build/mutation.
import { execFileSync, spawn } from 'node:child_process';
import { readFileSync, rmSync, writeFileSync } from 'node:fs';
import { dirname, join } from 'node:path';
import { fileURLToPath } from 'node:url';

const project = join(dirname(fileURLToPath(import.meta.url)), '../..');
const copies = [1, 2].map((number) => join(project, 'build/mutation', String(number)));
const suites = ['unit/unit_tests', 'unit/interposition_tests', 'loopback/loopback_secrets_test',
  'loopback/loopback_login_test', 'loopback/loopback_transport_test', 'faults/faults_calls_test',
  'faults/faults_memory_test'];
const longest = 300_000; // milliseconds: a change that makes a suite hang is noticed, too

function readMutations() {
  const mutations = [];
  let file;
  for (const line of readFileSync(join(project, 'tests/mutation/mutations.txt'), 'utf8').split('\n')) {
    const [, mark, text] = /^([-@+=]\d?) ?(.*)$/.exec(line) ?? [];
    if (mark === '@') file = text;
    else if (mark?.startsWith('-')) mutations.push({ file, number: Number(mark.slice(1)), old: text });
    else if (mark === '+') mutations.at(-1).changed = text;
    else if (mark === '=') mutations.at(-1).reason = text;
  }
  return mutations;
}

// The source with the change. A text that has to stand there once and does not is a mistake in the list.
function apply({ file, number, old, changed }, source) {
  const parts = source.split(old);
  if (number === 0 ? parts.length !== 2 : parts.length <= number) {
    throw new Error(`${file}: "${old}" stands there ${parts.length - 1} times`);
  }
  const before = Math.max(number, 1);
  return parts.slice(0, before).join(old) + changed + parts.slice(before).join(old);
}

function run(command, commandArguments, folder) {
  return new Promise((resolve) => {
    const process = spawn(command, commandArguments, { cwd: folder, stdio: 'ignore', timeout: longest });
    process.on('exit', (status) => resolve(status === 0));
  });
}

const build = (copy) => run('cmake', ['--build', 'build/dev', '--', '--quiet', '-j1', 'tavosso'], copy);

async function firstFailingSuite(copy) {
  for (const suite of suites) {
    const passed = await run('tools/private-root', [`build/dev/tests/${suite}`, '--gtest_fail_fast'], copy);
    if (!passed) return suite;
  }
  return null;
}

function prepare(copy) {
  rmSync(copy, { recursive: true, force: true });
  execFileSync('git', ['clone', '--quiet', project, copy]);
  const quick = ['-DCMAKE_BUILD_TYPE=Debug', '-DCMAKE_COMPILE_WARNING_AS_ERROR=OFF'];
  execFileSync('cmake', ['--preset', 'dev', ...quick], { cwd: copy, stdio: 'ignore' });
  const targets = ['tavosso', ...suites.map((suite) => suite.split('/')[1])];
  execFileSync('cmake', ['--build', 'build/dev', '--', '--quiet', ...targets], { cwd: copy, stdio: 'inherit' });
}

async function examine(mutation, copy) {
  const path = join(copy, mutation.file);
  const source = readFileSync(path, 'utf8');
  writeFileSync(path, apply(mutation, source));
  const built = await build(copy);
  mutation.noticedBy = built ? await firstFailingSuite(copy) : 'the compiler';
  writeFileSync(path, source);
  const verdict = mutation.noticedBy ?? (mutation.reason ? `nobody: ${mutation.reason}` : 'NOBODY');
  console.log(`${mutation.file}: ${mutation.old} -> ${mutation.changed}: noticed by ${verdict}`);
}

const files = process.argv.slice(2);
const mutations = readMutations().filter(({ file }) => files.length === 0 || files.includes(file));
if (mutations.length === 0) throw new Error('nothing to change');
mutations.forEach((mutation) => apply(mutation, readFileSync(join(project, mutation.file), 'utf8')));
copies.forEach(prepare);
for (const copy of copies) {
  const failing = await firstFailingSuite(copy);
  if (failing) throw new Error(`${failing} fails without any change`);
}
const queue = [...mutations];
await Promise.all(copies.map(async (copy) => {
  for (let mutation = queue.shift(); mutation; mutation = queue.shift()) await examine(mutation, copy);
  await build(copy);
}));

const uncompiled = mutations.filter(({ noticedBy }) => noticedBy === 'the compiler');
const survivors = mutations.filter(({ noticedBy, reason }) => noticedBy === null && !reason);
const needless = mutations.filter(({ noticedBy, reason }) => noticedBy !== null && reason);
console.log(`\n${mutations.length} changes, ${uncompiled.length} of which do not compile, ${survivors.length} survive`);
survivors.forEach(({ file, old, changed }) => console.log(`survives: ${file}: ${old} -> ${changed}`));
needless.forEach(({ file, old }) => console.log(`noticed, though it has a reason: ${file}: ${old}`));
process.exitCode = survivors.length + needless.length + uncompiled.length === 0 ? 0 : 1;
