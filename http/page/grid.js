const overscan = 12;
const highlightTime = 4000;

/// The table: a window of rows over any number of items, each at its place, with one cell that the
/// keyboard reaches. `onOpen(item)` is called for the row that is chosen.
class Grid {
    #scroller = byId('scroller');
    #grid = byId('grid');
    #body = byId('rows');
    #onOpen;
    #changed;
    #items = [];
    #rows = new Map();  // the rendered ones, by id
    #rowHeight = 33;
    #active = { index: 0, column: 0 };
    #opened;

    /// `changed` says when an item changed, by id.
    constructor(changed, onOpen) {
        this.#changed = changed;
        this.#onOpen = onOpen;
        this.#scroller.addEventListener('scroll', () => this.#render(), { passive: true });
        this.#body.addEventListener('click', (event) => this.#openAt(event.target));
        this.#body.addEventListener('focusin', (event) => this.#activate(event.target));
        this.#grid.addEventListener('keydown', (event) => this.#move(event));
        new ResizeObserver(() => this.#measure()).observe(this.#scroller);
    }

    /// Shows `items`, in their order.
    show(items) {
        this.#items = items;
        this.#grid.setAttribute('aria-rowcount', items.length + 1);
        this.#body.style.height = `${items.length * this.#rowHeight}px`;
        this.#render();
        for (const [id, row] of this.#rows) this.#fill(row, this.#items[row.index], id);
    }

    /// Marks the item whose details are shown.
    markOpened(id) {
        this.#opened = id;
        for (const [rendered, { node }] of this.#rows) {
            node.setAttribute('aria-selected', String(rendered === id));
        }
    }

    /// Moves the focus to an item, or to the first when it is not shown.
    focus(id) {
        const index = this.#items.findIndex((item) => item.id === id);
        if (this.#items.length > 0) this.#focusCell(Math.max(index, 0), 0);
    }

    scrollToTop() {
        this.#scroller.scrollTop = 0;
    }

    #measure() {
        const height = parseFloat(getComputedStyle(this.#body).getPropertyValue('line-height'));
        if (height > 0) this.#rowHeight = height;
        this.#body.style.height = `${this.#items.length * this.#rowHeight}px`;
        for (const row of this.#rows.values()) row.node.style.top = `${row.index * this.#rowHeight}px`;
        this.#render();
    }

    get #visible() {
        const headHeight = this.#body.offsetTop;
        const first = Math.floor(this.#scroller.scrollTop / this.#rowHeight);
        const shown = Math.floor((this.#scroller.clientHeight - headHeight) / this.#rowHeight);
        return { first, last: Math.min(first + Math.max(shown, 1), this.#items.length) };
    }

    #render() {
        const { first, last } = this.#visible;
        this.#keepActiveNear(first, last);
        const from = Math.max(0, first - overscan);
        const wanted = this.#items.slice(from, last + overscan);
        const ids = new Set(wanted.map((item) => item.id));
        for (const [id, { node }] of this.#rows) {
            if (ids.has(id)) continue;
            node.remove();
            this.#rows.delete(id);
        }
        let next = this.#body.firstElementChild;
        wanted.forEach((item, offset) => {
            const row = this.#rows.get(item.id) ?? this.#make(item);
            this.#place(row, from + offset);
            if (row.node === next) next = next.nextElementSibling;
            else this.#body.insertBefore(row.node, next);
        });
        this.#syncTabStop();
    }

    // What the keyboard reaches is always among the rendered rows, and so is the focus.
    #keepActiveNear(first, last) {
        const lowest = Math.max(0, first - overscan);
        const highest = Math.max(lowest, Math.min(this.#items.length, last + overscan) - 1);
        const kept = Math.min(Math.max(this.#active.index, lowest), highest);
        if (kept === this.#active.index) return;
        const hadFocus = this.#body.contains(document.activeElement);
        this.#active.index = kept;
        if (hadFocus) queueMicrotask(() => this.#activeCell?.focus({ preventScroll: true }));
    }

    #make(item) {
        const key = element('button', { type: 'button', tabindex: '-1', class: 'key' });
        const cells = [
            element('div', { role: 'rowheader' }, key),
            ...['type', 'content', 'source', 'constraint'].map((name) =>
                element('div', { role: 'gridcell', class: name, tabindex: '-1' })),
        ];
        const node = element('div', { role: 'row', class: 'row' }, ...cells);
        const row = { node, cells, targets: [key, ...cells.slice(1)] };
        node.setAttribute('aria-selected', String(item.id === this.#opened));
        this.#rows.set(item.id, row);
        this.#fill(row, item);
        return row;
    }

    #place(row, index) {
        if (row.index === index) return;
        row.index = index;
        row.node.style.top = `${index * this.#rowHeight}px`;
        row.node.setAttribute('aria-rowindex', index + 2);
    }

    #fill(row, item) {
        const [key, type, content, source, constraint] = row.targets;
        this.#highlight(row, item);
        const filled = JSON.stringify([item.value, item.source, item.constraint, item.secret]);
        if (row.filled === filled) return;
        row.filled = filled;
        key.textContent = item.key === '' ? '(empty key)' : item.key;
        key.title = item.key;
        type.textContent = item.value.type;
        content.replaceChildren(item.secret ? element('span', { class: 'secret' }, 'secret') : valueElement(item.value));
        source.textContent = item.source;
        constraint.textContent = item.constraint ?? '';
        constraint.title = item.constraint ?? '';
    }

    // Rows come and go while a highlight lasts: what is left of it is shown.
    #highlight({ node }, item) {
        const when = this.#changed.get(item.id);
        node.classList.toggle('changed', when !== undefined);
        const age = when === undefined ? highlightTime : Date.now() - when;
        if (age >= highlightTime || node.dataset.fresh === String(when)) return;
        node.dataset.fresh = String(when);
        node.classList.remove('fresh');
        void node.offsetWidth;  // starts the animation again
        node.style.animationDelay = `${-age}ms`;
        node.classList.add('fresh');
        setTimeout(() => node.dataset.fresh === String(when) && node.classList.remove('fresh'), highlightTime - age);
    }

    get #activeCell() {
        const item = this.#items[this.#active.index];
        return item && this.#rows.get(item.id)?.targets[this.#active.column];
    }

    // Those that a narrow table leaves out can't show the focus.
    get #shownColumns() {
        const [{ targets }] = this.#rows.values();
        return [...targets.keys()].filter((column) => targets[column].offsetWidth > 1);
    }

    #syncTabStop() {
        const stop = this.#activeCell;
        for (const old of this.#body.querySelectorAll('[tabindex="0"]')) {
            if (old !== stop) old.tabIndex = -1;
        }
        if (stop) stop.tabIndex = 0;
    }

    #rowOf(node) {
        const owner = node.closest('.row');
        return [...this.#rows.values()].find((row) => row.node === owner);
    }

    #activate(node) {
        const row = this.#rowOf(node);
        if (row === undefined) return;
        this.#active = { index: row.index, column: Math.max(0, row.targets.indexOf(node)) };
        this.#syncTabStop();
    }

    #openAt(node) {
        const row = this.#rowOf(node);
        if (row === undefined || String(getSelection()) !== '') return;
        this.#onOpen(this.#items[row.index]);
    }

    #focusCell(index, column) {
        this.#active = { index, column };
        const top = index * this.#rowHeight;
        const room = this.#scroller.clientHeight - this.#body.offsetTop;
        if (top < this.#scroller.scrollTop) this.#scroller.scrollTop = top;
        const lowest = top + this.#rowHeight - room;
        if (lowest > this.#scroller.scrollTop) this.#scroller.scrollTop = lowest;
        this.#render();
        this.#activeCell?.focus({ preventScroll: true });
    }

    #move(event) {
        if (event.altKey || event.metaKey || this.#items.length === 0) return;
        const { index, column } = this.#active;
        const { first, last } = this.#visible;
        const page = Math.max(1, last - first - 1);
        const end = this.#items.length - 1;
        const columns = this.#shownColumns;
        const place = columns.indexOf(column);
        const target = {
            ArrowUp: [index - 1, column],
            ArrowDown: [index + 1, column],
            ArrowLeft: [index, columns[place - 1] ?? column],
            ArrowRight: [index, columns[place + 1] ?? column],
            PageUp: [index - page, column],
            PageDown: [index + page, column],
            Home: [event.ctrlKey ? 0 : index, 0],
            End: [event.ctrlKey ? end : index, columns.at(-1)],
        }[event.key];
        if (target !== undefined) {
            event.preventDefault();
            this.#focusCell(Math.min(Math.max(target[0], 0), end), target[1]);
        } else if ((event.key === 'Enter' || event.key === ' ') && event.target.role === 'gridcell') {
            event.preventDefault();
            this.#onOpen(this.#items[index]);
        }
    }
}
