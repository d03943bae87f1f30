// Rules for JavaScript. tools/install-npm-packages installs the packages of ESLint into build/eslint.
import {createRequire} from 'node:module';
import {pathToFileURL} from 'node:url';

const {resolve} = createRequire(new URL('build/eslint/package.json', import.meta.url));
const load = async (name) => (await import(pathToFileURL(resolve(name)))).default;
const js = await load('@eslint/js');
const stylistic = await load('@stylistic/eslint-plugin');
const globals = await load('globals');

export default [
    {ignores: ['build/']},
    js.configs.recommended,
    stylistic.configs.customize({
        arrowParens: true,
        blockSpacing: false,
        braceStyle: '1tbs',
        indent: 4,
        semi: true,
    }),
    {
        rules: {
            '@stylistic/max-len': ['error', {code: 120, ignoreTemplateLiterals: true, ignoreStrings: true}],
            '@stylistic/object-curly-spacing': ['error', 'never'],
            '@stylistic/operator-linebreak': ['error', 'after', {overrides: {'?': 'before', ':': 'before'}}],
            '@stylistic/quote-props': ['error', 'as-needed'],
            '@stylistic/quotes': ['error', 'single', {allowTemplateLiterals: 'always', avoidEscape: true}],
            curly: 'error',
            eqeqeq: 'error',
            'no-implicit-globals': 'error',
            'no-shadow': 'error',
            'no-throw-literal': 'error',
            'no-unused-expressions': 'error',
            'no-var': 'error',
            'prefer-const': 'error',
        },
    },
    {files: ['**/*.mjs'], languageOptions: {globals: globals.node}},
    // The browser tests run functions in the page.
    {files: ['frontend/static/*.js', 'tests/e2e/browser/*.mjs'], languageOptions: {globals: globals.browser}},
];
