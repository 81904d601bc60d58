/// A request that the server refused, in its own words.
class Problem extends Error {
    constructor(status, text) {
        super(text);
        this.status = status;
    }
}

async function problemOf(response) {
    const fallback = `${response.status} ${response.statusText}`.trim();
    try {
        const { title, detail } = await response.json();
        return new Problem(response.status, detail || title || fallback);
    } catch {
        return new Problem(response.status, fallback);
    }
}

/// The server that this page came from. `askForToken(refused)` gives a token when one is needed.
class Api {
    #token = sessionStorage.getItem('token') ?? '';
    #asking;
    #askForToken;

    constructor(askForToken) {
        this.#askForToken = askForToken;
    }

    /// The answer, whatever its status but 401, which asks for a token and tries again.
    async fetch(path, options = {}) {
        for (;;) {
            const token = this.#token;
            const headers = { ...options.headers };
            if (token !== '') headers.Authorization = `Bearer ${token}`;
            const response = await fetch(path, { ...options, headers, cache: 'no-store' });
            if (response.status !== 401) return response;
            if (token === this.#token) await this.#renewToken();
        }
    }

    async json(path, options) {
        const response = await this.fetch(path, options);
        if (!response.ok) throw await problemOf(response);
        return response.json();
    }

    /// Applies changes to the store together.
    change(changes, { dryRun = false } = {}) {
        return this.json(dryRun ? '/config?dry-run' : '/config', {
            method: 'PATCH',
            headers: { 'Content-Type': 'application/json' },
            body: JSON.stringify({ changes }),
        });
    }

    async #renewToken() {
        this.#asking ??= this.#askForToken(this.#token !== '');
        this.#token = await this.#asking;
        this.#asking = undefined;
        sessionStorage.setItem('token', this.#token);
    }
}

/// The data of the events in a body of text/event-stream; `onBytes` is called for whatever comes,
/// comments included.
async function* eventsOf(body, onBytes) {
    const reader = body.pipeThrough(new TextDecoderStream()).getReader();
    let rest = '';
    let data = [];
    for (;;) {
        const { value, done } = await reader.read();
        if (done) return;
        onBytes();
        const lines = (rest + value).split('\n');
        rest = lines.pop();
        for (const line of lines) {
            if (line.startsWith('data:')) data.push(line.slice('data:'.length));
            if (line !== '' || data.length === 0) continue;
            yield JSON.parse(data.join('\n'));
            data = [];
        }
    }
}

/// Keys that hold bytes which are no UTF-8 are told apart by their exact way only.
const isInexact = (item) => item.href !== undefined && item.key.includes('\ufffd');
const idOf = (item) => (isInexact(item) ? item.href : item.key);

/// The key as it stands in a path or a query.
const encodedKey = (item) =>
    isInexact(item) ? item.href.replace(/^\/config\//, '') : encodeURIComponent(item.key);
