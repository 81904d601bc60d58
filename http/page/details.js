/// What is known of one key, in a panel beside the table: all layers, history, and where writes are
/// allowed the form and the ways to unset it.
class Details {
    #api;
    #rights;
    #panel = byId('details');
    #item;
    #form;
    #onClose;
    #historyLimit;

    /// `rights` holds `mayWrite` and `sources`, as the server last told.
    constructor(api, rights, onClose) {
        this.#api = api;
        this.#rights = rights;
        this.#onClose = onClose;
        this.#panel.addEventListener('keydown', (event) => {
            if (event.key === 'Escape') this.close();
        });
        byId('unset-form').addEventListener('submit', (event) => this.#unset(event));
        byId('unset-keep').addEventListener('click', () => byId('unset-dialog').close());
    }

    get openedId() {
        return this.#item?.id;
    }

    get #writable() {
        return this.#rights.sources.filter((source) => !source.readOnly);
    }

    /// Shows `item` and moves the focus there.
    open(item) {
        this.#item = item;
        this.#historyLimit = 20;
        this.#frame(item.key === '' ? '(empty key)' : item.key,
            element('p', { id: 'details-about', class: 'about' }),
            element('div', { id: 'details-setting' }),
            this.#section('Layers', 'details-layers'),
            element('div', { id: 'details-form' }, ...this.#formSection(item)),
            this.#section('History', 'details-history'));
        this.refresh();
    }

    /// Offers what the rights allow now.
    renewRights() {
        if (this.#item === undefined) return;
        byId('details-form').replaceChildren(...this.#formSection(this.#item));
        this.refresh();
    }

    /// Shows the form for a key that does not exist yet.
    openNew() {
        this.#item = undefined;
        this.#form = new SetForm(this.#api, undefined, this.#writable, () => {});
        this.#frame('New key', this.#form.node);
        this.#form.first.focus();
    }

    close() {
        if (this.#panel.hidden) return;
        const id = this.openedId;
        this.#item = undefined;
        this.#panel.hidden = true;
        this.#onClose(id);
    }

    /// Reads layers and history again; what is being entered stays.
    async refresh() {
        const item = this.#item;
        if (item === undefined) return;
        await Promise.all([
            this.#load(item, 'details-layers', `/config/${encodedKey(item)}`, (found) => this.#layers(found)),
            this.#load(item, 'details-history', `/history?key=${encodedKey(item)}&limit=${this.#historyLimit}`, (found) => this.#history(found)),
            this.#load(item, 'details-setting', '/settings', (found) => this.#errors(found)),
        ]);
    }

    /// Lets the form know that the value is another one now.
    renewForm() {
        this.#form?.renew();
    }

    #frame(title, ...content) {
        const heading = element('h2', { id: 'details-title', tabindex: '-1' }, title);
        const close = element('button', { type: 'button', class: 'close', 'aria-label': 'Close details', onclick: () => this.close() }, '×');
        this.#panel.replaceChildren(element('div', { class: 'title' }, heading, close), ...content);
        this.#panel.hidden = false;
        this.#panel.scrollTop = 0;
        heading.focus();
    }

    #section(title, id) {
        return element('section', { 'aria-label': title }, element('h3', {}, title),
            element('div', { id }, element('p', { class: 'muted' }, 'Loading')));
    }

    #formSection(item) {
        this.#form = undefined;
        if (!this.#rights.mayWrite) return [];
        if (isInexact(item)) {
            return [element('p', { class: 'muted' }, 'This key holds bytes that are no UTF-8 and cannot be set here.')];
        }
        this.#form = new SetForm(this.#api, item, this.#writable, () => this.refresh());
        return [element('section', { 'aria-label': 'Set a value' }, element('h3', {}, 'Set a value'), this.#form.node)];
    }

    async #load(item, id, path, show) {
        let content;
        try {
            content = show(await this.#api.json(path));
        } catch (problem) {
            content = [element('p', { class: problem.status === 404 ? 'muted' : 'problem' }, problem.message)];
        }
        if (this.#item === item) replaceContent(byId(id), content, byId('details-title'));
    }

    #layers({ layers, constraint, description, secret }) {
        byId('details-about').replaceChildren(...[
            description && element('span', {}, description),
            constraint && element('span', { class: 'constraint' }, constraint),
            secret && element('span', { class: 'secret' }, 'secret'),
        ].filter(Boolean));
        const rows = layers.map((layer, index) => element('li', { class: index === 0 ? 'effective' : 'hidden-layer' },
            element('div', { class: 'layer' },
                element('strong', {}, layer.source), ' ',
                element('span', { class: 'muted' }, index === 0 ? `${layer.value.type}, in effect` : layer.value.type),
                ...this.#unsetButton(layer)),
            wholeValue(layer.value)));
        return [element('ol', { class: 'layers' }, ...rows)];
    }

    // A process that declared the key may have refused its value, and goes by the last good one.
    #errors({ settings }) {
        return settings.filter(({ key, error }) => error && key === this.#item?.key)
            .map(({ error }) => element('p', { class: 'problem' }, `Not taken by the process: ${error}`));
    }

    #unsetButton({ source: name }) {
        const source = this.#writable.find((candidate) => candidate.name === name);
        if (!this.#rights.mayWrite || !source?.canForget || isInexact(this.#item)) return [];
        return [element('button', { type: 'button', class: 'small', 'aria-label': `Unset in ${name}`, onclick: () => this.#askToUnset(name) }, 'Unset')];
    }

    #askToUnset(source) {
        byId('unset-text').textContent = `${this.#item.key} in ${source}. What a layer below holds takes effect.`;
        byId('unset-problem').textContent = '';
        byId('unset-form').dataset.source = source;
        byId('unset-dialog').showModal();
    }

    async #unset(event) {
        event.preventDefault();
        const { source } = event.target.dataset;
        try {
            await this.#api.change([{ key: this.#item.key, unset: true, source }]);
            byId('unset-dialog').close();
            byId('details-title')?.focus();
            await this.refresh();
        } catch (problem) {
            byId('unset-problem').textContent = problem.message;
        }
    }

    #history({ kept, changes }) {
        if (!kept) return [element('p', { class: 'muted' }, 'No layer of this key keeps a history.')];
        if (changes.length === 0) return [element('p', { class: 'muted' }, 'No change yet.')];
        const entries = changes.map((change) => element('li', {},
            element('p', { class: 'muted' }, timeElement(change.when), ` ${change.action} in ${change.source}`,
                change.author ? ` by ${change.author}` : ''),
            element('p', { class: 'step' }, this.#side(change.before), ' → ', this.#side(change.after))));
        const more = changes.length < this.#historyLimit ? [] : [element('button', {
            type: 'button', class: 'small', onclick: () => {
                this.#historyLimit *= 5;
                this.refresh();
            },
        }, 'Earlier changes')];
        return [element('ol', { class: 'history' }, ...entries), ...more];
    }

    #side(value) {
        return value === undefined ? element('span', { class: 'muted' }, 'no value') : valueElement(value);
    }
}
