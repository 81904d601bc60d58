// Runs velkor-config as a server for tests, and a browser in front of it.
import { spawn } from 'node:child_process';
import { mkdtempSync, readFileSync, rmSync, writeFileSync } from 'node:fs';
import { createRequire } from 'node:module';
import { after } from 'node:test';
import { tmpdir } from 'node:os';
import { join } from 'node:path';
import { createInterface } from 'node:readline';

const require = createRequire(join(process.env.VELKOR_NODE_FOLDER, '/'));
const { chromium } = require('playwright-core');
const axe = readFileSync(require.resolve('axe-core/axe.min.js'), 'utf8');

const browser = await chromium.launch({
    executablePath: process.env.VELKOR_BROWSER,
    args: ['--no-sandbox'],  // which root is not given
});
after(() => browser.close());

/// The program while it serves, on `port` or one that is free.
export class Server {
    #process;
    #ended;

    static start(args, port = 0) {
        return Server.run(process.env.VELKOR_CONFIG_PROGRAM,
            ['--listen', `127.0.0.1:${port}`, '--log', 'velkor::http=fatal,error', ...args]);
    }

    /// Runs `program`, which says where it listens.
    static async run(program, args) {
        const server = new Server();
        server.#process = spawn(program, args, { stdio: ['pipe', 'pipe', 'inherit'] });
        server.#ended = new Promise((resolve) => server.#process.once('exit', resolve));
        for await (const line of createInterface(server.#process.stdout)) {
            server.url = line.replace('Listening on ', '');
            server.port = Number(new URL(server.url).port);
            return server;
        }
        throw new Error('The program served nothing.');
    }

    async change(...changes) {
        const response = await fetch(`${this.url}config`, {
            method: 'PATCH',
            headers: { 'Content-Type': 'application/json' },
            body: JSON.stringify({ changes }),
        });
        if (!response.ok) throw new Error(await response.text());
    }

    set(key, type, value) {
        return this.change({ key, value: { type, value } });
    }

    stop() {
        this.#process.kill('SIGTERM');
        return this.#ended;
    }
}

/// What one test uses, released when it ends: files, servers, pages.
export class Bench {
    #folder = mkdtempSync(join(tmpdir(), 'velkor-'));
    #test;

    constructor(test) {
        this.#test = test;
        test.after(() => rmSync(this.#folder, { recursive: true }));
    }

    path(name) {
        return join(this.#folder, name);
    }

    file(name, content) {
        writeFileSync(this.path(name), content, { mode: 0o600 });
        return this.path(name);
    }

    async serve(args, port) {
        const server = await Server.start(args, port);
        this.#test.after(() => server.stop());
        return server;
    }

    /// A process that has declared settings.
    async serveDeclared() {
        const server = await Server.run(process.env.VELKOR_DECLARING_PROGRAM, []);
        this.#test.after(() => server.stop());
        return server;
    }

    /// A new page; nothing that it reports may be left when the test ends.
    async openTab(look = {}) {
        const context = await browser.newContext(look);
        context.setDefaultTimeout(120_000);  // of a busy machine
        this.#test.after(() => context.close());
        const tab = await context.newPage();
        tab.complaints = [];
        tab.on('pageerror', (problem) => tab.complaints.push(String(problem)));
        tab.on('console', (message) => {
            if (/Content Security Policy/i.test(message.text())) tab.complaints.push(message.text());
        });
        return tab;
    }

    /// The page of `server`, once it is live.
    async open(server, look) {
        const tab = await this.openTab(look);
        await tab.goto(server.url);
        await becomesLive(tab);
        return tab;
    }
}

export const becomesLive = (tab) => tab.locator('#connection[data-state="live"]').waitFor();

export const row = (tab, key) =>
    tab.getByRole('row').filter({ has: tab.getByRole('button', { name: key, exact: true }) });

/// Waits until the row of `key` shows `text`.
export const showsValue = (tab, key, text) =>
    row(tab, key).getByRole('gridcell').nth(1).getByText(text, { exact: true }).waitFor();

export const showsText = (tab, selector, text) =>
    tab.locator(selector).filter({ hasText: text }).waitFor();

/// What axe finds wrong with the page as it stands.
export async function flaws(tab) {
    // The policy of the page lets no script in but its own: this one comes by the debugger.
    const session = await tab.context().newCDPSession(tab);
    await session.send('Runtime.evaluate', { expression: axe });
    const found = await tab.evaluate(() => globalThis.axe.run());
    return found.violations.map(({ id, nodes }) => `${id}: ${nodes.map((node) => `${node.html} ${node.failureSummary}`).join('; ')}`);
}

/// Tells the seconds that scripts, and all tasks, have run in the page since.
export async function measureTasks(tab) {
    const session = await tab.context().newCDPSession(tab);
    await session.send('Performance.enable');
    const read = async (name) => {
        const { metrics } = await session.send('Performance.getMetrics');
        return metrics.find((metric) => metric.name === name).value;
    };
    const [scripts, everything] = [await read('ScriptDuration'), await read('TaskDuration')];
    return async () => ({
        scripts: await read('ScriptDuration') - scripts,
        everything: await read('TaskDuration') - everything,
    });
}
