// Reads the documents of the project.
import {spawnSync} from 'node:child_process';
import {readFileSync} from 'node:fs';
import path from 'node:path';
import {fileURLToPath} from 'node:url';

export const PROJECT = fileURLToPath(new URL('../../..', import.meta.url));

export function read(file) {
    return readFileSync(path.join(PROJECT, file), 'utf8');
}

/** Matching files of the project: tracked ones, and new ones that git does not ignore. */
export function filesMatching(...patterns) {
    const listing = spawnSync('git', ['ls-files', '--cached', '--others', '--exclude-standard', '--', ...patterns],
        {cwd: PROJECT, encoding: 'utf8', stdio: ['ignore', 'pipe', 'inherit']});
    if (listing.status !== 0) {
        throw new Error('not a clone of the repository');
    }
    const files = listing.stdout.split('\n').filter(Boolean);
    if (files.length === 0) {
        throw new Error(`no file matches ${patterns}`);
    }
    return files;
}

export const documents = filesMatching('*.md');

/** The files of the project and their folders. */
export const filesAndFolders = new Set(filesMatching('*').flatMap((file) =>
    file.split('/').map((_, end, parts) => parts.slice(0, end + 1).join('/'))));

/** The fenced blocks of a document: language, text, and the line where the text begins. */
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
        throw new Error(`${document}:${open.line}: the block is not closed`);
    }
    return found;
}

/** The lines of a document; those of fenced blocks are empty. */
export function proseLines(document) {
    let inside = false;
    return read(document).split('\n').map((text, index) => {
        const isFence = text.startsWith('```');
        inside = isFence ? !inside : inside;
        return {document, line: index + 1, text: inside || isFence ? '' : text};
    });
}
