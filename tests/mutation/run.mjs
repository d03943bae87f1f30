// Applies each change of mutations.txt alone to a copy of the library's sources, builds, and runs the quick suites;
// those that no test notices once more under sanitizers. A change that nobody notices then is a survivor: named at the
// end, and the exit status tells of it, unless its reason says why it makes no difference.
//
//   node tests/mutation/run.mjs [FILE...]    only the changes to these sources
//
// Works in copies of what is committed, under build/mutation.
import {execFileSync, spawn} from 'node:child_process';
import {readFileSync, rmSync, writeFileSync} from 'node:fs';
import {dirname, join} from 'node:path';
import {fileURLToPath} from 'node:url';

const project = join(dirname(fileURLToPath(import.meta.url)), '../..');
const copy = (name, preset) => ({folder: join(project, 'build/mutation', name), preset});
const copies = [copy('1', 'dev'), copy('2', 'dev')];
const sanitizedCopies = [copy('asan', 'asan')];
const suites = ['unit/unit_tests', 'unit/interposition_tests', 'loopback/loopback_secrets_test',
    'loopback/loopback_login_test', 'loopback/loopback_transport_test', 'faults/faults_calls_test',
    'faults/faults_memory_test'];
const longest = 300_000; // milliseconds: a change that makes a suite hang is noticed, too

function readMutations() {
    const list = [];
    let file;
    for (const line of readFileSync(join(project, 'tests/mutation/mutations.txt'), 'utf8').split('\n')) {
        const [, mark, text] = /^([-@+=]\d?) ?(.*)$/.exec(line) ?? [];
        if (mark === '@') {
            file = text;
        } else if (mark?.startsWith('-')) {
            list.push({file, number: Number(mark.slice(1)), old: text});
        } else if (mark === '+') {
            list.at(-1).changed = text;
        } else if (mark === '=') {
            list.at(-1).reason = text;
        }
    }
    return list;
}

// The source with the change. A text that has to stand there once and does not is a mistake in the list.
function apply({file, number, old, changed}, source) {
    const parts = source.split(old);
    if (number === 0 ? parts.length !== 2 : parts.length <= number) {
        throw new Error(`${file}: "${old}" stands there ${parts.length - 1} times`);
    }
    const before = Math.max(number, 1);
    return parts.slice(0, before).join(old) + changed + parts.slice(before).join(old);
}

function run(command, commandArguments, folder) {
    return new Promise((resolve) => {
        const process = spawn(command, commandArguments, {cwd: folder, stdio: 'ignore', timeout: longest});
        process.on('exit', (status) => resolve(status === 0));
    });
}

const build = ({folder, preset}) =>
    run('cmake', ['--build', `build/${preset}`, '--', '--quiet', '-j1', 'tavosso'], folder);

async function firstFailingSuite({folder, preset}) {
    for (const suite of suites) {
        const passed = await run('tools/private-root', [`build/${preset}/tests/${suite}`, '--gtest_fail_fast'], folder);
        if (!passed) {
            return suite;
        }
    }
    return null;
}

async function prepare({folder, preset}) {
    rmSync(folder, {recursive: true, force: true});
    execFileSync('git', ['clone', '--quiet', project, folder]);
    // The assertions of the C++ library notice what is undefined and looks well: they only tell where sanitizers look.
    const quick = ['-DCMAKE_BUILD_TYPE=Debug', '-DCMAKE_COMPILE_WARNING_AS_ERROR=OFF',
        ...(preset === 'asan' ? ['-DCMAKE_CXX_FLAGS=-D_GLIBCXX_ASSERTIONS'] : [])];
    execFileSync('cmake', ['--preset', preset, ...quick], {cwd: folder, stdio: 'ignore'});
    const targets = ['tavosso', ...suites.map((suite) => suite.split('/')[1])];
    execFileSync('cmake', ['--build', `build/${preset}`, '--', '--quiet', ...targets], {cwd: folder, stdio: 'inherit'});
    const failing = await firstFailingSuite({folder, preset});
    if (failing) {
        throw new Error(`${failing} fails without any change`);
    }
}

async function examine(mutation, {folder, preset}) {
    const path = join(folder, mutation.file);
    const source = readFileSync(path, 'utf8');
    writeFileSync(path, apply(mutation, source));
    const built = await build({folder, preset});
    mutation.noticedBy = built ? await firstFailingSuite({folder, preset}) : 'the compiler';
    writeFileSync(path, source);
    const verdict = mutation.noticedBy ?? (mutation.reason ? `nobody: ${mutation.reason}` : 'NOBODY');
    console.log(`${preset}: ${mutation.file}: ${mutation.old} -> ${mutation.changed}: noticed by ${verdict}`);
}

async function examineAll(changes, places) {
    if (changes.length === 0) {
        return;
    }
    for (const place of places) {
        await prepare(place);
    }
    const queue = [...changes];
    await Promise.all(places.map(async (place) => {
        for (let change = queue.shift(); change; change = queue.shift()) {
            await examine(change, place);
        }
    }));
}

const survivorsOf = (changes) => changes.filter(({noticedBy, reason}) => noticedBy === null && !reason);

const files = process.argv.slice(2);
const mutations = readMutations().filter(({file}) => files.length === 0 || files.includes(file));
if (mutations.length === 0) {
    throw new Error('nothing to change');
}
mutations.forEach((mutation) => apply(mutation, readFileSync(join(project, mutation.file), 'utf8')));
await examineAll(mutations, copies);
await examineAll(survivorsOf(mutations), sanitizedCopies);

const uncompiled = mutations.filter(({noticedBy}) => noticedBy === 'the compiler');
const survivors = survivorsOf(mutations);
const needless = mutations.filter(({noticedBy, reason}) => noticedBy !== null && reason);
console.log(`\n${mutations.length} changes, ${uncompiled.length} of which do not compile, ${survivors.length} survive`);
survivors.forEach(({file, old, changed}) => console.log(`survives: ${file}: ${old} -> ${changed}`));
needless.forEach(({file, old}) => console.log(`noticed, though it has a reason: ${file}: ${old}`));
process.exitCode = survivors.length + needless.length + uncompiled.length === 0 ? 0 : 1;
