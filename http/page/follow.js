const pageSize = 2000;
const longestSilence = 40_000;  // the server says something every 15 seconds
const pauses = [500, 1000, 2000, 4000, 8000, 15_000, 30_000];

/// Keeps a store equal to the server's for as long as the page is open. Listens before it reads, so
/// that no change falls between. Tells `onState('live' | 'lost', {pause, problem})`,
/// `onProgress()` while it reads for the first time, and `onDifferences(list, isResync)`.
class Follower {
    #api;
    #store;
    #tell;
    #failures = 0;
    #isFirst = true;
    #wake = () => {};

    constructor(api, store, tell) {
        this.#api = api;
        this.#store = store;
        this.#tell = tell;
    }

    async run() {
        for (;;) {
            const problem = await this.#followOnce();
            const pause = pauses[Math.min(this.#failures, pauses.length - 1)];
            this.#failures += 1;
            this.#tell.onState('lost', { pause, problem });
            await this.#sleep(pause);
        }
    }

    /// Ends the pause before the next attempt.
    retry() {
        this.#wake();
    }

    #sleep(pause) {
        return new Promise((resolve) => {
            const timer = setTimeout(resolve, pause);
            this.#wake = () => {
                clearTimeout(timer);
                resolve();
            };
        });
    }

    // Follows until the connection is lost, and gives the reason.
    async #followOnce() {
        const ending = new AbortController();
        const patience = new Patience(longestSilence, () => ending.abort(new Error('The server has fallen silent')));
        try {
            const response = await this.#api.fetch('/changes?prefix=', { signal: ending.signal });
            if (!response.ok) throw await problemOf(response);
            const backlog = new Backlog((events) => this.#tell.onDifferences(this.#store.apply(events), false));
            await Promise.all([
                this.#listen(response.body, backlog, patience),
                this.#read(ending.signal).then(() => {
                    this.#failures = 0;
                    this.#tell.onState('live', {});
                    backlog.open();
                }),
            ]);
        } catch (problem) {
            return ending.signal.reason ?? problem;
        } finally {
            patience.end();
            ending.abort();
        }
    }

    async #listen(body, backlog, patience) {
        for await (const event of eventsOf(body, () => patience.renew())) backlog.add(event);
        throw new Error('The server has ended the connection');
    }

    async #read(signal) {
        const all = [];
        if (this.#isFirst) this.#store.clear();
        for (let cursor = ''; cursor !== undefined;) {
            const page = await this.#api.json(
                `/config?limit=${pageSize}${cursor === '' ? '' : `&cursor=${cursor}`}`, { signal });
            cursor = page.next;
            if (!this.#isFirst) {
                all.push(...page.items);
                continue;
            }
            this.#store.extend(page.items);
            this.#tell.onProgress();
        }
        if (!this.#isFirst) this.#tell.onDifferences(this.#store.replace(all), true);
        this.#isFirst = false;
    }
}

/// Runs out, by calling `action`, when it was not renewed for a time.
class Patience {
    #timer;
    #time;
    #action;

    constructor(time, action) {
        this.#time = time;
        this.#action = action;
        this.renew();
    }

    renew() {
        clearTimeout(this.#timer);
        this.#timer = setTimeout(this.#action, this.#time);
    }

    end() {
        clearTimeout(this.#timer);
    }
}

/// Holds events back until it is open, and hands them on in batches then.
class Backlog {
    #events = [];
    #isOpen = false;
    #flush;

    constructor(take) {
        this.#flush = batched(30, () => {
            const events = this.#events;
            this.#events = [];
            take(events);
        });
    }

    add(event) {
        this.#events.push(event);
        if (this.#isOpen) this.#flush();
    }

    open() {
        this.#isOpen = true;
        if (this.#events.length > 0) this.#flush();
    }
}
