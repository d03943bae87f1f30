// The documents' diagrams are such as Mermaid draws, in a browser, as readers see them.
//
//   node diagrams.mjs NODE_MODULES     where the packages of tests/browser are installed
import assert from 'node:assert/strict';
import {mkdtempSync, rmSync} from 'node:fs';
import {tmpdir} from 'node:os';
import path from 'node:path';
import {test} from 'node:test';

import {startChromium} from '../../e2e/browser/chromium.mjs';
import {blocks, documents} from './documents.mjs';

const [browserModules] = process.argv.slice(2);
const diagrams = documents.flatMap(blocks).filter(({language}) => language === 'mermaid');

test(`each of ${diagrams.length} diagrams is drawn`, async () => {
    assert.ok(diagrams.length > 2);
    const folder = mkdtempSync(path.join(tmpdir(), 'diagrams-'));
    const browser = await startChromium({browserModules, folder});
    try {
        const page = await browser.newPage();
        await page.addScriptTag({path: path.join(browserModules, 'mermaid/dist/mermaid.min.js')});
        for (const {document, line, text} of diagrams) {
            const drawn = await page.evaluate((source) => globalThis.mermaid.render('diagram', source), text)
                .catch((error) => assert.fail(`${document}:${line}: ${error.message}`));
            assert.match(drawn.svg, /^<svg [^]*<\/svg>$/);
        }
    } finally {
        await browser.close();
        rmSync(folder, {recursive: true});
    }
});
