/// The form that sets a key: type, value and layer, checked here as far as types go, and by the
/// server for everything else. `onSet(change)` is called after the store took a change.
class SetForm {
    #api;
    #onSet;
    #item;
    #sources;
    #node;
    #key;
    #type;
    #asJson;
    #field;
    #source;
    #shown;  // the text of the value that the field began with
    #hint = element('p', { id: 'value-hint', class: 'muted hint' });
    #changed = element('p', { class: 'hint', role: 'status' });
    #problem = element('p', { id: 'value-problem', class: 'problem', role: 'alert' });
    #done = element('p', { class: 'done', role: 'status' });

    /// `item` is what to change; nothing for a new key. `sources` are the layers that take writes.
    constructor(api, item, sources, onSet) {
        this.#api = api;
        this.#item = item;
        this.#sources = sources;
        this.#onSet = onSet;
        this.#build();
    }

    get node() {
        return this.#node;
    }

    /// What to focus first.
    get first() {
        return this.#key ?? this.#field;
    }

    get #isSecret() {
        return this.#item?.secret === true;
    }

    get #held() {
        return this.#item?.value ?? { type: 'string', value: '' };
    }

    /// Shows the value that the item has now, unless another one is being entered: then it is told.
    renew() {
        if (this.#item === undefined || this.#isSecret) return;
        const isEntered = this.#type.value === this.#held.type &&
            this.#field.value === writeValue(this.#held, this.#asJson.checked);
        if (isEntered) return;
        if (this.#field.value !== this.#shown) {
            this.#changed.textContent = `It has changed meanwhile: ${showContent(this.#held.value) || 'empty text'}`;
            return;
        }
        this.#type.value = this.#held.type;
        this.#showHeld();
    }

    #showHeld() {
        this.#asJson.checked = !this.#isSecret && needsJson(this.#held);
        this.#showField(this.#isSecret ? '' : writeValue(this.#held, this.#asJson.checked));
        this.#shown = this.#field.value;
        this.#changed.textContent = '';
    }

    #build() {
        const held = this.#held;
        if (this.#item === undefined) {
            this.#key = element('input', { id: 'set-key', autocomplete: 'off', spellcheck: 'false', required: true });
            this.#key.addEventListener('input', () => this.#offerSources());
        }
        this.#type = element('select', { id: 'set-type', onchange: () => this.#changeType() },
            ...typeNames.map((name) => element('option', { selected: name === held.type }, name)));
        this.#asJson = element('input', { type: 'checkbox', id: 'set-json', onchange: () => this.#changeForm() });
        this.#source = element('select', { id: 'set-source' });
        this.#field = element('input');
        this.#node = element('form', { class: 'set', onsubmit: (event) => this.#submit(event) },
            ...(this.#key ? [labelled('Key', this.#key)] : []),
            labelled('Type', this.#type),
            labelled('Layer', this.#source),
            element('div', { class: 'wide' },
                element('label', { for: 'set-value' }, 'Value'), this.#field,
                element('label', { class: 'check' }, this.#asJson, ' as JSON'), this.#hint, this.#changed, this.#problem),
            element('p', { class: 'actions wide' },
                element('button', { class: 'primary', value: 'set' }, 'Set'), ' ',
                element('button', { value: 'check' }, 'Only check')),
            this.#done);
        this.#showHeld();
        this.#offerSources();
    }

    #showField(text) {
        const type = this.#type.value;
        const asJson = this.#asJson.checked;
        const common = { id: 'set-value', 'aria-describedby': 'value-hint value-problem', spellcheck: 'false' };
        const isLong = asJson || isArray(type) || isText(type);
        let field;
        if (this.#isSecret && !isArray(type) && !asJson) {
            field = element('input', { ...common, type: 'password', autocomplete: 'new-password' });
        } else if (type === 'bool') {
            field = element('select', common, element('option', {}, 'true'), element('option', {}, 'false'));
        } else if (isLong) {
            field = element('textarea', { ...common, rows: Math.min(10, Math.max(isArray(type) ? 4 : 2, text.split('\n').length)) });
        } else {
            field = element('input', { ...common, inputmode: type === 'double' ? 'decimal' : 'numeric', autocomplete: 'off' });
        }
        field.value = type === 'bool' && text !== 'true' ? 'false' : text;
        field.addEventListener('input', () => this.#describe());
        this.#asJson.parentElement.hidden = !(isArray(type) || isText(type));
        const hadFocus = document.activeElement === this.#field;
        this.#field.replaceWith(field);
        this.#field = field;
        if (hadFocus) field.focus();
        this.#describe();
    }

    #describe() {
        this.#complain('');
        const type = this.#type.value;
        const { lowest, highest } = numberForms[elementType(type)] ?? {};
        const range = lowest === undefined ? '' : `Whole numbers from ${lowest} to ${highest}.`;
        const lines = isArray(type) && !this.#asJson.checked
            ? `One element per line: ${countOf(linesOf(elementType(type), this.#field.value).length, 'element')}.` : '';
        const secret = this.#isSecret ? 'The present value is secret and is not shown.' : '';
        const bytes = this.#item?.href !== undefined ? 'The present value holds bytes that are no UTF-8; setting it replaces them.' : '';
        this.#hint.textContent = [lines, range, secret, bytes].filter(Boolean).join(' ');
    }

    #changeType() {
        if (!isArray(this.#type.value) && !isText(this.#type.value)) this.#asJson.checked = false;
        this.#showField(this.#field.value);
    }

    // Keeps what was entered, as far as it has a meaning.
    #changeForm() {
        const asJson = this.#asJson.checked;
        let text = this.#field.value;
        try {
            text = writeValue(readValue(this.#type.value, text, !asJson), asJson);
        } catch {
            // As it stands, for the reader to mend.
        }
        this.#showField(text);
    }

    #offerSources() {
        const key = this.#item?.key ?? this.#key.value;
        const chosen = this.#source.value;
        const offered = this.#sources.filter((source) => key.startsWith(source.group));
        this.#source.replaceChildren(
            element('option', { value: '' }, offered.length === 0 ? 'none takes this key' : `${offered[0].name}, the first`),
            ...offered.map(({ name }) => element('option', { value: name }, name)));
        this.#source.value = offered.some(({ name }) => name === chosen) ? chosen : '';
    }

    #complain(text) {
        this.#problem.textContent = text;
        if (text === '') this.#field.removeAttribute('aria-invalid');
        else this.#field.setAttribute('aria-invalid', 'true');
        this.#done.textContent = '';
    }

    async #submit(event) {
        event.preventDefault();
        const dryRun = event.submitter?.value === 'check';
        this.#complain('');
        try {
            const value = readValue(this.#type.value, this.#field.value, this.#asJson.checked);
            const key = this.#item?.key ?? this.#key.value;
            const source = this.#source.value || undefined;
            const { changes: [change] } = await this.#api.change([{ key, value, source }], { dryRun });
            this.#done.textContent = `${dryRun ? 'Would be set' : 'Set'} in ${change.source}. ${beforeText(change)}`;
            if (dryRun) return;
            this.#shown = this.#field.value;
            this.#changed.textContent = '';
            this.#onSet(change);
        } catch (problem) {
            this.#complain(problem.message);
            this.#field.focus();
        }
    }
}

function beforeText({ before }) {
    if (before === undefined) return 'It had no value there before.';
    return `Before: ${showContent(before.value) || 'empty text'}.`;
}

function labelled(text, field) {
    return element('div', {}, element('label', { for: field.id }, text), field);
}
