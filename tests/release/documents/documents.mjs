// The documents of the project, taken apart.
import {spawnSync} from 'node:child_process';
import {readFileSync} from 'node:fs';
import path from 'node:path';
import {fileURLToPath} from 'node:url';

export const PROJECT = fileURLToPath(new URL('../../..', import.meta.url));

export function read(file) {
    return readFileSync(path.join(PROJECT, file), 'utf8');
}

/** A regular expression for this very text. */
export function asPattern(text) {
    return text.replace(/[.*+?^${}()|[\]\\]/g, '\\$&');
}

/** A manual page's text as it is shown: what is written by a name or behind a backslash is the character itself. */
export function unescaped(roff) {
    return roff.replaceAll('\\(aq', '\'').replaceAll('\\(dq', '"').replaceAll('\\e', '\\').replaceAll('\\-', '-')
        .replaceAll('\\&', '');
}

/** Files that are ours and match: those under version control, and new ones that git does not ignore. */
export function filesMatching(...patterns) {
    const listing = spawnSync('git', ['ls-files', '--cached', '--others', '--exclude-standard', '--', ...patterns],
        {cwd: PROJECT, encoding: 'utf8', stdio: ['ignore', 'pipe', 'inherit']});
    if (listing.status !== 0) {
        throw new Error('this is no clone of the repository');
    }
    const files = listing.stdout.split('\n').filter(Boolean);
    if (files.length === 0) {
        throw new Error(`there is no ${patterns}`);
    }
    return files;
}

export const documents = filesMatching('*.md');

/** Our files and their folders: what else lies here lies in no other clone. */
export const filesAndFolders = new Set(filesMatching('*').flatMap((file) =>
    file.split('/').map((_, end, parts) => parts.slice(0, end + 1).join('/'))));

/** Fenced blocks of a document: language, text, and the line that the text begins in. */
export function blocks(document) {
    const found = [];
    let open;
    read(document).split('\n').forEach((line, index) => {
        const fence = /^```(.*)$/.exec(line);
        if (!fence) {
            open?.lines.push(line);
        } else if (open) {
            found.push({document, language: open.language, line: open.line, text: open.lines.join('\n')});
            open = undefined;
        } else {
            open = {language: fence[1], line: index + 2, lines: []};
        }
    });
    if (open) {
        throw new Error(`${document}:${open.line}: the block has no end`);
    }
    return found;
}

/** The document without its fenced blocks, line by line. */
export function proseLines(document) {
    let inside = false;
    return read(document).split('\n').map((text, index) => {
        const isFence = text.startsWith('```');
        inside = isFence ? !inside : inside;
        return {document, line: index + 1, text: inside || isFence ? '' : text};
    });
}

/** What stands in backticks in a text. */
export function codeSpans(text) {
    return [...text.matchAll(/`([^`]+)`/g)].map(([, span]) => span);
}

/** What stands in double quotation marks in a document's prose: a line may end within them, a paragraph may not. */
export function quotations(document) {
    const prose = proseLines(document).map(({text}) => text.replace(/`[^`]*`/g, '``')).join('\n');
    return [...prose.matchAll(/"((?:[^"\n]|\n(?!\n))*)"/g)].map(({index, 1: text}) =>
        ({document, line: prose.slice(0, index).split('\n').length, text: text.replace(/\s+/g, ' ')}));
}

/** The rows of a document's tables, each with the heading that it stands under and its table's header. */
export function tableRows(document) {
    const rows = [];
    let heading = '';
    let header;
    for (const {line, text} of proseLines(document)) {
        heading = /^#+ (.*)/.exec(text)?.[1] ?? heading;
        if (!text.startsWith('|')) {
            header = undefined;
            continue;
        }
        const cells = text.replace(/^\|\s*|\s*\|\s*$/g, '').split(/\s*(?<!\\)\|\s*/);
        if (header === undefined) {
            header = cells;
        } else if (!/^[-| :]+$/.test(text)) {
            rows.push({document, line, heading, header, cells});
        }
    }
    return rows;
}

/** What is in one list and not in the other, and what is there twice: all empty where documents and sources agree. */
export function differences({told, real}) {
    return {
        notTold: real.filter((item) => !told.includes(item)),
        notThere: told.filter((item) => !real.includes(item)),
        toldTwice: told.filter((item, index) => told.indexOf(item) !== index),
    };
}

export const NO_DIFFERENCES = {notTold: [], notThere: [], toldTwice: []};
