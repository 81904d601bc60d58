const changed = new Map();  // when an item changed since the page was opened, by id
const store = new Store();
const filter = new Filter();
const rights = { mayWrite: false, sources: [] };

const api = new Api(askForToken);
const details = new Details(api, rights, closed);
const grid = new Grid(changed, open);
const follower = new Follower(api, store, { onState, onProgress: showRows, onDifferences });

const refreshDetails = batched(150, () => details.refresh());
const showSoon = batched(0, showRows);
let isLoaded = false;

function askForToken(wasRefused) {
    const dialog = byId('token-dialog');
    const field = byId('token');
    byId('token-problem').textContent = wasRefused ? 'The server does not know that token.' : '';
    field.value = '';
    if (!dialog.open) dialog.showModal();
    return new Promise((resolve) => {
        byId('token-form').onsubmit = (event) => {
            event.preventDefault();
            dialog.close();
            resolve(field.value.trim());
        };
        // Without a token there is nothing to go back to.
        dialog.oncancel = (event) => event.preventDefault();
    });
}

function showRows() {
    const shown = filter.select(store.sorted, changed);
    grid.show(shown);
    const all = countOf(store.items.size, 'key');
    byId('count').textContent = filter.isActive ? `${shown.length.toLocaleString('en')} of ${all}` : all;
    byId('changed-count').textContent = changed.size.toLocaleString('en');
    const isEmpty = shown.length === 0 && (isLoaded || filter.isActive);
    byId('empty').hidden = !isEmpty;
    byId('clear-filter').hidden = !filter.isActive;
    byId('empty-text').textContent = filter.isActive ? 'No key matches.' : 'No layer holds a key yet.';
    showSourcesToFilter();
}

function showSourcesToFilter() {
    const select = byId('filter-source');
    const names = rights.sources.map((source) => source.name);
    const offered = [...select.options].slice(1).map((option) => option.value);
    if (sameValue(names, offered)) return;
    select.replaceChildren(select.options[0], ...names.map((name) => element('option', { value: name }, name)));
    select.value = filter.source = names.includes(filter.source) ? filter.source : '';
}

async function readSources() {
    const { sources, mayWrite } = await api.json('/sources');
    const couldWrite = rights.mayWrite;
    Object.assign(rights, { sources, mayWrite: mayWrite === true });
    if (rights.mayWrite !== couldWrite) details.renewRights();
    byId('rights').textContent = rights.mayWrite ? '' : 'read only';
    byId('new-key').hidden = !rights.mayWrite;
    showLayers();
    showSourcesToFilter();
}

function showLayers() {
    const ill = rights.sources.filter(({ state }) => state?.well === false);
    byId('layers-summary').textContent = ill.length === 0
        ? countOf(rights.sources.length, 'layer') : `${countOf(rights.sources.length, 'layer')}, ${ill.length} not well`;
    byId('layers-summary').classList.toggle('ill', ill.length > 0);
    byId('layers-list').replaceChildren(element('ol', { class: 'layers' }, ...rights.sources.map(layerEntry)));
}

function layerEntry({ name, group, readOnly, journal, state }) {
    const facts = [group && `keys ${group}…`, readOnly ? 'read only' : 'takes writes', journal && 'keeps history'];
    const entry = element('li', {}, element('strong', {}, name), ' ',
        element('span', { class: 'muted' }, facts.filter(Boolean).join(', ')));
    if (state?.well === false) {
        entry.append(element('p', { class: 'problem' }, `${state.lastError ?? 'Not well'} `,
            ...(state.since ? ['since ', timeElement(state.since)] : [])));
    }
    return entry;
}

function onState(state, { pause, problem }) {
    const isLive = state === 'live';
    const connection = byId('connection');
    const wasLost = connection.dataset.state === 'lost';
    connection.dataset.state = state;
    byId('connection-text').textContent = isLive ? 'Live' : 'Connection lost';
    document.title = `${isLive ? '' : 'Lost: '}velkor ${location.host}`;
    document.body.classList.toggle('stale', !isLive);
    byId('lost').hidden = isLive;
    if (isLive) {
        isLoaded = true;
        if (!wasLost) openFromAddress();
        showRows();
        readSources().catch(ignoreUntilNextTime);
        refreshDetails();
    } else {
        if (!wasLost) {
            byId('lost-text').textContent = `Connection lost at ${clock(new Date())}. What is shown may be out of date.`;
        }
        byId('lost-pause').textContent = `${problem.message}. Trying again in ${pause < 1000 ? 'a moment' : countOf(pause / 1000, 'second')}.`;
    }
}

// The stream fails as well then, which is shown.
function ignoreUntilNextTime() {}

function onDifferences(differences, isResync) {
    const now = Date.now();
    for (const { kind, item } of differences) {
        if (kind === 'gone') changed.delete(item.id);
        else changed.set(item.id, now);
        if (item.id !== details.openedId) continue;
        details.renewForm();
        refreshDetails();
    }
    describeNew(differences);
    announce(differences, isResync);
    showSoon();
}

// A change stream tells no constraints: those of a few new keys are asked for.
async function describeNew(differences) {
    const isBare = ({ kind, item }) => kind === 'new' && !('constraint' in item);
    for (const { item } of differences.filter(isBare).slice(0, 50)) {
        try {
            store.describe(item.id, await api.json(`/config/${encodedKey(item)}`));
            showSoon();
        } catch {
            // It is gone again, or the connection is.
        }
    }
}

const words = { changed: 'changed', new: 'added', gone: 'removed' };
let unsaid = [];
const speak = batched(2000, () => {
    byId('live').textContent = summaryOf(unsaid);
    unsaid = [];
});

function summaryOf(differences) {
    if (differences.length === 1) {
        const [{ kind, item }] = differences;
        return kind === 'gone' || item.secret ? `${item.key} ${words[kind]}`
            : `${item.key} ${words[kind]}: ${showContent(item.value.value)}`;
    }
    return Object.entries(words).map(([kind, word]) => [differences.filter((one) => one.kind === kind).length, word])
        .filter(([number]) => number > 0).map(([number, word]) => `${number} ${word}`).join(', ');
}

// The eye gets every batch, the ear a summary now and then.
function announce(differences, isResync) {
    const lead = isResync ? 'Connected again: ' : '';
    if (differences.length === 0 && !isResync) return;
    byId('last-change').textContent = `${clock(new Date())} ${lead}${summaryOf(differences) || 'nothing had changed'}`;
    unsaid.push(...differences);
    if (unsaid.length > 0) speak();
}

function open(item) {
    details.open(item);
    grid.markOpened(item.id);
    history.replaceState(null, '', `#${encodeURIComponent(item.id)}`);
}

function closed(id) {
    grid.markOpened(undefined);
    grid.focus(id);
    history.replaceState(null, '', location.pathname);
}

function openFromAddress() {
    let id;
    try {
        id = decodeURIComponent(location.hash.slice(1));
    } catch {
        return;
    }
    const item = store.items.get(id);
    if (item !== undefined && details.openedId === undefined) open(item);
}

function filterBy(change) {
    Object.assign(filter, change);
    byId('filter-changed').setAttribute('aria-pressed', String(filter.changedOnly));
    grid.scrollToTop();
    showRows();
}

byId('host').textContent = location.host;
byId('filter').addEventListener('input', (event) => filterBy({ text: event.target.value }));
byId('filter-mode').addEventListener('change', (event) => filterBy({ mode: event.target.value }));
byId('filter-source').addEventListener('change', (event) => filterBy({ source: event.target.value }));
byId('filter-changed').addEventListener('click', () => filterBy({ changedOnly: !filter.changedOnly }));
byId('clear-filter').addEventListener('click', () => {
    byId('filter').value = byId('filter-source').value = '';
    filterBy({ text: '', source: '', changedOnly: false });
    byId('filter').focus();
});
byId('new-key').addEventListener('click', () => {
    grid.markOpened(undefined);
    details.openNew();
});
byId('retry').addEventListener('click', () => follower.retry());
addEventListener('online', () => follower.retry());
byId('layers-menu').addEventListener('toggle', (event) => {
    if (event.target.open) readSources().catch(ignoreUntilNextTime);
});
byId('layers-menu').addEventListener('keydown', (event) => {
    if (event.key !== 'Escape') return;
    byId('layers-menu').open = false;
    byId('layers-summary').focus();
});
byId('filter').addEventListener('keydown', (event) => {
    if (event.key !== 'ArrowDown' && event.key !== 'Enter') return;
    event.preventDefault();
    grid.focus();
});
byId('grid').addEventListener('keydown', (event) => {
    if (event.key !== '/') return;
    event.preventDefault();
    byId('filter').select();
});

follower.run();
