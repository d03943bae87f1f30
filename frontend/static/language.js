// Chooses the language of the relay page.

const LANGUAGES = ['en', 'de', 'fr', 'es', 'ja', 'zh'];

/** Returns the first of a browser's languages that has messages; English if there is none. */
export function preferredLanguage(languages) {
    return languages.map((tag) => tag.split('-')[0].toLowerCase()).find((each) => LANGUAGES.includes(each)) ?? 'en';
}
