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

/** The class of each exception that a source throws, and what its constructor is given. */
function thrownBy({file, text}) {
    return statements(text, /\bthrow\b/).filter((statement) => statement !== '').map((statement) => {
        const [, type, argument] = /^ (?:\w+::)*?((?:std::)?\w+)\(([^]*)\)$/.exec(statement) ?? [];
        if (type === undefined) { // an object that was made before, or in braces: its text would be in no list
            throw new Error(`${file}: write "throw Type(text)" in the place of "throw${statement}"`);
        }
        return {file, type, argument, source: text};
    });
}

/** What would log or throw without being found here. */
export function unseenForms() {
    const forms = /\b(?:syslog(?!\(|\.h>)|vsyslog|perror|stderr|cerr|clog|\w+_nested|rethrow_\w+|\w+_exception_ptr)\b/g;
    return sources.flatMap(({file, text}) => [...text.matchAll(forms)].map(([form]) => ({file, form})));
}

const LEVELS = {LOG_ERR: 'err', LOG_WARNING: 'warning', LOG_INFO: 'info', LOG_AUTH: 'auth'};

/** The level of a priority, and behind it the facility where that is not the program's own. */
export function level(priority) {
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
            return formats.map((each) => ({file, format: each, level: level(priority), source}));
        });
    });
}

/** Texts of exceptions that the sources throw, with their classes; "ALG" stands for the name of an algorithm. */
export function thrownTexts() {
    return sources.filter(({file}) => !file.startsWith('frontend/')).flatMap(thrownBy).flatMap((thrown) =>
        textsOf(thrown).map((text) => ({file: thrown.file, type: thrown.type, text})));
}

function textsOf({file, type, argument, source}) {
    if (type === 'std::bad_alloc') {
        return [];
    }
    const [, algorithm, literal] = /^(name \+ )?"((?:[^"\\]|\\.)*)"$/.exec(argument) ?? [];
    if (literal !== undefined) {
        return [algorithm === undefined ? literal : `ALG${literal}`];
    }
    if (/^\w+$/.test(argument)) { // a parameter: what the function is called with
        const before = source.slice(0, source.search(new RegExp(`throw [\\w:]+\\(${argument}\\)`)));
        const name = [...before.matchAll(/^[\w:<>&* ]+?(\w+)\([^;]*?\) \{/gm)].at(-1)[1];
        const texts = statements(source, new RegExp(`\\b${name}\\(`)).flatMap(literals);
        if (texts.length > 0) {
            return texts;
        }
    }
    // Texts of others: the provider's answer, libcurl's.
    if (['Utils::WriteCompactJson(tokenResponse)', 'curl_easy_strerror(result)'].includes(argument)) {
        return [];
    }
    throw new Error(`${file}: what does this throw: ${type}(${argument})`);
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
    const texts = sources.filter(({file}) => /^frontend\/.*\.cpp$/.test(file)).flatMap((source) => [
        ...[...thrownBy(source).map(({argument}) => argument), ...statements(source.text, /\bThrowSystemError\(/)]
            .flatMap((statement) => literals(statement).slice(0, 1)),
        ...literals(source.text).filter((literal) => handedOn.test(literal)),
    ]);
    // Sentences: what begins otherwise is a text of the library's, repeated.
    return unique(texts.filter((text) => /^[A-Z].* |^unexpected/.test(text)).map((text) => text.trim()));
}

/** The constants of a source that are texts. */
function textConstants(text) {
    return Object.fromEntries([...text.matchAll(/constexpr char (k\w+)\[\] = ("[^"]*")/g)]
        .map(([, name, value]) => [name, value]));
}

const textOf = (name) => sources.find(({file}) => file === name).text;

/** Where a source loads a document from, and the members that it reads of it, each with the field that receives it. */
function membersRead({file, text}) {
    const [, location, loaded] = /LoadJsonFile(?:AsRoot\(SOURCE_LINE, |\()(k\w+), (\w+)\)/.exec(text);
    const single = [...text.matchAll(new RegExp(`ReadMember\\(${loaded}, ([^,]+), (\\w+)\\)`, 'g'))];
    const lists = statements(text, `ReadMembers(${loaded}, `);
    const uses = text.replace(LITERAL, '').match(new RegExp(`\\b${loaded}\\b`, 'g'));
    if (uses.length !== 2 + single.length + lists.length) { // it is declared, loaded, and read in these two ways
        throw new Error(`${file}: members of "${loaded}" are read in another way`);
    }
    const constants = {...textConstants(textOf('sso/names.h')), ...textConstants(text)};
    const members = [...single, ...lists.flatMap((list) => [...list.matchAll(/\{([^,{}]+), (\w+)\}/g)])];
    return {
        name: path.basename(JSON.parse(constants[location])),
        members: members.map(([, name, field]) => ({key: JSON.parse(constants[name] ?? name), field})),
    };
}

const TYPES = {bool: 'boolean', string: 'string'};

/** The keys of the configuration files, by file, with types and defaults: those of the fields that receive them. */
export function configurationKeys() {
    const keys = {};
    const readers = sources.filter(({file, text}) => !file.startsWith('utils/') && text.includes('LoadJsonFile'));
    for (const source of readers) {
        const {name, members} = membersRead(source);
        keys[name] ??= [];
        for (const {key, field} of members.filter((member) => !keys[name].some((known) => known.key === member.key))) {
            const declaration = new RegExp(`(?:std::)?(bool|string) ${field}(?: = (\\w+))?;`);
            const [, type, byDefault] = declaration.exec(source.text + textOf('sso/sso.h'));
            keys[name].push({key, type: TYPES[type], byDefault: byDefault ?? 'empty'});
        }
    }
    return keys;
}

/** The comments of the headers that programs include, of which the reference is made: each as one line. */
export const referenceComments = ['sso/sso.h', 'jwt/jwt.h'].flatMap((file) =>
    [...read(file).matchAll(/\/\*\*([^]*?)\*\/|\/\/(?:\/<)?(.*)/g)].map(([, block, line]) =>
        ({file, text: (block ?? line).replace(/^ *\*/gm, '').replace(/\s+/g, ' ').trim()})));

/** The files and folders of the appliance that the sources name, and those that the front end makes in its own. */
export function appliancePaths() {
    const named = sources.flatMap(({text}) => literals(text)).filter((literal) => literal.startsWith('/usr/tavo/'));
    const parts = /OpenTrusted\(system, "(\w+)"\), "(\w+)"\), "(\w+)"\)/.exec(textOf('frontend/private_folder.cpp'));
    const folder = ['/usr', ...parts.slice(1)].join('/');
    const made = sources.filter(({file}) => file.startsWith('frontend/')).map(({text}) => textConstants(text).kFolder)
        .filter(Boolean).map((name) => `${folder}/${JSON.parse(name)}`);
    return [...named, ...made];
}
