// Runs as root of private namespaces; see `run_browser_test`.
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
    describe('A sign-in', () => defineSignIns(stage));
    describe('A failed sign-in', () => defineFailures(stage));
    describe('The front end rejects', () => defineAttacks(stage));
    describe('A page', () => definePages(stage));
});
