/// What an item may tell besides key, value and source.
const nothingKnown = { constraint: undefined, description: undefined, secret: undefined };

/// The effective configuration as last heard of: items as the server lists them, by id.
class Store {
    items = new Map();
    #sorted;

    /// All items, by key.
    get sorted() {
        this.#sorted ??= [...this.items.values()].sort((one, other) => (one.key < other.key ? -1 : 1));
        return this.#sorted;
    }

    /// Items that nobody knew about yet, which is not a change.
    extend(items) {
        for (const item of items) this.#put(item);
    }

    /// Forgets everything, which is not a change either.
    clear() {
        this.items.clear();
        this.#sorted = undefined;
    }

    /// Takes `items` for everything there is, and tells how that differs from before.
    replace(items) {
        const present = new Set(items.map(idOf));
        const gone = [...this.items.values()].filter((item) => !present.has(item.id));
        return this.apply([
            ...gone.map(({ key, href }) => ({ key, href, gone: true })),
            ...items.map((item) => ({ ...nothingKnown, ...item })),
        ]);
    }

    /// Applies the events of a change stream, and tells what they changed.
    apply(events) {
        return events.flatMap((event) => this.#apply(event));
    }

    /// Adds what an event of a change stream did not tell.
    describe(id, { constraint, description, secret }) {
        const item = this.items.get(id);
        if (item !== undefined) Object.assign(item, { constraint, description, secret });
    }

    #apply(item) {
        const id = idOf(item);
        const known = this.items.get(id);
        if (item.gone) {
            if (known === undefined) return [];
            this.items.delete(id);
            this.#sorted = undefined;
            return [{ kind: 'gone', item: known }];
        }
        if (known === undefined) return [{ kind: 'new', item: this.#put(item) }];
        const isSame = sameValue(known.value, item.value) && known.source === item.source;
        Object.assign(known, item);
        return isSame ? [] : [{ kind: 'changed', item: known }];
    }

    #put(item) {
        const id = idOf(item);
        const held = { ...item, id, folded: item.key.toLowerCase() };
        this.items.set(id, held);
        this.#sorted = undefined;
        return held;
    }
}

/// Which items are shown.
class Filter {
    text = '';
    mode = 'contains';
    source = '';
    changedOnly = false;

    get isActive() {
        return this.text !== '' || this.source !== '' || this.changedOnly;
    }

    select(items, changed) {
        const text = this.text.toLowerCase();
        const matches = this.mode === 'begins'
            ? (item) => item.folded.startsWith(text)
            : (item) => item.folded.includes(text);
        return items.filter((item) => matches(item) &&
            (this.source === '' || item.source === this.source) &&
            (!this.changedOnly || changed.has(item.id)));
    }
}
