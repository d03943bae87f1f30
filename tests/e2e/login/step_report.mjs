// Prints each step on one line. Shows only names of parameters, because values may be secrets, codes or tokens.

const names = (list) => (list.length > 0 ? `(${[...new Set(list)].join(', ')})` : '');
const withNames = (text, list) => [text, names(list)].filter(Boolean).join(' ');
const column = (text, width) => text.padEnd(width);

export class Report {
    #sites = new Map();

    nameSite(origin, name) {
        this.#sites.set(origin, name);
    }

    title(text) {
        console.log(`\n${text}`);
    }

    fact(text) {
        console.log(`  ${text}`);
    }

    browserAsked({method, url, fields, answer}) {
        this.#line('browser', this.#site(url), withNames(`${method} ${this.#place(url)}`, fields), this.#outcome(answer));
    }

    applianceAsked({method, path, parameters, status}) {
        this.#line('appliance', 'provider', withNames(`${method} ${path}`, parameters), String(status));
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

    // The provider's paths contain the id of the login.
    #place(url) {
        const path = url.pathname.replace(/^(\/(?:auth|sign-in))\/.*/, '$1/...');
        const place = withNames(path, [...url.searchParams.keys()]);
        const fragment = new URLSearchParams(url.hash.slice(1));
        return url.hash ? `${place} #${names([...fragment.keys()])}` : place;
    }

    #outcome({status, heading, headers, next}) {
        if (next) {
            return `${status}, redirect to ${this.#site(next)} ${this.#place(next)}`;
        }
        return heading ? `${status}, "${heading}"` : `${status}, ${headers['content-type']}`;
    }
}
