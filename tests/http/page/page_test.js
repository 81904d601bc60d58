// The page in a browser, before the program itself.
import assert from 'node:assert/strict';
import { test } from 'node:test';

import { becomesLive, Bench, flaws, measureTasks, row, showsText, showsValue } from './serving.js';

const someKeys = 'http.port=8080\nhttp.names=alpha\nhttp.motd=Welcome\ndb.host=localhost\n';

/// A server with a file and a layer that lasts, which clients may change, and the page in front.
async function openWritable(bench, look) {
    const file = bench.file('site.properties', someKeys);
    const args = ['--allow-writes', '--state', bench.path('state'), file];
    const server = await bench.serve(args);
    return { server, args, tab: await bench.open(server, look) };
}

async function openDetails(tab, key) {
    await row(tab, key).getByRole('button').click();
    await tab.locator('#details-layers .value').first().waitFor();
}

async function setTo(tab, text) {
    await tab.getByLabel('Value', { exact: true }).fill(text);
    await tab.getByRole('button', { name: 'Set', exact: true }).click();
}

// No script has failed, and the policy has stopped none.
function closesWell(tab) {
    assert.deepEqual(tab.complaints, []);
}

test('ten thousand keys take less than a second of script time', async (t) => {
    const bench = new Bench(t);
    const keys = Array.from({ length: 10_000 }, (_, index) => `service.${index % 40}.worker.${index}=value ${index}\n`);
    const server = await bench.serve([bench.file('many.properties', keys.join(''))]);
    const tab = await bench.openTab();
    const measure = await measureTasks(tab);
    await tab.goto(server.url);
    await showsText(tab, '#count', '10,000 keys');
    await becomesLive(tab);
    const { scripts, everything } = await measure();
    t.diagnostic(`scripts ${scripts.toFixed(3)} s, all tasks of the page ${everything.toFixed(3)} s`);
    assert.ok(scripts < 1, `${scripts} s`);
    assert.equal(await tab.getByRole('grid').getAttribute('aria-rowcount'), '10001');

    await tab.getByLabel('Filter by key').fill('worker.9999');
    await showsText(tab, '#count', '1 of 10,000 keys');
    await showsValue(tab, 'service.39.worker.9999', 'value 9999');
    closesWell(tab);
});

test('the last of many keys is reached by the keyboard, and is the last for a screen reader', async (t) => {
    const bench = new Bench(t);
    const keys = Array.from({ length: 2_500 }, (_, index) => `key.${String(index).padStart(4, '0')}=x\n`);
    const tab = await bench.open(await bench.serve([bench.file('many.properties', keys.join(''))]));
    await row(tab, 'key.0000').getByRole('button').focus();
    await tab.keyboard.press('Control+End');
    await row(tab, 'key.2499').waitFor();
    assert.equal(await row(tab, 'key.2499').getAttribute('aria-rowindex'), '2501');
    assert.ok(await tab.evaluate(() => document.activeElement.closest('[aria-rowindex="2501"]') !== null));
});

test('a filter keeps what contains its text, or begins with it', async (t) => {
    const { tab } = await openWritable(new Bench(t));
    await tab.getByLabel('Filter by key').fill('HO');
    await showsText(tab, '#count', '1 of 4 keys');
    await tab.getByLabel('Filter by key').fill('p');
    await showsText(tab, '#count', '3 of 4 keys');
    await tab.getByLabel('How the filter matches').selectOption('begins with');
    await showsText(tab, '#count', '0 of 4 keys');
    await tab.getByText('No key matches.').waitFor();
    await tab.getByRole('button', { name: 'Clear the filter' }).click();
    await showsText(tab, '#count', '4 keys');
});

test('a store without keys says so', async (t) => {
    const bench = new Bench(t);
    const tab = await bench.open(await bench.serve([]));
    await tab.getByText('No layer holds a key yet.').waitFor();
});

test('a change made elsewhere shows without reload', async (t) => {
    const { server, tab } = await openWritable(new Bench(t));
    await tab.evaluate(() => { globalThis.sameDocument = true; });
    await server.set('http.port', 'int', 9090);
    await showsValue(tab, 'http.port', '9090');
    await showsText(tab, '#last-change', 'http.port changed: 9090');
    await showsText(tab, '#live', 'http.port changed: 9090');
    assert.match(await row(tab, 'http.port').getAttribute('class'), /changed/);

    await server.set('new.key', 'stringArray', ['a', 'b']);
    await showsValue(tab, 'new.key', 'a, b');
    await server.change({ key: 'new.key', unset: true });
    await row(tab, 'new.key').waitFor({ state: 'detached' });
    assert.ok(await tab.evaluate(() => globalThis.sameDocument));
    closesWell(tab);
});

test('a change stands out without motion where motion is unwanted', async (t) => {
    const { server, tab } = await openWritable(new Bench(t), { reducedMotion: 'reduce' });
    await server.set('http.port', 'int', 9090);
    const animation = await tab.waitForFunction(() => {
        const fresh = document.querySelector('.row.fresh');
        return fresh && getComputedStyle(fresh).animationName;
    });
    assert.equal(await animation.jsonValue(), 'none');
});

test('a key is set, unset again, and its history tells both', async (t) => {
    const { tab } = await openWritable(new Bench(t));
    await openDetails(tab, 'http.port');
    await tab.getByLabel('Type').selectOption('int');
    await setTo(tab, '8181');
    await showsValue(tab, 'http.port', '8181');
    await showsText(tab, '.done', 'Set in state.');
    await showsText(tab, '#details-layers', '8080');

    await tab.getByRole('button', { name: 'Unset in state' }).click();
    await tab.getByRole('dialog').getByRole('button', { name: 'Unset' }).click();
    await showsValue(tab, 'http.port', '8080');
    await showsText(tab, '#details-history li:nth-child(1)', 'unset in state');
    await showsText(tab, '#details-history li:nth-child(2)', 'no value → 8181');
    closesWell(tab);
});

for (const [type, entered, shown, wrong] of [
    ['bool', undefined, 'true'],
    ['int', '-7', '-7', '2147483648'],
    ['uint', '4294967295', '4294967295', '-1'],
    ['double', '0.5', '0.5', 'half'],
    ['string', 'Zoë ', 'Zoë '],
    ['ustring', 'two\nlines', 'two↵lines'],
    ['boolArray', 'true\nfalse', 'true, false', 'yes'],
    ['intArray', '1\n2', '1, 2', '1.5'],
    ['uintArray', '3', '3', '-3'],
    ['doubleArray', '1.5\n2', '1.5, 2', 'x'],
    ['stringArray', 'a\n\nb', 'a, , b'],
    ['ustringArray', '', 'no elements'],
]) {
    test(`a new key of type ${type} is set`, async (t) => {
        const { tab } = await openWritable(new Bench(t));
        await tab.getByRole('button', { name: 'New key' }).click();
        await tab.getByLabel('Key', { exact: true }).fill('made.here');
        await tab.getByLabel('Type').selectOption(type);
        if (wrong !== undefined) {
            await setTo(tab, wrong);
            await showsText(tab, '#value-problem', wrong);
        }
        if (type === 'bool') {
            await tab.getByLabel('Value', { exact: true }).selectOption('true');
            await tab.getByRole('button', { name: 'Set', exact: true }).click();
        } else {
            await setTo(tab, entered);
        }
        await showsText(tab, '.done', 'Set in state.');
        await row(tab, 'made.here').waitFor();
        assert.equal(await row(tab, 'made.here').getByRole('gridcell').nth(1).textContent(), shown);
        assert.equal(await row(tab, 'made.here').getByRole('gridcell').nth(0).textContent(), type);
    });
}

test('elements that hold line ends are edited as JSON', async (t) => {
    const { server, tab } = await openWritable(new Bench(t));
    await server.set('lines', 'stringArray', ['a\nb', 'c']);
    await openDetails(tab, 'lines');
    assert.ok(await tab.getByLabel('as JSON').isChecked());
    await setTo(tab, '["a\\nb", "d"]');
    await showsValue(tab, 'lines', 'a↵b, d');
});

test('the form follows its key, but never takes away what is being entered', async (t) => {
    const { server, tab } = await openWritable(new Bench(t));
    await openDetails(tab, 'http.motd');
    await server.set('http.motd', 'string', 'Hello');
    await tab.waitForFunction(() => document.getElementById('set-value').value === 'Hello');
    await tab.getByLabel('Value', { exact: true }).fill('Good day');
    await server.set('http.motd', 'string', 'Good evening');
    await showsText(tab, 'form.set', 'It has changed meanwhile: Good evening');
    assert.equal(await tab.getByLabel('Value', { exact: true }).inputValue(), 'Good day');
});

test('what is set here is no change meanwhile, even when it shows before the answer', async (t) => {
    const { tab } = await openWritable(new Bench(t));
    await openDetails(tab, 'http.motd');
    let answered;
    const said = new Promise((resolve) => { answered = resolve; });
    await tab.route('**/config', async (route) => {
        const response = await route.fetch();
        await showsValue(tab, 'http.motd', 'Hello');
        answered(await tab.locator('form.set').innerText());
        await route.fulfill({ response });
    });
    await setTo(tab, 'Hello');
    assert.doesNotMatch(await said, /meanwhile/);
    await showsText(tab, '.done', 'Set in state.');
    assert.equal(await tab.getByLabel('Value', { exact: true }).inputValue(), 'Hello');
});

test('checking a change leaves the store alone', async (t) => {
    const { tab } = await openWritable(new Bench(t));
    await openDetails(tab, 'http.motd');
    await tab.getByLabel('Value', { exact: true }).fill('Hello');
    await tab.getByRole('button', { name: 'Only check' }).click();
    await showsText(tab, '.done', 'Would be set in state.');
    assert.equal(await row(tab, 'http.motd').getByRole('gridcell').nth(1).textContent(), 'Welcome');
});

test('a refused write shows what the server says, beside the field', async (t) => {
    const bench = new Bench(t);
    const server = await bench.serve(['--allow-writes', '--max-body-bytes', '500',
        bench.file('site.properties', someKeys)]);
    const tab = await bench.open(server);
    await openDetails(tab, 'http.motd');
    const response = tab.waitForResponse((one) => one.request().method() === 'PATCH');
    await setTo(tab, 'x'.repeat(600));
    const { detail } = await (await response).json();
    assert.notEqual(detail, '');
    await showsText(tab, '#value-problem', detail);
    assert.equal(await tab.getByLabel('Value', { exact: true }).getAttribute('aria-invalid'), 'true');
    assert.equal(await row(tab, 'http.motd').getByRole('gridcell').nth(1).textContent(), 'Welcome');
});

test('what the process has declared of a key is shown, and that it does not take a value', async (t) => {
    const bench = new Bench(t);
    const tab = await bench.open(await bench.serveDeclared());
    assert.match(await row(tab, 'http.port').getByRole('gridcell').nth(3).textContent(), /65535/);
    await openDetails(tab, 'http.port');
    await showsText(tab, '#details-about', 'Where clients connect');
    await setTo(tab, '70000');
    await showsText(tab, '#details-setting', 'Not taken by the process: ');
    assert.deepEqual(await flaws(tab), []);
});

test('a secret is set without being shown', async (t) => {
    const bench = new Bench(t);
    const tab = await bench.open(await bench.serveDeclared());
    await showsValue(tab, 'db.password', 'secret');
    await openDetails(tab, 'db.password');
    assert.equal(await tab.getByLabel('Value', { exact: true }).inputValue(), '');
    assert.equal(await tab.getByLabel('Value', { exact: true }).getAttribute('type'), 'password');
    await setTo(tab, 'entirely new');
    await showsText(tab, '.done', 'Set in ');
    assert.doesNotMatch(await tab.locator('body').innerText(), /entirely new|hidden from all/);
});

test('where nothing may be written nothing can be entered', async (t) => {
    const bench = new Bench(t);
    const tab = await bench.open(await bench.serve([bench.file('site.properties', someKeys)]));
    await showsText(tab, '#rights', 'read only');
    await openDetails(tab, 'http.port');
    assert.equal(await tab.locator('form.set').count(), 0);
    assert.ok(await tab.locator('#new-key').isHidden());
});

test('a lost connection shows, and a server that is back is followed again', async (t) => {
    const bench = new Bench(t);
    const { server, args, tab } = await openWritable(bench);
    await server.stop();
    await showsText(tab, '#connection', 'Connection lost');
    await tab.getByRole('alert').filter({ hasText: 'may be out of date' }).waitFor();

    // It differs when it is back, and changes once more then.
    bench.file('site.properties', someKeys.replace('Welcome', 'Back').replace('db.host=localhost\n', ''));
    const restarted = await bench.serve(args, server.port);
    await tab.getByRole('button', { name: 'Try now' }).click({ timeout: 2000 }).catch(() => {});
    await becomesLive(tab);
    await showsValue(tab, 'http.motd', 'Back');
    await row(tab, 'db.host').waitFor({ state: 'detached' });
    await showsText(tab, '#last-change', 'Connected again: 1 changed, 1 removed');
    assert.ok(await tab.locator('#lost').isHidden());
    await restarted.set('http.motd', 'string', 'Live');
    await showsValue(tab, 'http.motd', 'Live');
    closesWell(tab);
});

test('a server with tokens asks for one, and what it allows is offered', async (t) => {
    const bench = new Bench(t);
    const [reading, writing] = ['reading-0123456789abcdef0123456789', 'writing-0123456789abcdef0123456789'];
    const server = await bench.serve(['--allow-writes', '--token-file',
        bench.file('tokens', `read ${reading}\nwrite ${writing}\n`), bench.file('site.properties', someKeys)]);
    const tab = await bench.openTab();
    const enter = async (token) => {
        await tab.getByLabel('Token', { exact: true }).fill(token);
        await tab.getByRole('button', { name: 'Continue' }).click();
    };
    await tab.goto(server.url);
    await enter('wrong');
    await showsText(tab, '#token-problem', 'The server does not know that token.');
    assert.deepEqual(await flaws(tab), []);
    await enter(reading);
    await becomesLive(tab);
    await showsText(tab, '#rights', 'read only');
    await tab.reload();
    await becomesLive(tab);

    await tab.evaluate(() => sessionStorage.clear());
    await tab.reload();
    await enter(writing);
    await tab.getByRole('button', { name: 'New key' }).waitFor();
});

test('the keyboard alone finds a key, sets it and unsets it', async (t) => {
    const { tab } = await openWritable(new Bench(t));
    const press = async (...keys) => {
        for (const key of keys) await tab.keyboard.press(key);
    };
    const focused = (selector) => tab.waitForFunction(
        (wanted) => document.activeElement?.matches(wanted), selector);
    await tab.locator('#filter').focus();
    await tab.keyboard.type('http.p');
    await press('Enter');
    await focused('.key');
    await press('ArrowRight', 'ArrowRight');
    await focused('.content');
    await press('Enter');
    await focused('#details-title');
    await showsText(tab, '#details-layers', '8080');
    while (!await tab.evaluate(() => document.activeElement.id === 'set-value')) await press('Tab');
    await press('Control+a');
    await tab.keyboard.type('9191');
    await press('Tab');
    while (await tab.evaluate(() => document.activeElement.value !== 'set')) await press('Tab');
    await press('Enter');
    await showsValue(tab, 'http.port', '9191');
    await showsText(tab, '#details-layers', 'state');
    while (await tab.evaluate(() => document.activeElement.textContent !== 'Unset')) await press('Shift+Tab');
    await press('Enter');
    await focused('dialog *');
    while (await tab.evaluate(() => document.activeElement.className !== 'danger')) await press('Tab');
    await press('Enter');
    await showsValue(tab, 'http.port', '8080');
    await focused('#details-title');
    await press('Escape');
    await focused('.key, .row *');
    await press('/');
    await focused('#filter');
});

test('a key in the address is opened with all that may be done to it', async (t) => {
    const bench = new Bench(t);
    const server = await bench.serve(['--allow-writes', '--state', bench.path('state'),
        bench.file('site.properties', someKeys)]);
    await server.set('http.port', 'int', 1);
    const tab = await bench.openTab();
    await tab.goto(`${server.url}#http.port`);
    await showsText(tab, '#details-title', 'http.port');
    await tab.getByRole('button', { name: 'Unset in state' }).waitFor();
    await setTo(tab, '2');
    await showsValue(tab, 'http.port', '2');
});

test('a change by somebody else leaves the focus where it is, or behind what has gone', async (t) => {
    const { server, tab } = await openWritable(new Bench(t));
    await server.set('http.port', 'int', 1);
    await openDetails(tab, 'http.port');
    const unset = tab.getByRole('button', { name: 'Unset in state' });
    await unset.focus();
    await server.set('http.port', 'int', 2);
    await showsText(tab, '#details-layers', '2');
    assert.ok(await unset.evaluate((button) => button === document.activeElement));
    await server.change({ key: 'http.port', unset: true, source: 'state' });
    await unset.waitFor({ state: 'detached' });
    await tab.waitForFunction(() => document.activeElement.id === 'details-title');
});

for (const colorScheme of ['light', 'dark']) {
    for (const [form, viewport] of [['wide', { width: 1200, height: 720 }], ['narrow', { width: 420, height: 760 }]]) {
        test(`axe finds nothing on a ${form} screen in the ${colorScheme}`, async (t) => {
            const { server, tab } = await openWritable(new Bench(t), { colorScheme, viewport, reducedMotion: 'reduce' });
            await server.set('http.port', 'int', 1);
            await tab.locator('.row.changed').waitFor();
            assert.deepEqual(await flaws(tab), []);
            await openDetails(tab, 'http.port');
            await setTo(tab, 'x');
            await showsText(tab, '#value-problem', 'x');
            assert.deepEqual(await flaws(tab), []);
            await tab.getByRole('button', { name: 'Unset in state' }).click();
            assert.deepEqual(await flaws(tab), []);
            await tab.getByRole('button', { name: 'Keep' }).click();
            await server.stop();
            await tab.getByRole('alert').filter({ hasText: 'Connection lost' }).waitFor({ state: 'attached' });
            assert.deepEqual(await flaws(tab), []);
        });
    }
}

test('only the script and the style of the page run in it', async (t) => {
    const { server, tab } = await openWritable(new Bench(t));
    const policy = (await fetch(server.url)).headers.get('Content-Security-Policy');
    assert.match(policy, /^default-src 'none'; script-src 'sha256-[^']{44}'; style-src 'sha256-[^']{44}'; connect-src 'self'; base-uri 'none'; form-action 'none'; frame-ancestors 'none'$/);
    await tab.evaluate(() => document.body.append(Object.assign(document.createElement('script'), { textContent: 'globalThis.strange = 1' })));
    assert.equal(await tab.evaluate(() => globalThis.strange), undefined);
});

test('what keys and values hold is text, never markup', async (t) => {
    const { server, tab } = await openWritable(new Bench(t));
    const markup = '<img src=x onerror="globalThis.strange=1">';
    await server.set(markup, 'string', markup);
    await showsValue(tab, markup, markup);
    await openDetails(tab, markup);
    assert.equal(await tab.locator('img').count(), 0);
    closesWell(tab);
});

test('the picture of the page is taken', { skip: process.env.VELKOR_PICTURE === undefined }, async (t) => {
    const bench = new Bench(t);
    const file = bench.file('service.properties', Object.entries({
        'cache.entries': '4096', 'cache.lifetime': '15min', 'database.host': 'db1.example.net', 'database.pool.least': '2',
        'database.pool.most': '16', 'feature.search.fuzzy': 'true', 'feature.search.limit': '50', 'http.address': '0.0.0.0',
        'http.names': 'shop.example.net', 'http.port': '8080', 'http.timeout': '30s', 'log.severity': 'warning',
        'mail.from': 'orders@example.net', 'mail.retries': '3', 'queue.length': '1000', 'queue.workers': '8',
    }).map(([key, value]) => `${key}=${value}\n`).join(''));
    const server = await bench.serve(['--allow-writes', '--state', bench.path('state.db'), '--set', 'log.severity=debug', file]);
    await server.set('http.port', 'int', 8181);
    await server.set('http.names', 'stringArray', ['shop.example.net', 'www.example.net']);
    const tab = await bench.open(server, { viewport: { width: 1200, height: 700 }, reducedMotion: 'reduce' });
    await openDetails(tab, 'http.port');
    await tab.locator('.history li').waitFor();
    await server.set('http.timeout', 'string', '45s');
    await server.set('http.port', 'int', 8443);
    await showsValue(tab, 'http.port', '8443');
    await tab.locator('.history li').nth(1).waitFor();
    await tab.screenshot({ path: process.env.VELKOR_PICTURE });
});
