// A minimal browser: cookies, redirects, forms, and TLS with the given authority.
import https from 'node:https';

const PATIENCE = 30_000;
const MOST_REDIRECTS = 10;

function unescapeHtml(text) {
    const characters = {amp: '&', lt: '<', gt: '>', quot: '"', '#39': "'"};
    return text.replace(/&(amp|lt|gt|quot|#39);/g, (whole, name) => characters[name]);
}

function attributes(tag) {
    const pairs = [...tag.matchAll(/([\w-]+)="([^"]*)"/g)].map(([, name, value]) => [name, unescapeHtml(value)]);
    return Object.fromEntries(pairs);
}

function parseCookie(header) {
    const [pair, ...rest] = header.split(/; */);
    const [name, ...value] = pair.split('=');
    const options = Object.fromEntries(rest.map((item) => item.split('=')).map(([key, text]) => [key.toLowerCase(), text]));
    return {name, value: value.join('='), path: options.path ?? '/', options};
}

function hasEnded({options}) {
    return options['max-age'] ? Number(options['max-age']) <= 0 : Date.parse(options.expires) <= Date.now();
}

class CookieJar {
    #cookies = [];

    store(url, header) {
        const cookie = {host: url.hostname, ...parseCookie(header)};
        const {name, path, options} = cookie;
        if (name.startsWith('__Host-') && !('secure' in options && path === '/' && !('domain' in options))) {
            throw new Error(`a browser rejects the cookie ${name}`);
        }
        this.#cookies = this.#cookies.filter(
            (other) => other.host !== cookie.host || other.name !== name || other.path !== path);
        if (!hasEnded(cookie)) {
            this.#cookies.push(cookie);
        }
    }

    for(url) {
        const covers = (path) => url.pathname === path || url.pathname.startsWith(path.replace(/\/?$/, '/'));
        return this.#cookies.filter((cookie) => cookie.host === url.hostname && covers(cookie.path));
    }
}

/** An answer. `heading` is the heading of its page, `next` the address of a redirect. */
class Answer {
    constructor(url, response, text) {
        this.url = url;
        this.status = response.statusCode;
        this.headers = response.headers;
        this.text = text;
        this.heading = unescapeHtml(/<h1[^>]*>(.*?)<\/h1>/s.exec(text)?.[1] ?? '');
        const next = response.headers.location ?? /^0; url=(.*)/.exec(response.headers.refresh ?? '')?.[1];
        this.next = next && new URL(next, url);
    }

    get hasForm() {
        return /<form\b/.test(this.text);
    }

    get form() {
        const [whole, tag] = /(<form\b[^>]*>).*<\/form>/s.exec(this.text);
        const inputs = [...whole.matchAll(/<input\b[^>]*>/g)].map(([input]) => attributes(input));
        const filled = inputs.filter(({name, value}) => name && value !== undefined);
        return {
            action: new URL(attributes(tag).action, this.url),
            values: Object.fromEntries(filled.map(({name, value}) => [name, value])),
        };
    }

    link(text) {
        const found = [...this.text.matchAll(/(<a\b[^>]*>)(.*?)<\/a>/gs)].find(([, , content]) => content === text);
        return found && new URL(attributes(found[1]).href, this.url);
    }
}

export class Browser {
    #authority;
    #report;
    cookies = new CookieJar();
    history = [];

    /** `report` is called for each exchange: method, address, names of form fields, answer. */
    constructor(authority, report) {
        this.#authority = authority;
        this.#report = report;
    }

    /** Sends a request. Does not follow redirects. */
    request(method, url, form) {
        const sent = form && {
            type: 'application/x-www-form-urlencoded', text: new URLSearchParams(form).toString(),
        };
        return this.#send(method, url, sent, Object.keys(form ?? {}));
    }

    /** Sends JSON, as the script of a page does. */
    requestWithJson(method, url, values) {
        return this.#send(method, url, {type: 'application/json', text: JSON.stringify(values)}, Object.keys(values));
    }

    async #send(method, url, body, fields) {
        const headers = {Cookie: this.cookies.for(url).map(({name, value}) => `${name}=${value}`).join('; ')};
        if (body) {
            Object.assign(headers, {'Content-Type': body.type, Origin: url.origin});
        }
        const answer = await this.#exchange(method, url, headers, body?.text);
        for (const cookie of answer.headers['set-cookie'] ?? []) {
            this.cookies.store(url, cookie);
        }
        this.history.push(answer);
        this.#report({method, url, fields, answer});
        return answer;
    }

    /** Opens an address and follows redirects up to a page or an address that `stop` accepts. */
    async open(url, stop = () => false) {
        return this.#follow(await this.request('GET', new URL(url)), stop);
    }

    async submit(page, values, stop = () => false) {
        const {action, values: filled} = page.form;
        return this.#follow(await this.request('POST', action, {...filled, ...values}), stop);
    }

    async #follow(answer, stop) {
        for (let count = 0; answer.next && !stop(answer.next); ++count) {
            if (count === MOST_REDIRECTS) {
                throw new Error('too many redirects');
            }
            answer = await this.request('GET', answer.next);
        }
        return answer;
    }

    #exchange(method, url, headers, body) {
        return new Promise((resolve, reject) => {
            const options = {method, headers, ca: this.#authority, family: 4, agent: false, timeout: PATIENCE};
            const request = https.request(url, options, async (response) => {
                try {
                    let text = '';
                    for await (const chunk of response.setEncoding('utf8')) {
                        text += chunk;
                    }
                    resolve(new Answer(url, response, text));
                } catch (failure) {
                    reject(failure);
                }
            });
            request.on('timeout', () => request.destroy(new Error(`no answer from ${url.origin}`)));
            request.on('error', reject);
            request.end(body);
        });
    }
}
