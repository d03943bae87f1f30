// The commands that the documents tell their readers to run, and how a test runs each.
import {execFileSync} from 'node:child_process';

import {asPattern, blocks, codeSpans, documents, PROJECT, proseLines} from './documents.mjs';

/** Commands of blocks that are not run here, and why. */
const ELSEWHERE = new Map([
    ['./check', 'is what runs this'],
    ['bench/run', 'takes a quarter of an hour; ./check bench runs it for a minute'],
    ['tests/package/machine --clone /home/ada/tavosso --user ada ./check style', 'is how these commands are run'],
]);

// What a span of text begins with that is a command, or what follows a command's name: an option. A file's name alone
// is none.
const COMMAND = new RegExp('^(?:\\./|bench/run |(?:apt|apt-get|cmake|ctest|dpkg|dpkg-buildpackage|g\\+\\+|git|journalctl|ldd|lintian|ls|' +
    'lighty-enable-mod|man|node|openssl|pre-commit|python3|readelf|sudo|systemctl|tavosso-doctor|ulimit|xargs) |tests/\\w+/\\w+ |' +
    'tools/[\\w-]+ |[a-z][\\w.+-]*(?: \\S+)* --?[a-z])');

/** Commands within the text that cannot be run to the letter, and what is run for them. */
const FILLED_IN = new Map([
    ['./demo serve', 'until_it_waits ./demo serve'],
    ['./demo serve websphere', 'until_it_waits ./demo serve websphere'],
    ['cmake --preset release -DTAVOSSO_PLATFORM_LIBRARIES="/path/to/one.so;/path/to/other.so"',
        'cmake --preset release -B build/appliance -DTAVOSSO_PLATFORM_LIBRARIES=/usr/local/lib/libtavoplatform.so.0 &&' +
        ' cmake --build build/appliance --target tavosso'],
    ['g++ -std=c++17 sso.cpp -o sso.cgi $(pkg-config --cflags --libs tavosso)',
        'cd build/first && g++ -std=c++17 sso.cpp -o sso.cgi $(pkg-config --cflags --libs tavosso)'],
    ['g++ -std=c++17 login.cpp -o login.cgi $(pkg-config --cflags --libs tavosso)',
        'mkdir build/guide && tests/consumer/programs build/guide && cd build/guide/guide &&' +
        ' g++ -std=c++17 login.cpp -o login.cgi $(pkg-config --cflags --libs tavosso)'],
    ['sudo apt-get install ./libtavosso6_*.deb ./libtavoplatform0_*.deb ./libtavosso-common_*.deb ./tavosso-frontend_*.deb',
        'cd .. && apt-get install ./libtavosso6_*.deb ./libtavoplatform0_*.deb ./libtavosso-common_*.deb' +
        ' ./tavosso-frontend_*.deb'],
    ['sudo lighty-disable-mod tavosso-frontend',
        'lighty-enable-mod tavosso-frontend && lighty-disable-mod tavosso-frontend'],
    ['clang-format -i FILE', 'clang-format -i sso/sso.cpp'],
    ['git shortlog -se', 'git shortlog -se HEAD'], // it would read from what is no terminal
    ['man tavosso-doctor', 'man ./docs/man/tavosso-doctor.8'],
    ['tavosso-doctor explain TEXT', 'build/release/doctor/tavosso-doctor explain "profile not support."'],
    ['sudo tavosso-doctor --domain corp.example.net',
        'build/release/doctor/tavosso-doctor --domain corp.example.net || [ $? = 1 ]'], // no profile is set up there
    ['ls -l FILE', 'ls -l build/first/profile.conf'],
    ['python3 -m json.tool FILE', 'python3 -m json.tool build/first/profile.conf'],
]);

/** Commands within the text that are not run here, and why. */
const NOT_HERE = new Map([
    ['cmake --install', 'names the command of the README'],
    ['dpkg-buildpackage -us -uc -b', 'stands in a block, too'],
    ['git commit', 'by hand'],
    ['git grep', 'names a command'],
    ['git tag -a vVERSION', 'by hand'],
    ['node tests/mutation/run.mjs', 'by hand: an hour'],
    ['openssl s_server -www', 'tells how a figure was measured'],
    ['sudo tavosso-doctor login', 'asks a person: tests/doctor answers it'],
    ['tavosso-doctor login', 'the same'],
    ['tavosso-doctor token FILE', 'needs a token: tests/doctor has them'],
    ['tests/fuzz/run --hours 1', 'by hand: an hour'],
    ['tests/fuzz/run --report', 'by hand, after that'],
]);

export function isCommand(text) {
    return COMMAND.test(text);
}

// An engineer begins with ./check, which installs what is missing, as ./demo does. Behind them it would not show that
// another block needs a package that it does not name.
const installsByItself = ({document, text}) =>
    text.trim() === './demo' || ['CONTRIBUTING.md', 'docs/release.md'].includes(document);
const shellBlocks = documents.flatMap(blocks).filter(({language}) => language === 'sh')
    .sort((a, b) => installsByItself(a) - installsByItself(b));
const isRun = ({text}) => !ELSEWHERE.has(text.trim());

const partsOfCheck = execFileSync('./check', ['--help'], {cwd: PROJECT, encoding: 'utf8'});

// Commands with places to fill in do not stand in blocks of shell.
const spans = documents.flatMap((document) => [
    ...proseLines(document).flatMap(({line, text}) => codeSpans(text).map((span) => ({document, line, text: span}))),
    ...blocks(document).filter(({language}) => language === 'text'),
].sort((a, b) => a.line - b.line)).filter(({text}) => isCommand(text));

/** Is this `./check` with parts? Those commands are run by one of them, and the others take as long. */
function isPartOfCheck({text}) {
    const parts = /^\.\/check ([a-z ]+)$/.exec(text)?.[1].split(' ');
    return parts?.every((part) => new RegExp(`^ .*\\b${part}\\b`, 'm').test(partsOfCheck));
}

const withinText = spans.filter(({text}, index) => spans.findIndex((span) => span.text === text) === index)
    .filter((span) => !ELSEWHERE.has(span.text) && !NOT_HERE.has(span.text) && !isPartOfCheck(span));

/** What stands in the tables above, and in no document any more. */
export const needless = [
    ...[...FILLED_IN.keys(), ...NOT_HERE.keys()].filter((command) => !spans.some(({text}) => text === command)),
    ...[...ELSEWHERE.keys()].filter((command) => !shellBlocks.some(({text}) => text.trim() === command)),
];

/** Patterns of the lines that a command prints, where the document shows them behind it; "..." is anything. */
function expectedOutput(block) {
    const inDocument = blocks(block.document);
    const next = inDocument[inDocument.findIndex(({line}) => line === block.line) + 1];
    if (next?.language !== 'text' || isCommand(next.text) || headingBetween(block, next)) {
        return '';
    }
    return asPattern(next.text).replaceAll('\\.\\.\\.', '.*');
}

function headingBetween(block, next) {
    return proseLines(block.document).some(({line, text}) =>
        line > block.line && line < next.line && text.startsWith('#'));
}

/**
 * A script of one line for each, in the order of the documents: "run" or "administer", where it stands, the commands,
 * and what they have to print. Blocks come first: what stands within text may need what they make.
 */
export function script() {
    const quoted = (text) => `'${text.replaceAll('\'', '\'\\\'\'')}'`;
    const line = ({document, line: number, text}, output) => {
        const how = document === 'docs/operations.md' ? 'administer' : 'run';
        return `${[how, ...[`${document}:${number}`, FILLED_IN.get(text) ?? text, output].map(quoted)].join(' ')}\n`;
    };
    return [
        ...shellBlocks.filter(isRun).map((block) => line(block, expectedOutput(block))),
        ...withinText.map((span) => line(span, '')),
    ].join('');
}

/** How many commands have something to print. */
export const countWithOutput = shellBlocks.filter(isRun).filter((block) => expectedOutput(block) !== '').length;

export const count = shellBlocks.filter(isRun).length + withinText.length;
