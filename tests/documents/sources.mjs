// The texts that the library, the stand-in and the front end can log or throw, and the keys that they read, as they
// stand in the sources.
import path from 'node:path';

import {asPattern, filesMatching, read} from './documents.mjs';

const FOLDERS = ['azure', 'frontend', 'jwt', 'platform', 'sso', 'utils', 'websphere'];
const LITERAL = /"((?:[^"\\]|\\.)*)"/g;

const sources = filesMatching(...FOLDERS.flatMap((folder) => [`${folder}/*.cpp`, `${folder}/*.h`]))
    .map((file) => ({file, name: path.parse(file).name, text: withoutComments(read(file))}));

function withoutComments(text) {
    return text.replace(/\/\*[^]*?\*\/|(^|[^:"])\/\/.*$/gm, '$1');
}

function literals(text) {
    return [...text.matchAll(LITERAL)].map(([, literal]) => literal);
}

const unique = (list) => [...new Set(list)];

/** The arguments of each call of a function, or what follows each keyword, up to the semicolon. */
function statements(text, beginning) {
    return text.split(beginning).slice(1).map((rest) => rest.slice(0, rest.indexOf(';')));
}

const LEVELS = {LOG_ERR: 'err', LOG_WARNING: 'warning', LOG_INFO: 'info', LOG_AUTH: 'auth'};

function level(priority) {
    const names = priority.match(/LOG_[A-Z]+/g).map((name) => LEVELS[name] ?? name);
    return names.sort((a, b) => (a === 'auth') - (b === 'auth')).join(', ');
}

/**
 * What can be logged: format, level, and the name of the source that stands for "%s:%d". A format that a function is
 * given is each of those texts of the same file that look like one.
 */
export function logFormats() {
    return sources.flatMap(({file, name, text}) => {
        const calls = statements(text, /\bsyslog\(/);
        const handedOver = literals(text).filter((literal) => literal.startsWith('%s:%d ') &&
            !calls.some((call) => call.includes(`"${literal}"`)));
        return calls.flatMap((call) => {
            const [, priority, format] = /^([^,]+),\s*(?:"((?:[^"\\]|\\.)*)"|\w+)/.exec(call);
            const formats = format === undefined ? handedOver : [format];
            if (formats.length === 0) {
                throw new Error(`${file}: no format for syslog(${call})`);
            }
            // One class serves several sources, by whose names it logs.
            const source = call.includes('source_') ? 'SOURCE' : name;
            return formats.map((each) => ({format: each, level: level(priority), source}));
        });
    });
}

/** Texts of exceptions that the sources throw, with their classes; "ALG" stands for the name of an algorithm. */
export function thrownTexts() {
    return sources.filter(({file}) => !file.startsWith('frontend/')).flatMap(({file, text}) =>
        statements(text, /\bthrow\b/).filter((statement) => statement.includes('(')).flatMap((statement) => {
            const [, type, argument] = /^\s*(?:\w+::)*?((?:std::)?\w+)\(([^]*)\)$/.exec(statement) ?? [];
            return textsOf(argument, text).map((thrownText) => ({file, type, text: thrownText}));
        }));
}

function textsOf(argument, file) {
    if (argument === '') {
        return [];
    }
    const [literal] = literals(argument);
    if (literal !== undefined) {
        return [argument.startsWith('"') ? literal : `ALG${literal}`];
    }
    if (/^\w+$/.test(argument)) { // a parameter: what the function is called with
        const before = file.slice(0, file.search(new RegExp(`throw [\\w:]+\\(${argument}\\)`)));
        const name = [...before.matchAll(/^[\w:<>&* ]+?(\w+)\([^;]*?\) \{/gm)].at(-1)[1];
        const texts = statements(file, new RegExp(`\\b${name}\\(`)).flatMap(literals);
        if (texts.length > 0) {
            return texts;
        }
    }
    // Texts of others: the provider's answer, libcurl's.
    if (['Utils::WriteCompactJson(tokenResponse)', 'curl_easy_strerror(result)'].includes(argument)) {
        return [];
    }
    throw new Error(`what does this throw: ${argument}`);
}

/**
 * Tells which formats can have made a line, in which `number` stands for the number of the source's line. What is not
 * fixed in it is a word of capitals, one of `texts`, or the text of an exception.
 */
export function loggedBy(line, number = 'N', texts = []) {
    const text = [...thrownTexts().map((thrown) => thrown.text), ...texts].map(asPattern).join('|');
    return logFormats().filter(({format, source}) => {
        const names = source === 'SOURCE' ? '(?:SOURCE|azuresso|webspheresso|profile)' : source;
        return new RegExp('^' + asPattern(format).replace('%s:%d', `${names}:${number}`)
            .replaceAll('%m', 'SYSTEM(?: TEXT)?').replaceAll('%d', '(?:-?\\d+|ID)').replaceAll('\'%s\'', '\'\\w*\'')
            .replaceAll('\\[%s\\]', '\\[SYSTEM(?: TEXT)?\\]')
            .replaceAll('%s', `(?:[A-Z]+|resuid|resgid|${text})`) + '$').test(line);
    });
}

/** How the reasons begin that the front end gives of its own, without the library. */
export function frontEndReasons() {
    const handedOn = /^(The front end's .*|The provider refused: |unexpected failure)$/;
    const texts = sources.filter(({file}) => /^frontend\/.*\.cpp$/.test(file)).flatMap(({text}) => [
        ...statements(text, /\bthrow\b|\bThrowSystemError\(/).flatMap((statement) => literals(statement).slice(0, 1)),
        ...literals(text).filter((literal) => handedOn.test(literal)),
    ]);
    // Sentences: what begins otherwise is a text of the library's, repeated.
    return unique(texts.filter((text) => /^[A-Z].* |^unexpected/.test(text)).map((text) => text.trim()));
}

/** The keys whose values are booleans; those of all others are strings. */
export function booleanKeys() {
    const constants = Object.fromEntries(sources.flatMap(({text}) =>
        [...text.matchAll(/constexpr char (k\w+)\[\] = "([^"]*)"/g)].map(([, name, value]) => [name, `"${value}"`])));
    return unique(sources.flatMap(({text}) => [...text.matchAll(/ReadMember\(\w+, ("\w+"|k\w+), enable\)/g)])
        .map(([, key]) => (constants[key] ?? key).replaceAll('"', '')));
}

/** The keys of the configuration files, by file. */
export function configurationKeys() {
    const named = (folder, pattern) => unique(sources.filter(({file}) => file.startsWith(folder))
        .flatMap(({text}) => literals(text)).filter((literal) => pattern.test(literal)));
    return {
        'profile.conf': named('sso/', /^sso_[a-z_]+$/),
        'azure.conf': named('azure/', /^azure_[a-z_]+$/),
        'websphere.conf': named('websphere/', /^websphere_[a-z_]+$/),
    };
}
