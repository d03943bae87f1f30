// The commands that the documents tell their readers to run, and how a test runs each.
import {ELSEWHERE, FILLED_IN, NOT_HERE} from './command_tables.mjs';
import {asPattern, blocks, codeSpans, documents, filesMatching, proseLines, read, unescaped} from './documents.mjs';

// What a span of text begins with that is a command: a prompt, the first line of a script, a name. Or what follows any
// command's name: an option. Of other single words those with a hyphen: no key has one. A file's name alone is none.
const COMMAND = new RegExp('^(?:[$#] |#!|\\./|bench/run |(?:apt|apt-get|cmake|ctest|dpkg|dpkg-buildpackage|g\\+\\+|' +
    'git|journalctl|ldd|lintian|ls|lighty-enable-mod|man|node|openssl|pre-commit|python3|readelf|sudo|systemctl|' +
    'tavosso-doctor|ulimit|xargs)(?: |$)|' +
    'tests/\\w+/\\w+ |tools/[\\w-]+ |[a-z]+(?:-[a-z]+)+$|[a-z][\\w.+-]*(?: \\S+)* --?[a-z])');

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

// What ./check alone runs, and the kinds of tests among it: each can be named. What takes longer is in a table.
const partsOfCheck = [...read('check').matchAll(/^(?:whole|kinds)=\((.*)\)$/gm)]
    .flatMap(([, parts]) => parts.split(' '));

/** Is this `./check` with parts? Those commands are run by one of them, and the others take as long. */
function isPartOfCheck({text}) {
    const parts = /^\.\/check ([a-z ]+)$/.exec(text)?.[1].split(' ');
    return parts?.every((part) => partsOfCheck.includes(part));
}

// Commands with places to fill in do not stand in blocks of shell.
const quotedIn = (document) => [
    ...proseLines(document).flatMap(({line, text}) => codeSpans(text).map((span) => ({document, line, text: span}))),
    ...blocks(document).filter(({language}) => language === 'text'),
].sort((a, b) => a.line - b.line);

/** What a manual page displays or quotes in a line, in any place of it: up to the next macro, or closing signs. */
function quotedInPage(page) {
    const quoted = /(?<=^\.(?:.* )?)(?:D[1l]|Ic|Li|Ql) (.*?)(?= [A-Z][a-z] |(?: [.,:;)])*$)/g;
    return read(page).split('\n').flatMap((macros, index) => [...macros.matchAll(quoted)].map(([, text]) =>
        ({document: page, line: index + 1, text: unescaped(text.replaceAll('"', ''))})));
}

/** The literal blocks of a manual page. */
function blocksOfPage(page) {
    const source = read(page);
    return [...source.matchAll(/^\.Bd .*\n([^]*?)\n\.Ed$/gm)].map(({index, 1: block}) =>
        ({document: page, line: source.slice(0, index).split('\n').length, text: unescaped(block)}));
}

/** What stands by itself in the text of a package: whatever is indented, in a list more than its own text is. */
function indentedIn(file) {
    let inList = false;
    return read(file).split('\n').flatMap((text, index) => {
        inList = /^\S/.test(text) ? /^(\d+\.|[-*]) /.test(text) : inList;
        const standsOut = inList ? /^ {5}/ : /^\s+\S/;
        return standsOut.test(text) ? [{document: file, line: index + 1, text: text.trim()}] : [];
    });
}

/** What manual pages and packages show as it is to be typed, or as it stands in a file or in a log. */
export const displayed = [
    ...filesMatching('docs/man/*').flatMap(quotedInPage),
    ...filesMatching('debian/*.README.Debian').flatMap(indentedIn),
];

// The table of what is installed has packages in backticks, many of which are called as their program.
const namesPackage = ({document, text}) => document === 'docs/licences.md' && !text.includes(' ');
const withoutPrompt = (text) => text.replace(/^# /gm, 'sudo ').replace(/^\$ /gm, '');

// What is for administrators runs as root, and last: it removes what was installed, which the others use.
const administers = ({document}) => document === 'docs/operations.md' || document.startsWith('debian/');
const spans = [
    ...documents.flatMap(quotedIn), ...filesMatching('docs/man/*').flatMap(blocksOfPage), ...displayed,
].sort((a, b) => administers(a) - administers(b)).filter((span) => isCommand(span.text) && !namesPackage(span))
    .map((span) => ({...span, text: withoutPrompt(span.text)}));

const standsInBlock = ({text}) => shellBlocks.some((block) => block.text.split('\n').includes(text));
const withinText = spans.filter(({text}, index) => spans.findIndex((span) => span.text === text) === index)
    .filter((span) => !standsInBlock(span) && !NOT_HERE.has(span.text) && !isPartOfCheck(span));

/** What stands in the tables, and in no document any more. */
export const needless = [
    ...[...FILLED_IN.keys(), ...NOT_HERE.keys()].filter((command) => !spans.some(({text}) => text === command)),
    ...[...ELSEWHERE.keys()].filter((command) => !shellBlocks.some(({text}) => text.trim() === command)),
];

/** The block of text that shows what a block of commands prints: the next one, under the same heading. */
function outputOf(block) {
    const inDocument = blocks(block.document);
    const next = inDocument[inDocument.findIndex(({line}) => line === block.line) + 1];
    return next?.language === 'text' && !isCommand(next.text) && !headingBetween(block, next) ? next : undefined;
}

/** Patterns of the lines that a command prints, where the document shows them; "..." is anything. */
function expectedOutput(block) {
    return asPattern(outputOf(block)?.text ?? '').replaceAll('\\.\\.\\.', '.*');
}

function headingBetween(block, next) {
    return proseLines(block.document).some(({line, text}) =>
        line > block.line && line < next.line && text.startsWith('#'));
}

const place = ({document, line}) => `${document}:${line}`;

/**
 * A script of one line for each, in the order of the documents: "run" or "administer", where it stands, the commands,
 * and what they have to print. Blocks come first: what stands within text may need what they make.
 */
export function script() {
    const quoted = (text) => `'${text.replaceAll('\'', '\'\\\'\'')}'`;
    const line = (command, output) => {
        const how = administers(command) ? 'administer' : 'run';
        const text = FILLED_IN.get(command.text) ?? command.text;
        return `${[how, ...[place(command), text, output].map(quoted)].join(' ')}\n`;
    };
    return [
        ...shellBlocks.filter(isRun).map((block) => line(block, expectedOutput(block))),
        ...withinText.map((span) => line(span, '')),
    ].join('');
}

const outputs = shellBlocks.filter(isRun).map(outputOf).filter(Boolean).map(place);

/** Blocks of text that are neither a command nor what one prints. */
export const otherTexts = documents.flatMap(blocks).filter((block) =>
    block.language === 'text' && !isCommand(block.text) && !outputs.includes(place(block)));

/** How many commands have something to print. */
export const countWithOutput = shellBlocks.filter(isRun).filter((block) => expectedOutput(block) !== '').length;

export const count = shellBlocks.filter(isRun).length + withinText.length;
