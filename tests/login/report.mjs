// What happens, one readable line each. Names of parameters only: values may be secrets, codes and tokens.

const names = (list) => (list.length > 0 ? ` (${[...new Set(list)].join(', ')})` : '');
const column = (text, width) => text.padEnd(width);

export class Report {
    #sites;

    /** `sites` tells the names of origins. */
    constructor(sites) {
        this.#sites = sites;
    }

    title(text) {
        console.log(`\n${text}`);
    }

    fact(text) {
        console.log(`  ${text}`);
    }

    browserAsked({method, url, fields, answer}) {
        this.#line('browser', this.#site(url), `${method} ${this.#place(url)}${names(fields)}`, this.#outcome(answer));
    }

    applianceAsked({method, path, parameters, status}) {
        this.#line('appliance', 'provider', `${method} ${path}${names(parameters)}`, String(status));
    }

    logged(line) {
        this.#line('appliance', 'log', line);
    }

    #line(from, to, what, outcome) {
        console.log(`  ${column(from, 9)} -> ${column(to, 9)}  ${what}${outcome ? `: ${outcome}` : ''}`);
    }

    #site(url) {
        return this.#sites.get(url.origin) ?? 'elsewhere';
    }

    // The provider's paths name the one login that they belong to: that name is nobody's business.
    #place(url) {
        const path = url.pathname.replace(/^(\/(?:auth|sign-in))\/.*/, '$1/...');
        const fragment = new URLSearchParams(url.hash.slice(1));
        return path + names([...url.searchParams.keys()]) + (url.hash && ` #${names([...fragment.keys()])}`);
    }

    #outcome({status, heading, headers, next}) {
        if (next) {
            return `${status}, on to ${this.#site(next)} ${this.#place(next)}`;
        }
        return heading ? `${status}, "${heading}"` : `${status}, ${headers['content-type']}`;
    }
}
