// Runs as root of private namespaces; see `run`.
import {after, beforeEach, describe} from 'node:test';

import {defineAttacks} from './refusals.mjs';
import {defineFailures} from './failures.mjs';
import {definePages} from './pages.mjs';
import {defineSignIns} from './sign_ins.mjs';
import {startStage} from './browser_stage.mjs';

const [webroot, siteModules, browserModules, pictures] = process.argv.slice(2);
const stage = await startStage({webroot, siteModules, browserModules, pictures});

describe('The front end in a browser', () => {
    beforeEach(() => stage.reset());
    after(() => stage.stop());
    describe('Signing in and out', () => defineSignIns(stage));
    describe('A sign-in that fails', () => defineFailures(stage));
    describe('What is refused', () => defineAttacks(stage));
    describe('Every page', () => definePages(stage));
});
